#include "tests/provider/InventoryRun.h"
#include "tests/provider/Tree.h"

#include <stdexcept>

#include <gmock/gmock.h>
#include <gtest/gtest.h>

namespace {

using namespace Orv::NodeLexicon;
using Orv::NetworkAdapterComposite::getNetworkAdapterConfigurationInstances;
using Orv::NetworkAdapterComposite::NetworkAdapterConfiguration;
using Orv::NetworkAdapterComposite::NetworkAdapterConfigurationMap;
using provider_test::addAdapter;
using provider_test::addBareAdapter;
using provider_test::addFullAdapter;
using provider_test::InventoryRun;
using provider_test::line;
using provider_test::normalised;
using scripted_agent::failAt;
using scripted_agent::recorded;
using scripted_agent::script;
using testing::ElementsAre;
using testing::IsEmpty;

const std::string LOGGER = "Hearth.NetworkAdapterProvider";
const std::string UNIT = "NetworkAdapterConfiguration";

std::vector<std::string> keys(const NetworkAdapterConfigurationMap& map) {
    std::vector<std::string> found;
    for (const auto& [key, record] : map) {
        found.push_back(key);
    }
    return found;
}

class Inventory : public InventoryRun, public testing::Test {};

TEST_F(Inventory, ReadsEveryPropertyInItsOrder) {
    addFullAdapter("eth0");
    EXPECT_EQ(run(), 0);
    std::vector<std::string> calls = recorded("");
    std::erase_if(calls, [](const std::string& call) { return call.find("cursor") == std::string::npos; });
    EXPECT_THAT(
        calls,
        ElementsAre("cursor 1: Instrumentation()", "cursor 1: selectNode(NODE_NETWORK_ADAPTER)",
                    "cursor 1: bool = true", "cursor 1: bool = true", "cursor 1: getProperty(PROP_STATUS) = 1",
                    "cursor 1: getProperty(PROP_NODE_STRING) = \"eth0\"", "cursor 2: Instrumentation()",
                    "cursor 1: getPathToParentNode() = \"d0\"", "cursor 2: selectNode(\"d0\")",
                    "cursor 2: getPathToParentNode() = \"g0\"", "cursor 2: selectNode(\"g0\")",
                    "cursor 2: getNodeDescription() = \"Chassis\"", "cursor 2: ~Instrumentation()",
                    "cursor 1: getNodeDescription() = \"Some adapter\"",
                    "cursor 1: getProperty(PROP_DEFAULT_GATEWAY) = \"192.0.2.1\"",
                    "cursor 1: getProperty(PROP_DNS_SERVERS) = [\"192.0.2.53\", \"192.0.2.54\"]",
                    "cursor 1: getProperty(PROP_IPV4_ADDRESS) = \"192.0.2.10\"",
                    "cursor 1: getProperty(PROP_IPV6_ADDRESS) = \"2001:db8::10\"",
                    "cursor 1: getProperty(PROP_IPV4_SUBNET_MASK) = \"255.255.255.0\"",
                    "cursor 1: getProperty(PROP_IP_SUPPORT) = 3", "cursor 1: getProperty(PROP_DHCP_ENABLED) = 3",
                    "cursor 1: getProperty(PROP_STATUS) = 1", "cursor 1: getProperty(PROP_DNS_HOSTNAME) = \"host\"",
                    "cursor 1: getProperty(PROP_DNS_DOMAIN) = \"example.org\"",
                    "cursor 1: getProperty(PROP_DNS_SUFFIXES) = [\"example.org\", \"example.net\"]",
                    "cursor 1: getProperty(PROP_MAC_ADDRESS) = \"00:00:5e:00:53:01\"", "cursor 1: ++",
                    "cursor 1: bool = false", "cursor 1: ~Instrumentation()"));
}

TEST_F(Inventory, FillsTheWholeRecord) {
    addFullAdapter("eth0");
    EXPECT_EQ(run(), 0);
    ASSERT_THAT(keys(map), ElementsAre("eth0"));
    const NetworkAdapterConfiguration& record = map["eth0"];
    EXPECT_EQ(record.getSettingID(), "eth0");
    EXPECT_EQ(record.getStatus(), "OK");
    EXPECT_EQ(record.getDescription(), "Ethernet");
    EXPECT_THAT(record.getDefaultIPGateway(), ElementsAre("192.0.2.1"));
    EXPECT_THAT(record.getDnsServerSearchOrder(), ElementsAre("192.0.2.53", "192.0.2.54"));
    EXPECT_EQ(record.getIPv4Address(), "192.0.2.10");
    EXPECT_EQ(record.getIPv6Address(), "2001:db8::10");
    EXPECT_EQ(record.getIPv4SubnetMask(), "255.255.255.0");
    EXPECT_FALSE(record.getDHCPEnabled());
    EXPECT_TRUE(record.getIPEnabled());
    EXPECT_EQ(record.getDNSHostname(), "host");
    EXPECT_EQ(record.getDNSDomainName(), "example.org");
    EXPECT_THAT(record.getDNSSuffixesToAppend(), ElementsAre("example.org", "example.net"));
    EXPECT_EQ(record.getMACAddress(), "00:00:5e:00:53:01");
}

TEST_F(Inventory, LogsTheGrandparentAndTheIPv6AddressOnly) {
    addFullAdapter("eth0");
    run();
    const std::string function = "getNetworkAdapterConfigurationInstances";
    const std::string nodeString =
        "VARIABLE: 'nodeString' has Value 'Chassis' at line N in NetworkAdapterConfiguration";
    const std::string address =
        "VARIABLE: 'string' has Value '2001:db8::10' at line N in NetworkAdapterConfiguration";
    for (const char* sink : {"log", "trace"}) {
        EXPECT_THAT(normalised(recorded(sink)), ElementsAre(line(sink, 4000, LOGGER, UNIT, function, nodeString),
                                                            line(sink, 4000, LOGGER, UNIT, function, address)));
    }
}

TEST_F(Inventory, TreeWithoutAdaptersIsReportedAsSuchAndNothingIsReadOrLogged) {
    script().nodes.push_back({.type = NODE_NETWORK_PORT, .path = "p"});
    EXPECT_EQ(run(), 1);
    EXPECT_THAT(scripted_agent::record(),
                ElementsAre("cursor 1: Instrumentation()", "cursor 1: selectNode(NODE_NETWORK_ADAPTER)",
                            "cursor 1: bool = false", "cursor 1: ~Instrumentation()"));
    EXPECT_THAT(map, IsEmpty());
    EXPECT_EQ(errors, "");
}

TEST_F(Inventory, ManagementControllersAdapterIsLeftOut) {
    addFullAdapter("usb0", "BMC");
    addFullAdapter("eth0", "Chassis");
    EXPECT_EQ(run(), 0);
    EXPECT_THAT(keys(map), ElementsAre("eth0"));
}

TEST_F(Inventory, GrandparentThatDiffersFromBMCInCaseOrLengthIsKept) {
    addAdapter("a", "bmc");
    addAdapter("b", "Bmc");
    addAdapter("c", "BMC ");
    addAdapter("d", "BMC2");
    addAdapter("e", "");
    EXPECT_EQ(run(), 0);
    EXPECT_THAT(keys(map), ElementsAre("a", "b", "c", "d", "e"));
}

TEST_F(Inventory, OnlyFilteredNodesMakeAnEmptyMapASuccess) {
    addFullAdapter("usb0", "BMC");
    EXPECT_EQ(run(), 0);
    EXPECT_THAT(map, IsEmpty());
    EXPECT_THAT(recorded("cursor 1: getNodeDescription"), IsEmpty());
}

TEST_F(Inventory, AdapterWithoutIdentityStandsUnderTheEmptyKeyEvenUnderTheBMC) {
    addBareAdapter("BMC").texts[PROP_IPV4_ADDRESS] = "192.0.2.7";
    EXPECT_EQ(run(), 0);
    ASSERT_THAT(keys(map), ElementsAre(""));
    EXPECT_EQ(map[""].getSettingID(), "");
    EXPECT_EQ(map[""].getIPv4Address(), "192.0.2.7");
    EXPECT_EQ(map[""].getDescription(), "Ethernet");
    EXPECT_THAT(recorded("cursor 2"), IsEmpty());
    EXPECT_THAT(recorded("cursor 1: getPathToParentNode"), IsEmpty());
}

TEST_F(Inventory, KeysAreInByteOrder) {
    for (const char* identity : {"eth2", "eth10", "eth1", "eth0"}) {
        addAdapter(identity);
    }
    EXPECT_EQ(run(), 0);
    EXPECT_THAT(keys(map), ElementsAre("eth0", "eth1", "eth10", "eth2"));
}

TEST_F(Inventory, KeyIsTheIdentityAsReadAndTheSettingIDIsWithoutSpaces) {
    addAdapter(" eth 0 ");
    EXPECT_EQ(run(), 0);
    ASSERT_THAT(keys(map), ElementsAre(" eth 0 "));
    EXPECT_EQ(map[" eth 0 "].getSettingID(), "eth0");
}

TEST_F(Inventory, LaterNodeOfTheSameIdentityReplacesTheWholeRecord) {
    addFullAdapter("eth0");
    addAdapter("eth0").texts[PROP_IPV4_ADDRESS] = "198.51.100.1";
    EXPECT_EQ(run(), 0);
    ASSERT_EQ(map.size(), 1U);
    EXPECT_EQ(map["eth0"].getIPv4Address(), "198.51.100.1");
    EXPECT_EQ(map["eth0"].getMACAddress(), "");
    EXPECT_THAT(map["eth0"].getDnsServerSearchOrder(), IsEmpty());
}

TEST_F(Inventory, NothingOfOneNodeSurvivesIntoTheNext) {
    addFullAdapter("eth0");
    addAdapter("eth1");
    EXPECT_EQ(run(), 0);
    const NetworkAdapterConfiguration& bare = map["eth1"];
    EXPECT_EQ(bare.getStatus(), "");
    EXPECT_EQ(bare.getIPv4Address(), "");
    EXPECT_EQ(bare.getIPv6Address(), "");
    EXPECT_EQ(bare.getIPv4SubnetMask(), "");
    EXPECT_EQ(bare.getDNSHostname(), "");
    EXPECT_EQ(bare.getDNSDomainName(), "");
    EXPECT_EQ(bare.getMACAddress(), "");
    EXPECT_THAT(bare.getDefaultIPGateway(), IsEmpty());
    EXPECT_THAT(bare.getDnsServerSearchOrder(), IsEmpty());
    EXPECT_THAT(bare.getDNSSuffixesToAppend(), IsEmpty());
    EXPECT_FALSE(bare.getIPEnabled());
    EXPECT_FALSE(bare.getDHCPEnabled());
}

TEST_F(Inventory, NothingIsEverRemovedFromTheMap) {
    map["old"].setIPv4Address("192.0.2.99");
    addAdapter("eth0");
    EXPECT_EQ(run(), 0);
    EXPECT_THAT(keys(map), ElementsAre("eth0", "old"));
    EXPECT_EQ(map["old"].getIPv4Address(), "192.0.2.99");
}

TEST_F(Inventory, StatusFiveIsStoppedAndStatusOneIsOK) {
    addAdapter("down").numbers[PROP_STATUS] = 5;
    addAdapter("up").numbers[PROP_STATUS] = 1;
    run();
    EXPECT_EQ(map["down"].getStatus(), "Stopped");
    EXPECT_FALSE(map["down"].getIPEnabled());
    EXPECT_EQ(map["up"].getStatus(), "OK");
    EXPECT_TRUE(map["up"].getIPEnabled());
}

TEST_F(Inventory, AdapterWithoutStatusHasNoStatusTextAndIsNotEnabled) {
    addAdapter("eth0");
    run();
    EXPECT_EQ(map["eth0"].getStatus(), "");
    EXPECT_FALSE(map["eth0"].getIPEnabled());
}

TEST_F(Inventory, Status65537IsEnabledByItsLowBitsAndLostByItsText) {
    addAdapter("eth0").numbers[PROP_STATUS] = 65537;
    run();
    EXPECT_TRUE(map["eth0"].getIPEnabled());
    EXPECT_EQ(map["eth0"].getStatus(), "LostComm");
}

TEST_F(Inventory, DhcpIsEnabledForModeOneOnly) {
    addAdapter("dhcp").numbers[PROP_DHCP_ENABLED] = 1;
    addAdapter("static").numbers[PROP_DHCP_ENABLED] = 3;
    addAdapter("other").numbers[PROP_DHCP_ENABLED] = 2;
    addAdapter("none").numbers[PROP_DHCP_ENABLED] = 0;
    addAdapter("wide").numbers[PROP_DHCP_ENABLED] = 65537;
    run();
    EXPECT_TRUE(map["dhcp"].getDHCPEnabled());
    EXPECT_FALSE(map["static"].getDHCPEnabled());
    EXPECT_FALSE(map["other"].getDHCPEnabled());
    EXPECT_FALSE(map["none"].getDHCPEnabled());
    EXPECT_TRUE(map["wide"].getDHCPEnabled());
}

TEST_F(Inventory, GatewayIsAListOfExactlyOne) {
    addAdapter("eth0").texts[PROP_DEFAULT_GATEWAY] = "192.0.2.1";
    run();
    EXPECT_THAT(map["eth0"].getDefaultIPGateway(), ElementsAre("192.0.2.1"));
}

TEST_F(Inventory, IdentityOfSpacesOnlyEndsTheScanButKeepsEarlierNodes) {
    addAdapter("eth0");
    addAdapter("  ");
    addAdapter("eth2");
    EXPECT_EQ(run(), 1);
    EXPECT_EQ(errors, "Failed while setting SettingID.\n");
    EXPECT_THAT(keys(map), ElementsAre("eth0"));
}

TEST_F(Inventory, StatusThatTheAgentStripsToNothingEndsTheScan) {
    addAdapter("eth0").numbers[PROP_STATUS] = 1;
    script().stripSpaces = [](const std::string& text) { return text == "OK" ? std::string() : text; };
    EXPECT_EQ(run(), 1);
    EXPECT_EQ(errors, "Failed while setting Status.\n");
    EXPECT_THAT(map, IsEmpty());
    EXPECT_THAT(recorded("log"), IsEmpty());
}

TEST_F(Inventory, FilteredNodeIsStillCheckedForItsIdentity) {
    addAdapter(" ", "BMC");
    EXPECT_EQ(run(), 1);
    EXPECT_EQ(errors, "Failed while setting SettingID.\n");
}

/** Every operation of the agent that the scan of two nodes calls. */
class InventoryWithFailingAgent : public Inventory, public testing::WithParamInterface<const char*> {};

TEST_P(InventoryWithFailingAgent, ReturnsOneAndPrintsTheReasonWithoutLoggingIt) {
    addFullAdapter("eth0");
    addFullAdapter("eth1");
    failAt(GetParam(), 1, [] { throw std::runtime_error("the agent is gone"); });
    EXPECT_EQ(run(), 1);
    EXPECT_EQ(errors, "the agent is gone\n");
    for (const std::string& call : recorded("log")) {
        EXPECT_THAT(call, testing::Not(testing::HasSubstr("the agent is gone")));
    }
}

TEST_P(InventoryWithFailingAgent, ReleasesEveryCursor) {
    addFullAdapter("eth0");
    failAt(GetParam(), 1, [] { throw std::runtime_error("the agent is gone"); });
    run();
    EXPECT_EQ(recorded("cursor 1: Instrumentation").size(), recorded("cursor 1: ~Instrumentation").size());
    EXPECT_EQ(recorded("cursor 2: Instrumentation").size(), recorded("cursor 2: ~Instrumentation").size());
}

TEST_P(InventoryWithFailingAgent, WhatIsNoStandardExceptionPassesThrough) {
    addFullAdapter("eth0");
    failAt(GetParam(), 1, [] { throw 42; }); // NOLINT(misc-throw-by-value-catch-by-reference)
    EXPECT_THROW(getNetworkAdapterConfigurationInstances(map), int);
}

INSTANTIATE_TEST_SUITE_P(EveryCall, InventoryWithFailingAgent,
                         testing::Values("Instrumentation()", "selectNode(NODE_NETWORK_ADAPTER)", "bool",
                                         "getProperty(PROP_STATUS)", "getProperty(PROP_NODE_STRING)", "stripSpaces",
                                         "getPathToParentNode()", "selectNode(\"d0\")", "selectNode(\"g0\")",
                                         "getNodeDescription()", "getProperty(PROP_DEFAULT_GATEWAY)",
                                         "getProperty(PROP_DNS_SERVERS)", "getProperty(PROP_IPV4_ADDRESS)",
                                         "getProperty(PROP_IPV6_ADDRESS)", "getProperty(PROP_IPV4_SUBNET_MASK)",
                                         "getProperty(PROP_IP_SUPPORT)", "getProperty(PROP_DHCP_ENABLED)",
                                         "getProperty(PROP_DNS_HOSTNAME)", "getProperty(PROP_DNS_DOMAIN)",
                                         "getProperty(PROP_DNS_SUFFIXES)", "getProperty(PROP_MAC_ADDRESS)", "++"));

TEST_F(Inventory, ExceptionAtTheSecondNodeKeepsTheFirst) {
    addFullAdapter("eth0");
    addFullAdapter("eth1");
    addFullAdapter("eth2");
    failAt("getProperty(PROP_MAC_ADDRESS)", 2, [] { throw std::runtime_error("gone"); });
    EXPECT_EQ(run(), 1);
    EXPECT_THAT(keys(map), ElementsAre("eth0"));
    EXPECT_EQ(recorded("cursor 1: ++").size(), 1U);
}

TEST_F(Inventory, SecondReadingOfTheStatusFailsLikeTheFirst) {
    addFullAdapter("eth0");
    failAt("getProperty(PROP_STATUS)", 2, [] { throw std::runtime_error("gone"); });
    EXPECT_EQ(run(), 1);
    EXPECT_THAT(map, IsEmpty());
}

} // namespace
