#include "agent/file/TreeFile.h"

#include <gmock/gmock.h>
#include <gtest/gtest.h>

namespace {

using namespace Orv::NodeLexicon;
using Orv::Agent::HardwareInventory;
using Orv::Agent::NetworkCard;
using Orv::Agent::NetworkPort;
using Orv::Agent::parseTreeDescription;
using testing::ElementsAre;
using testing::Field;
using testing::IsEmpty;

HardwareInventory hardwareOf(const std::string& text) {
    return parseTreeDescription(text, "lab.toml").hardware;
}

TEST(DescribedHardware, HasEveryFactOfACard) {
    const auto hardware = hardwareOf(R"(
[[card]]
name = "eth0"
status = "Degraded"
element_name = "Fast card"
description = "Two ports"
serial_number = "A1"
package_type = 9
management_controller = true
)");
    EXPECT_THAT(hardware.cards,
                ElementsAre(NetworkCard{"eth0", "Degraded", "Fast card", "Two ports", "A1", std::uint16_t{9}, true}));
    EXPECT_THAT(hardware.ports, IsEmpty());
}

TEST(DescribedHardware, HasEveryFactOfAPort) {
    const auto hardware = hardwareOf(R"(
[[port]]
identity = "eth0"
card = "eth0"
chassis = "BMC"
status = "OK"
element_name = "eth0 of card"
caption = "caption"
description = "First port"
speed = 1000000000
max_speed = 10000000000
requested_speed = 100
port_type = 53
port_number = 1
permanent_address = "020000000001"
full_duplex = true
auto_sense = false
link_technology = 2
[[card]]
name = "eth0"
)");
    NetworkPort port;
    port.name = "eth0";
    port.card = "eth0";
    port.status = "OK";
    port.elementName = "eth0 of card";
    port.caption = "caption";
    port.description = "First port";
    port.speed = 1000000000;
    port.maxSpeed = 10000000000;
    port.requestedSpeed = 100;
    port.portType = std::uint16_t{53};
    port.portNumber = std::uint16_t{1};
    port.permanentAddress = "020000000001";
    port.fullDuplex = true;
    port.autoSense = false;
    port.linkTechnology = std::uint16_t{2};
    port.managementController = true;
    EXPECT_THAT(hardware.ports, ElementsAre(port));
}

TEST(DescribedHardware, LeavesOutWhatThePortLeavesOut) {
    NetworkPort port;
    port.name = "veth0";
    EXPECT_THAT(hardwareOf("[[port]]\nidentity = \"veth0\"\n").ports, ElementsAre(port));
}

TEST(DescribedHardware, HasPortsAsNodesBelowTheirDevice) {
    const auto tree =
        parseTreeDescription("[[adapter]]\nidentity = \"eth0\"\ndevice = \"Card\"\n[[port]]\nidentity = "
                             "\"port 1\"\nmac_address = \"02:00\"\ndevice = \"Card\"\n[[port]]\n",
                             "lab.toml")
            .tree;
    const auto& ports = tree->nodesOfType(NODE_NETWORK_PORT);
    ASSERT_EQ(ports.size(), 2U);
    EXPECT_EQ(ports[0]->properties, (Orv::Agent::PropertyMap{{PROP_NODE_STRING, std::string("port 1")},
                                                             {PROP_MAC_ADDRESS, std::string("02:00")}}));
    EXPECT_EQ(ports[0]->parentPath, tree->nodesOfType(NODE_NETWORK_ADAPTER)[0]->parentPath);
    EXPECT_THAT(ports[1]->properties, IsEmpty());
}

TEST(DescribedHardware, HasAPortWithoutIdentityInTheTreeOnly) {
    EXPECT_THAT(hardwareOf("[[port]]\n").ports, IsEmpty());
}

TEST(DescribedHardware, DerivesNothingBesideAPortOrACard) {
    const auto withPort = hardwareOf("[[adapter]]\nidentity = \"eth0\"\n[[port]]\nidentity = \"p\"\n");
    EXPECT_THAT(withPort.ports, ElementsAre(Field(&NetworkPort::name, "p")));
    EXPECT_THAT(withPort.cards, IsEmpty());
    const auto withCard = hardwareOf("[[adapter]]\nidentity = \"eth0\"\n[[card]]\nname = \"c\"\n");
    EXPECT_THAT(withCard.ports, IsEmpty());
    EXPECT_THAT(withCard.cards, ElementsAre(Field(&NetworkCard::name, "c")));
}

TEST(DerivedHardware, SaysOfAnAdapterWhatTheAdapterSays) {
    const auto hardware = hardwareOf("[[adapter]]\nidentity = \"eth0\"\ndescription = \"Uplink\"\ndevice = \"Card\"\n"
                                     "status = 5\nmac_address = \"02:00:5e:10:00:af\"\n");
    NetworkPort port;
    port.name = "eth0";
    port.card = "eth0";
    port.status = "Stopped";
    port.description = "Uplink";
    port.portNumber = std::uint16_t{0};
    port.permanentAddress = "02005E1000AF";
    EXPECT_THAT(hardware.ports, ElementsAre(port));
    NetworkCard card;
    card.name = "eth0";
    card.status = "Stopped";
    card.elementName = "Card";
    card.packageType = std::uint16_t{9};
    EXPECT_THAT(hardware.cards, ElementsAre(card));
}

TEST(DerivedHardware, KnowsNothingOfABareAdapter) {
    const auto hardware = hardwareOf("[[adapter]]\nidentity = \"eth0\"\n");
    EXPECT_EQ(hardware.ports.at(0).status, std::nullopt);
    EXPECT_EQ(hardware.ports.at(0).permanentAddress, std::nullopt);
    EXPECT_EQ(hardware.ports.at(0).speed, std::nullopt);
    EXPECT_EQ(hardware.ports.at(0).linkTechnology, std::nullopt);
    EXPECT_EQ(hardware.cards.at(0).elementName, std::nullopt);
}

TEST(DerivedHardware, TellsEachStatus) {
    const auto hardware =
        hardwareOf("[[adapter]]\nidentity = \"a\"\nstatus = 1\n[[adapter]]\nidentity = \"b\"\nstatus = 5\n"
                   "[[adapter]]\nidentity = \"c\"\nstatus = 12\n[[adapter]]\nidentity = \"d\"\nstatus = 65537\n");
    EXPECT_THAT(hardware.ports,
                ElementsAre(Field(&NetworkPort::status, "OK"), Field(&NetworkPort::status, "Stopped"),
                            Field(&NetworkPort::status, "Lost Comm"), Field(&NetworkPort::status, "Lost Comm")));
}

TEST(DerivedHardware, PutsAdaptersOfOneDeviceOnOneCard) {
    const auto hardware = hardwareOf("[[adapter]]\nidentity = \"eth1\"\ndevice = \"Card\"\n[[adapter]]\nidentity = "
                                     "\"eth0\"\n[[adapter]]\nidentity = \"eth2\"\ndevice = \"Card\"\n");
    EXPECT_THAT(hardware.cards, ElementsAre(Field(&NetworkCard::name, "eth1"), Field(&NetworkCard::name, "eth0")));
    EXPECT_THAT(hardware.ports, ElementsAre(Field(&NetworkPort::card, "eth1"), Field(&NetworkPort::card, "eth0"),
                                            Field(&NetworkPort::card, "eth1")));
    EXPECT_EQ(hardware.ports[2].portNumber, std::uint16_t{1});
}

TEST(DerivedHardware, MarksWhatTheManagementControllerCarries) {
    const auto hardware = hardwareOf("[[adapter]]\nidentity = \"usb0\"\nchassis = \"BMC\"\n[[adapter]]\nidentity = "
                                     "\"eth0\"\n[[adapter]]\nidentity = \"x\"\nchassis = \"bmc\"\n");
    EXPECT_THAT(hardware.cards, ElementsAre(Field(&NetworkCard::managementController, true),
                                            Field(&NetworkCard::managementController, false),
                                            Field(&NetworkCard::managementController, false)));
    EXPECT_EQ(hardware.cards[0].name, "usb0");
    EXPECT_TRUE(hardware.ports[0].managementController);
    EXPECT_FALSE(hardware.ports[1].managementController);
}

TEST(DerivedHardware, HasNoPortForAnAdapterWithoutIdentityAndOneForTwoOfOneIdentity) {
    const auto hardware = hardwareOf("[[adapter]]\n[[adapter]]\nidentity = \"eth0\"\nstatus = 1\n[[adapter]]\n"
                                     "identity = \"eth0\"\nstatus = 5\n");
    EXPECT_THAT(hardware.ports, ElementsAre(Field(&NetworkPort::status, "OK")));
    EXPECT_EQ(hardware.cards.size(), 1U);
}

TEST(DerivedHardware, TakesNoPermanentAddressFromAnythingButSixOctets) {
    const auto hardware =
        hardwareOf("[[adapter]]\nidentity = \"a\"\nmac_address = \"02:00\"\n[[adapter]]\nidentity = "
                   "\"b\"\nmac_address = \"02:00:00:00:00:0g\"\n");
    EXPECT_EQ(hardware.ports.at(0).permanentAddress, std::nullopt);
    EXPECT_EQ(hardware.ports.at(1).permanentAddress, std::nullopt);
}

TEST(DerivedHardware, GivesEveryAdapterAPortNodeBelowItsDevice) {
    const auto tree =
        parseTreeDescription("[[adapter]]\nidentity = \"eth0\"\nmac_address = \"02:01\"\n[[adapter]]\n", "lab.toml")
            .tree;
    const auto& ports = tree->nodesOfType(NODE_NETWORK_PORT);
    const auto& adapters = tree->nodesOfType(NODE_NETWORK_ADAPTER);
    ASSERT_EQ(ports.size(), 2U);
    EXPECT_EQ(ports[0]->parentPath, adapters[0]->parentPath);
    EXPECT_EQ(ports[1]->parentPath, adapters[1]->parentPath);
    EXPECT_EQ(ports[0]->properties, (Orv::Agent::PropertyMap{{PROP_NODE_STRING, std::string("eth0")},
                                                             {PROP_MAC_ADDRESS, std::string("02:01")}}));
}

} // namespace
