/** The record's five changes: what they write to the tree, what they keep, and what they log under which number. */
#include "configuration/NetworkAdapterConfiguration.h"
#include "tests/provider/Tree.h"

#include <functional>
#include <ostream>
#include <stdexcept>

#include <gmock/gmock.h>
#include <gtest/gtest.h>

namespace {

using namespace Orv::NodeLexicon;
using Orv::NetworkAdapterComposite::NetworkAdapterConfiguration;
using provider_test::addAdapter;
using provider_test::addBareAdapter;
using provider_test::flow;
using provider_test::linesOf;
using scripted_agent::failAt;
using scripted_agent::recorded;
using scripted_agent::script;
using testing::ElementsAre;
using testing::IsEmpty;
using Texts = std::vector<std::string>;

std::string logLine(int level, const std::string& function, int position, const std::string& text) {
    return "log " + std::to_string(level) +
           " Hearth.NetworkAdapterProvider NetworkAdapterConfiguration:" + std::to_string(position) + " " + function +
           " | " + text;
}

std::string entering(const std::string& function, int position) {
    return logLine(4000, function, position,
                   "ENTERING: " + function + "() in NetworkAdapterConfiguration [Line: " + std::to_string(position) +
                       "]");
}

std::string exiting(const std::string& function, int position) {
    return logLine(4000, function, position,
                   "EXITING: " + function + "() in NetworkAdapterConfiguration [Line: " + std::to_string(position) +
                       "]");
}

std::string variable(const std::string& function, int position, const std::string& name, const std::string& value) {
    return logLine(4000, function, position,
                   "VARIABLE: '" + name + "' has Value '" + value + "' at line " + std::to_string(position) +
                       " in NetworkAdapterConfiguration");
}

std::string message(int level, const std::string& function, int position, const std::string& text) {
    return logLine(level, function, position,
                   "MESSAGE [File: NetworkAdapterConfiguration, Line: " + std::to_string(position) + "]: " + text);
}

/** All fourteen fields. */
auto fields(const NetworkAdapterConfiguration& record) {
    return std::make_tuple(record.getSettingID(), record.getIPv4Address(), record.getIPv6Address(),
                           record.getIPv4SubnetMask(), record.getDNSHostname(), record.getDNSDomainName(),
                           record.getDescription(), record.getMACAddress(), record.getStatus(),
                           record.getDefaultIPGateway(), record.getDnsServerSearchOrder(),
                           record.getDNSSuffixesToAppend(), record.getIPEnabled(), record.getDHCPEnabled());
}

class Changes : public testing::Test {
  protected:
    Changes() {
        scripted_agent::reset();
        record.setSettingID("eth1");
        record.setIPv4Address("192.0.2.10");
        record.setIPv4SubnetMask("255.255.255.0");
        record.setDefaultIPGateway("192.0.2.1");
        record.setDNSDomainName("example.org");
        record.setDnsServerSearchOrder({"192.0.2.53"});
        record.setDNSSuffixesToAppend({"example.org"});
    }

    ~Changes() override { EXPECT_EQ(linesOf("trace"), linesOf("log")) << "each line goes to both"; }

    NetworkAdapterConfiguration record;
};

TEST_F(Changes, DHCPWritesTheModeToTheFirstAdapterOfTheIdentityAndLogsNothing) {
    addAdapter("eth0");
    addAdapter("eth1");
    addAdapter("eth1");
    EXPECT_EQ(record.executeDHCPChanges("eth1"), 0);
    EXPECT_TRUE(record.getDHCPEnabled());
    EXPECT_THAT(flow(), ElementsAre("cursor 1: Instrumentation()", "cursor 1: selectNode(NODE_NETWORK_ADAPTER)",
                                    "cursor 1: bool = true", "cursor 1: getProperty(PROP_NODE_STRING) = \"eth0\"",
                                    "cursor 1: ++", "cursor 1: bool = true",
                                    "cursor 1: getProperty(PROP_NODE_STRING) = \"eth1\"",
                                    "cursor 1: setProperty(PROP_DHCP_ENABLED, 1)", "cursor 1: ~Instrumentation()"));
}

TEST_F(Changes, StaticWritesModeThenAddressThenMask) {
    addAdapter("eth1");
    record.setDHCPEnabled(1);
    EXPECT_EQ(record.executeStaticChanges("eth1", "192.0.2.20", "255.255.255.128"), 0);
    EXPECT_FALSE(record.getDHCPEnabled());
    EXPECT_EQ(record.getIPv4Address(), "192.0.2.20");
    EXPECT_EQ(record.getIPv4SubnetMask(), "255.255.255.128");
    EXPECT_THAT(flow(), ElementsAre("cursor 1: Instrumentation()", "cursor 1: selectNode(NODE_NETWORK_ADAPTER)",
                                    "cursor 1: bool = true", "cursor 1: getProperty(PROP_NODE_STRING) = \"eth1\"",
                                    "cursor 1: setProperty(PROP_DHCP_ENABLED, 3)",
                                    "cursor 1: setProperty(PROP_IPV4_ADDRESS, \"192.0.2.20\")",
                                    "cursor 1: setProperty(PROP_IPV4_SUBNET_MASK, \"255.255.255.128\")",
                                    "cursor 1: ~Instrumentation()"));
}

TEST_F(Changes, StaticWithoutAddressAndMaskStillSwitchesTheMode) {
    addAdapter("eth1");
    record.setDHCPEnabled(1);
    EXPECT_EQ(record.executeStaticChanges("eth1", "", ""), 0);
    EXPECT_FALSE(record.getDHCPEnabled());
    EXPECT_EQ(record.getIPv4Address(), "192.0.2.10");
    EXPECT_EQ(record.getIPv4SubnetMask(), "255.255.255.0");
    EXPECT_THAT(recorded("cursor 1: setProperty"), ElementsAre("cursor 1: setProperty(PROP_DHCP_ENABLED, 3)"));
}

TEST_F(Changes, StaticWritesWhichOfAddressAndMaskIsGiven) {
    addAdapter("eth1");
    EXPECT_EQ(record.executeStaticChanges("eth1", "", "255.0.0.0"), 0);
    EXPECT_EQ(record.getIPv4Address(), "192.0.2.10");
    EXPECT_EQ(record.getIPv4SubnetMask(), "255.0.0.0");
    EXPECT_EQ(record.executeStaticChanges("eth1", "192.0.2.30", ""), 0);
    EXPECT_EQ(record.getIPv4Address(), "192.0.2.30");
    EXPECT_EQ(record.getIPv4SubnetMask(), "255.0.0.0");
    EXPECT_THAT(recorded("cursor 1: setProperty"), ElementsAre("cursor 1: setProperty(PROP_DHCP_ENABLED, 3)",
                                                               "cursor 1: setProperty(PROP_IPV4_SUBNET_MASK, "
                                                               "\"255.0.0.0\")"));
    EXPECT_THAT(recorded("cursor 2: setProperty"),
                ElementsAre("cursor 2: setProperty(PROP_DHCP_ENABLED, 3)", "cursor 2: setProperty(PROP_IPV4_ADDRESS, "
                                                                           "\"192.0.2.30\")"));
}

TEST_F(Changes, GatewayReplacesTheRecordsListAndIsLoggedUnderItsNumbers) {
    addAdapter("eth1");
    record.setDefaultIPGateway("192.0.2.2");
    EXPECT_EQ(record.executeGatewayChanges("eth1", "192.0.2.3"), 0);
    EXPECT_THAT(record.getDefaultIPGateway(), ElementsAre("192.0.2.3"));
    const std::string function = "executeGatewayChanges";
    EXPECT_THAT(flow(), ElementsAre(entering(function, 749), "cursor 1: Instrumentation()",
                                    "cursor 1: selectNode(NODE_NETWORK_ADAPTER)", "cursor 1: bool = true",
                                    "cursor 1: getProperty(PROP_NODE_STRING) = \"eth1\"",
                                    "cursor 1: setProperty(PROP_DEFAULT_GATEWAY, \"192.0.2.3\")",
                                    "cursor 1: ~Instrumentation()", exiting(function, 782)));
}

TEST_F(Changes, EmptyGatewayWritesNothingAndLeavesTheListAlone) {
    addAdapter("eth1");
    EXPECT_EQ(record.executeGatewayChanges("eth1", ""), 0);
    EXPECT_THAT(record.getDefaultIPGateway(), ElementsAre("192.0.2.1"));
    EXPECT_THAT(recorded("cursor 1: setProperty"), IsEmpty());
}

TEST_F(Changes, DomainIsLoggedForEveryAdapterThatHasAnIdentityOnTheWay) {
    addBareAdapter();
    addAdapter("eth0");
    addAdapter("eth1");
    addAdapter("eth2");
    EXPECT_EQ(record.executeDNSDomainChanges("eth1", "example.net"), 0);
    EXPECT_EQ(record.getDNSDomainName(), "example.net");
    const std::string function = "executeDNSDomainChanges";
    EXPECT_THAT(
        flow(),
        ElementsAre(entering(function, 661), "cursor 1: Instrumentation()",
                    "cursor 1: selectNode(NODE_NETWORK_ADAPTER)", "cursor 1: bool = true",
                    "cursor 1: getProperty(PROP_NODE_STRING) = absent", "cursor 1: ++", "cursor 1: bool = true",
                    "cursor 1: getProperty(PROP_NODE_STRING) = \"eth0\"", variable(function, 674, "name", "eth0"),
                    variable(function, 675, "SettingId", "eth1"), "cursor 1: ++", "cursor 1: bool = true",
                    "cursor 1: getProperty(PROP_NODE_STRING) = \"eth1\"", variable(function, 674, "name", "eth1"),
                    variable(function, 675, "SettingId", "eth1"), variable(function, 678, "dnsDomain", "example.net"),
                    message(4000, function, 682, "Calling SetProperty"),
                    "cursor 1: setProperty(PROP_DNS_DOMAIN, \"example.net\")", "cursor 1: ~Instrumentation()",
                    exiting(function, 698)));
}

TEST_F(Changes, EmptyDomainIsLoggedAndNotWritten) {
    addAdapter("eth1");
    EXPECT_EQ(record.executeDNSDomainChanges("eth1", ""), 0);
    EXPECT_EQ(record.getDNSDomainName(), "example.org");
    const std::string function = "executeDNSDomainChanges";
    EXPECT_THAT(recorded("log"), ElementsAre(entering(function, 661), variable(function, 674, "name", "eth1"),
                                             variable(function, 675, "SettingId", "eth1"),
                                             variable(function, 678, "dnsDomain", ""), exiting(function, 698)));
    EXPECT_THAT(recorded("cursor 1: setProperty"), IsEmpty());
}

TEST_F(Changes, ListsGoToTheFirstAdapterThatIsNotTheManagementControllersWhateverTheRecord) {
    addAdapter("usb0", "BMC");
    addAdapter("eth0", "bmc"); // another name: the case counts
    addAdapter("eth1");
    EXPECT_EQ(record.executeDNSChanges({"192.0.2.54", "192.0.2.55"}, {"example.net"}), 0);
    const std::string function = "executeDNSChanges";
    EXPECT_THAT(flow(), ElementsAre(entering(function, 704), "cursor 1: Instrumentation()",
                                    "cursor 1: selectNode(NODE_NETWORK_ADAPTER)", "cursor 1: bool = true",
                                    "cursor 2: Instrumentation()", "cursor 1: getPathToParentNode() = \"d0\"",
                                    "cursor 2: selectNode(\"d0\")", "cursor 2: getPathToParentNode() = \"g0\"",
                                    "cursor 2: selectNode(\"g0\")", "cursor 2: getNodeDescription() = \"BMC\"",
                                    "cursor 2: ~Instrumentation()", variable(function, 719, "nodeString", "BMC"),
                                    "cursor 1: ++", "cursor 1: bool = true", "cursor 3: Instrumentation()",
                                    "cursor 1: getPathToParentNode() = \"d3\"", "cursor 3: selectNode(\"d3\")",
                                    "cursor 3: getPathToParentNode() = \"g3\"", "cursor 3: selectNode(\"g3\")",
                                    "cursor 3: getNodeDescription() = \"bmc\"", "cursor 3: ~Instrumentation()",
                                    variable(function, 719, "nodeString", "bmc"),
                                    "cursor 1: setProperty(PROP_DNS_SERVERS, [\"192.0.2.54\", \"192.0.2.55\"])",
                                    "cursor 1: setProperty(PROP_DNS_SUFFIXES, [\"example.net\"])",
                                    "cursor 1: ~Instrumentation()", exiting(function, 743)));
}

TEST_F(Changes, ListsAreAppendedToTheRecords) {
    addAdapter("eth0");
    EXPECT_EQ(record.executeDNSChanges({"192.0.2.54"}, {"example.net"}), 0);
    EXPECT_THAT(record.getDnsServerSearchOrder(), ElementsAre("192.0.2.53", "192.0.2.54"));
    EXPECT_THAT(record.getDNSSuffixesToAppend(), ElementsAre("example.org", "example.net"));
}

TEST_F(Changes, OnlyTheListThatIsNotEmptyIsWritten) {
    addAdapter("eth0");
    EXPECT_EQ(record.executeDNSChanges({"192.0.2.54"}, {}), 0);
    EXPECT_EQ(record.executeDNSChanges({}, {"example.net"}), 0);
    EXPECT_EQ(record.executeDNSChanges({}, {}), 0);
    std::vector<std::string> writes = recorded("cursor");
    std::erase_if(writes, [](const std::string& call) { return call.find("setProperty") == std::string::npos; });
    EXPECT_THAT(writes, ElementsAre("cursor 1: setProperty(PROP_DNS_SERVERS, [\"192.0.2.54\"])",
                                    "cursor 3: setProperty(PROP_DNS_SUFFIXES, [\"example.net\"])"));
}

TEST_F(Changes, ListsOfAHostWhoseAdaptersAreAllTheManagementControllersGoNowhere) {
    addAdapter("usb0", "BMC");
    const auto before = fields(record);
    EXPECT_EQ(record.executeDNSChanges({"192.0.2.54"}, {"example.net"}), 0);
    EXPECT_EQ(fields(record), before);
    EXPECT_THAT(recorded("cursor 1: setProperty"), IsEmpty());
    EXPECT_THAT(recorded("log").back(), exiting("executeDNSChanges", 743));
}

/** One of the changes with arguments that all differ from what the record has. */
struct Change {
    const char* name;
    std::function<int(NetworkAdapterConfiguration&, const std::string& settingID)> run;
    int enteringPosition; ///< 0 where nothing is logged
    int caughtPosition;
    int writes; ///< how many properties it writes

    friend std::ostream& operator<<(std::ostream& stream, const Change& change) { return stream << change.name; }
};

const std::vector<Change> BY_IDENTITY{
    {"executeDHCPChanges", [](auto& record, const auto& id) { return record.executeDHCPChanges(id); }, 0, 606, 1},
    {"executeStaticChanges",
     [](auto& record, const auto& id) { return record.executeStaticChanges(id, "192.0.2.20", "255.0.0.0"); }, 0, 652,
     3},
    {"executeGatewayChanges",
     [](auto& record, const auto& id) { return record.executeGatewayChanges(id, "192.0.2.9"); }, 749, 779, 1},
    {"executeDNSDomainChanges",
     [](auto& record, const auto& id) { return record.executeDNSDomainChanges(id, "example.net"); }, 661, 695, 1},
};

std::vector<Change> all() {
    std::vector<Change> changes = BY_IDENTITY;
    changes.push_back(
        {"executeDNSChanges",
         [](auto& record, const auto&) { return record.executeDNSChanges({"192.0.2.54"}, {"example.net"}); }, 704,
         740, 2});
    return changes;
}

class ChangesByIdentity : public Changes, public testing::WithParamInterface<Change> {};

TEST_P(ChangesByIdentity, UnknownIdentityIsASuccessThatChangesNothing) {
    addAdapter("eth0");
    addAdapter("eth10");
    addAdapter("ETH1");
    const auto before = fields(record);
    EXPECT_EQ(GetParam().run(record, "eth1"), 0);
    EXPECT_EQ(fields(record), before);
    EXPECT_THAT(recorded("cursor 1: setProperty"), IsEmpty());
}

TEST_P(ChangesByIdentity, NoAdaptersAreASuccessThatChangesNothing) {
    const auto before = fields(record);
    EXPECT_EQ(GetParam().run(record, "eth1"), 0);
    EXPECT_EQ(fields(record), before);
}

TEST_P(ChangesByIdentity, IdentityWithSpacesIsOutOfReachOfItsSettingID) {
    addAdapter(" eth1");
    EXPECT_EQ(GetParam().run(record, record.getSettingID()), 0);
    EXPECT_THAT(recorded("cursor 1: setProperty"), IsEmpty());
    EXPECT_THAT(recorded("stripSpaces"), testing::SizeIs(1)) << "that of the record's own SettingID";
}

TEST_P(ChangesByIdentity, AdapterWithoutIdentityIsNotTheOneOfTheEmptyIdentity) {
    addBareAdapter();
    EXPECT_EQ(GetParam().run(record, ""), 0);
    EXPECT_THAT(recorded("cursor 1: setProperty"), IsEmpty());
}

TEST_P(ChangesByIdentity, ManagementControllersAdapterIsNotSpared) {
    addAdapter("eth1", "BMC");
    EXPECT_EQ(GetParam().run(record, "eth1"), 0);
    EXPECT_THAT(recorded("cursor 1: setProperty"), testing::SizeIs(GetParam().writes));
    EXPECT_THAT(recorded("cursor 2"), IsEmpty()) << "nobody looks whose it is";
}

INSTANTIATE_TEST_SUITE_P(Each, ChangesByIdentity, testing::ValuesIn(BY_IDENTITY),
                         [](const auto& instance) { return instance.param.name; });

class AnyChange : public Changes, public testing::WithParamInterface<Change> {
  protected:
    void expectCaught() {
        EXPECT_EQ(GetParam().run(record, "eth1"), 1);
        const std::vector<std::string> lines = recorded("log");
        ASSERT_FALSE(lines.empty());
        EXPECT_EQ(lines.back(), message(6000, GetParam().name, GetParam().caughtPosition, "Caught Exception"));
        for (const std::string& line : lines) {
            EXPECT_EQ(line.find("EXITING"), std::string::npos) << line;
        }
        if (GetParam().enteringPosition != 0) {
            EXPECT_EQ(lines.front(), entering(GetParam().name, GetParam().enteringPosition));
        } else {
            EXPECT_EQ(lines.size(), 1U);
        }
        EXPECT_EQ(recorded("cursor 1: ~").size(), recorded("cursor 1: Instr").size());
    }
};

TEST_P(AnyChange, AgentThatCannotBeReachedIsAFailure) {
    addAdapter("eth1");
    const auto before = fields(record);
    failAt("Instrumentation()", 1, [] { throw std::runtime_error("gone"); });
    expectCaught();
    EXPECT_EQ(fields(record), before);
}

TEST_P(AnyChange, ExceptionOfTheFirstWriteLeavesTheRecordAlone) {
    addAdapter("eth1");
    const auto before = fields(record);
    failAt("setProperty", 1, [] { throw std::runtime_error("refused"); });
    expectCaught();
    EXPECT_EQ(fields(record), before);
}

TEST_P(AnyChange, ExceptionThatIsNotOfTheStandardKindLeavesTheChange) {
    addAdapter("eth1");
    failAt("setProperty", 1, [] { throw 42; });
    EXPECT_THROW(GetParam().run(record, "eth1"), int);
}

INSTANTIATE_TEST_SUITE_P(Each, AnyChange, testing::ValuesIn(all()),
                         [](const auto& instance) { return instance.param.name; });

TEST_F(Changes, WritesBeforeTheOneThatFailsStayInTreeAndRecord) {
    addAdapter("eth1");
    record.setDHCPEnabled(1);
    failAt("setProperty(PROP_IPV4_SUBNET_MASK", 1, [] { throw std::runtime_error("refused"); });
    EXPECT_EQ(record.executeStaticChanges("eth1", "192.0.2.20", "255.0.0.0"), 1);
    EXPECT_FALSE(record.getDHCPEnabled());
    EXPECT_EQ(record.getIPv4Address(), "192.0.2.20");
    EXPECT_EQ(record.getIPv4SubnetMask(), "255.255.255.0");
    EXPECT_EQ(script().nodes.back().numbers[PROP_DHCP_ENABLED], 3U);
    EXPECT_EQ(script().nodes.back().texts[PROP_IPV4_ADDRESS], "192.0.2.20");
}

TEST_F(Changes, ServersStayWhenTheSuffixesFail) {
    addAdapter("eth1");
    failAt("setProperty(PROP_DNS_SUFFIXES", 1, [] { throw std::runtime_error("refused"); });
    EXPECT_EQ(record.executeDNSChanges({"192.0.2.54"}, {"example.net"}), 1);
    EXPECT_THAT(record.getDnsServerSearchOrder(), ElementsAre("192.0.2.53", "192.0.2.54"));
    EXPECT_THAT(record.getDNSSuffixesToAppend(), ElementsAre("example.org"));
    EXPECT_EQ(script().nodes.back().lists[PROP_DNS_SERVERS], Texts{"192.0.2.54"});
}

} // namespace
