#include "agent/hardware/InventoryBuilder.h"

#include <gtest/gtest.h>
#include <linux/ethtool.h>
#include <linux/if.h>
#include <linux/if_arp.h>

namespace Orv::Agent::Hardware {
namespace {

InterfaceFacts interface(int index, const std::string& name) {
    InterfaceFacts facts;
    facts.link.index = index;
    facts.link.name = name;
    facts.link.flags = IFF_UP | IFF_RUNNING;
    facts.link.hardwareType = ARPHRD_ETHER;
    return facts;
}

ParentDevice card(const std::string& syspath) {
    ParentDevice device;
    device.syspath = syspath;
    device.subsystem = "pci";
    return device;
}

NetworkPort port(const InterfaceFacts& facts) {
    const auto inventory = buildInventory({facts});
    EXPECT_EQ(inventory.ports.size(), 1U);
    return inventory.ports.at(0);
}

TEST(Inventory, PutsPortsOfOneDeviceOnOneCardThatIsNamedAfterTheFirst) {
    auto first = interface(2, "ens1f0");
    first.device = card("/sys/devices/a");
    auto second = interface(3, "ens2");
    second.device = card("/sys/devices/b");
    auto third = interface(4, "ens1f1");
    third.device = card("/sys/devices/a");
    const auto inventory = buildInventory({first, second, third});
    ASSERT_EQ(inventory.cards.size(), 2U);
    EXPECT_EQ(inventory.cards[0].name, "ens1f0");
    EXPECT_EQ(inventory.cards[1].name, "ens2");
    ASSERT_EQ(inventory.ports.size(), 3U);
    EXPECT_EQ(inventory.ports[0].card, "ens1f0");
    EXPECT_EQ(inventory.ports[1].card, "ens2");
    EXPECT_EQ(inventory.ports[2].card, "ens1f0");
}

TEST(Inventory, GivesAVirtualInterfaceAPortAndNoCard) {
    auto facts = interface(5, "br0");
    facts.link.kind = "bridge";
    const auto inventory = buildInventory({facts});
    EXPECT_TRUE(inventory.cards.empty());
    ASSERT_EQ(inventory.ports.size(), 1U);
    EXPECT_FALSE(inventory.ports[0].card);
    EXPECT_EQ(inventory.ports[0].caption, "bridge");
}

TEST(Inventory, LeavesOutTheLoopbackInterface) {
    auto loopback = interface(1, "lo");
    loopback.link.flags |= IFF_LOOPBACK;
    EXPECT_EQ(buildInventory({loopback}), HardwareInventory());
}

TEST(Inventory, DescribesACardByWhatIsKnown) {
    auto facts = interface(2, "eth0");
    facts.device = ParentDevice{"/sys/devices/pci0000:00/0000:03:00.0", "pci", "Maker", "Model", "42", "drv", false};
    const auto known = buildInventory({facts}).cards.at(0);
    EXPECT_EQ(known.elementName, "Maker Model");
    EXPECT_EQ(known.description, "Maker Model, pci 0000:03:00.0, driver drv");
    EXPECT_EQ(known.serialNumber, "42");
    EXPECT_EQ(known.packageType, 9);

    facts.device = ParentDevice{"/sys/devices/virtio3", "virtio", {}, {}, {}, {}, false};
    const auto unknown = buildInventory({facts}).cards.at(0);
    EXPECT_FALSE(unknown.elementName);
    EXPECT_EQ(unknown.description, "virtio virtio3");
    EXPECT_FALSE(unknown.serialNumber);
    EXPECT_FALSE(unknown.packageType);
}

TEST(Inventory, MarksTheManagementControllersCardAndPort) {
    auto facts = interface(2, "usb0");
    facts.device = card("/sys/devices/a");
    facts.device->managementController = true;
    const auto inventory = buildInventory({facts});
    EXPECT_TRUE(inventory.cards.at(0).managementController);
    EXPECT_TRUE(inventory.ports.at(0).managementController);
}

TEST(Inventory, StatusOfAPortFollowsItsFlags) {
    auto facts = interface(2, "eth0");
    EXPECT_EQ(port(facts).status, "OK");
    facts.link.flags = IFF_UP;
    EXPECT_EQ(port(facts).status, "Lost Comm");
    facts.link.flags = 0;
    EXPECT_EQ(port(facts).status, "Stopped");
    facts.link.flags = IFF_RUNNING; // an interface that is down counts as down whatever else it says
    EXPECT_EQ(port(facts).status, "Stopped");
}

TEST(Inventory, StatusOfACardIsTheBestOfItsPorts) {
    auto down = interface(2, "ens1f0");
    down.device = card("/sys/devices/a");
    down.link.flags = 0;
    auto lost = interface(3, "ens1f1");
    lost.device = card("/sys/devices/a");
    lost.link.flags = IFF_UP;
    EXPECT_EQ(buildInventory({down}).cards.at(0).status, "Stopped");
    EXPECT_EQ(buildInventory({down, lost}).cards.at(0).status, "Lost Comm");
    EXPECT_EQ(buildInventory({lost, down}).cards.at(0).status, "Lost Comm");
    lost.link.flags |= IFF_RUNNING;
    EXPECT_EQ(buildInventory({down, lost}).cards.at(0).status, "OK");
}

TEST(Inventory, SpeedsAreInBitsPerSecond) {
    auto facts = interface(2, "eth0");
    facts.settings.speed = 1000;
    facts.settings.fullDuplex = true;
    facts.settings.autonegotiation = true;
    facts.settings.port = PORT_TP;
    facts.settings.supported = {1U << ETHTOOL_LINK_MODE_1000baseT_Full_BIT | 1U << ETHTOOL_LINK_MODE_Autoneg_BIT |
                                    1U << ETHTOOL_LINK_MODE_10000baseT_Full_BIT,
                                0, 0, 1U << (121 - 96)}; // 1600000baseCR8: more than 32 bits can count
    const auto fast = port(facts);
    EXPECT_EQ(fast.speed, 1'000'000'000U);
    EXPECT_EQ(fast.maxSpeed, 1'600'000'000'000U);
    EXPECT_FALSE(fast.requestedSpeed);
    EXPECT_EQ(fast.fullDuplex, true);
    EXPECT_EQ(fast.autoSense, true);
    EXPECT_EQ(fast.portType, 53);
}

TEST(Inventory, RequestedSpeedIsTheFixedOne) {
    auto facts = interface(2, "eth0");
    facts.settings.speed = 100;
    facts.settings.autonegotiation = false;
    EXPECT_EQ(port(facts).requestedSpeed, 100'000'000U);
}

TEST(Inventory, LeavesOpenWhatNobodyKnows) {
    const auto unknown = port(interface(2, "eth0"));
    EXPECT_FALSE(unknown.speed);
    EXPECT_FALSE(unknown.maxSpeed);
    EXPECT_FALSE(unknown.requestedSpeed);
    EXPECT_FALSE(unknown.portType);
    EXPECT_FALSE(unknown.portNumber);
    EXPECT_FALSE(unknown.permanentAddress);
    EXPECT_FALSE(unknown.fullDuplex);
    EXPECT_FALSE(unknown.autoSense);
    EXPECT_FALSE(unknown.caption);
    EXPECT_FALSE(unknown.description);
}

TEST(Inventory, PermanentAddressIsTwelveUpperCaseDigits) {
    auto facts = interface(2, "eth0");
    facts.link.permanentAddress = {0x02, 0xfc, 0x00, 0xab, 0xcd, 0x0f};
    EXPECT_EQ(port(facts).permanentAddress, "02FC00ABCD0F");
    facts.link.permanentAddress.resize(20); // InfiniBand
    EXPECT_FALSE(port(facts).permanentAddress);
}

TEST(Inventory, LinkTechnologyIsThatOfTheHardwareType) {
    auto facts = interface(2, "eth0");
    EXPECT_EQ(port(facts).linkTechnology, 2);
    facts.wireless = true;
    EXPECT_EQ(port(facts).linkTechnology, 11);
    facts.link.hardwareType = ARPHRD_INFINIBAND;
    EXPECT_EQ(port(facts).linkTechnology, 3);
    facts.link.hardwareType = ARPHRD_TUNNEL;
    EXPECT_FALSE(port(facts).linkTechnology);
}

TEST(Inventory, CleansNamesAndPrefersTheAdministratorsDescription) {
    auto facts = interface(2, "eth\xff");
    facts.link.kind = "dummy";
    facts.link.alias = "rack\x1b 7";
    const auto cleaned = port(facts);
    EXPECT_EQ(cleaned.name, "eth\xef\xbf\xbd");
    EXPECT_EQ(cleaned.description, "rack  7");
    EXPECT_EQ(cleaned.caption, "dummy");
}

} // namespace
} // namespace Orv::Agent::Hardware
