/** The writer of property changes: which adapter it writes to, in which order, and how it ends. */
#include "configuration/PropertyModification.h"
#include "tests/provider/Tree.h"

#include <stdexcept>

#include <gmock/gmock.h>
#include <gtest/gtest.h>

namespace {

using namespace Orv::NodeLexicon;
using Orv::NetworkAdapterComposite::modifyNetworkAdapterConfigurationInstances;
using provider_test::addAdapter;
using provider_test::addBareAdapter;
using provider_test::flow;
using provider_test::linesOf;
using provider_test::normalised;
using scripted_agent::failAt;
using scripted_agent::recorded;
using scripted_agent::script;
using testing::Contains;
using testing::ElementsAre;
using testing::HasSubstr;
using testing::IsEmpty;
using testing::Not;

const std::string FUNCTION = "modifyNetworkAdapterConfigurationInstances";

std::string logLine(int level, const std::string& text) {
    return provider_test::line("log", level, "Hearth.NetworkAdapterProvider", "NetworkAdapterConfiguration", FUNCTION,
                               text);
}

const std::string ENTERING = logLine(4000, "ENTERING: " + FUNCTION + "() in NetworkAdapterConfiguration [Line: N]");
const std::string FOUND =
    logLine(4000, "MESSAGE [File: NetworkAdapterConfiguration, Line: N]: Instrumentation node found ");
const std::string CAUGHT = logLine(6000, "MESSAGE [File: NetworkAdapterConfiguration, Line: N]: Caught Exception : ");

std::string name(const std::string& identity) {
    return logLine(4000, "VARIABLE: 'name' has Value '" + identity + "' at line N in NetworkAdapterConfiguration");
}

class Modification : public testing::Test {
  protected:
    Modification() { scripted_agent::reset(); }

    ~Modification() override {
        EXPECT_EQ(linesOf("trace"), linesOf("log")) << "each line goes to both";
        EXPECT_THAT(recorded("log"), Not(Contains(HasSubstr("EXITING")))) << "the end is not marked";
    }

    static int modify(const std::string& settingId) {
        return modifyNetworkAdapterConfigurationInstances(settingId, "192.0.2.20", "192.0.2.1", "255.255.255.0",
                                                          "example.net");
    }
};

TEST_F(Modification, WritesAddressMaskGatewayAndDomainInThisOrderThoughItsArgumentsHaveAnother) {
    addAdapter("eth0");
    addAdapter("eth1");
    addAdapter("eth1");
    EXPECT_EQ(modify("eth1"), 0);
    EXPECT_THAT(normalised(flow()),
                ElementsAre(ENTERING, "cursor 1: Instrumentation()", "cursor 1: selectNode(NODE_NETWORK_ADAPTER)",
                            "cursor 1: bool = true", "cursor 1: bool = true",
                            "cursor 1: getProperty(PROP_NODE_STRING) = \"eth0\"", "cursor 1: ++",
                            "cursor 1: bool = true", "cursor 1: getProperty(PROP_NODE_STRING) = \"eth1\"", FOUND,
                            name("eth1"), "cursor 1: setProperty(PROP_IPV4_ADDRESS, \"192.0.2.20\")",
                            "cursor 1: setProperty(PROP_IPV4_SUBNET_MASK, \"255.255.255.0\")",
                            "cursor 1: setProperty(PROP_DEFAULT_GATEWAY, \"192.0.2.1\")",
                            "cursor 1: setProperty(PROP_DNS_DOMAIN, \"example.net\")",
                            "cursor 1: ~Instrumentation()"));
}

TEST_F(Modification, AddressDoesNotTouchTheMode) {
    addAdapter("eth1").numbers[PROP_DHCP_ENABLED] = 1;
    EXPECT_EQ(modify("eth1"), 0);
    EXPECT_EQ(script().nodes.back().numbers[PROP_DHCP_ENABLED], 1U);
}

TEST_F(Modification, EmptyValuesAreNotWritten) {
    addAdapter("eth1");
    EXPECT_EQ(modifyNetworkAdapterConfigurationInstances("eth1", "", "", "", ""), 0);
    EXPECT_THAT(normalised(recorded("log")), ElementsAre(ENTERING, FOUND, name("eth1")));
    EXPECT_THAT(recorded("cursor 1: setProperty"), IsEmpty());
}

TEST_F(Modification, EachValueIsWrittenByItself) {
    addAdapter("eth1");
    EXPECT_EQ(modifyNetworkAdapterConfigurationInstances("eth1", "a", "", "", ""), 0);
    EXPECT_EQ(modifyNetworkAdapterConfigurationInstances("eth1", "", "b", "", ""), 0);
    EXPECT_EQ(modifyNetworkAdapterConfigurationInstances("eth1", "", "", "c", ""), 0);
    EXPECT_EQ(modifyNetworkAdapterConfigurationInstances("eth1", "", "", "", "d"), 0);
    std::vector<std::string> writes = recorded("cursor");
    std::erase_if(writes, [](const std::string& call) { return call.find("setProperty") == std::string::npos; });
    EXPECT_THAT(writes, ElementsAre("cursor 1: setProperty(PROP_IPV4_ADDRESS, \"a\")",
                                    "cursor 2: setProperty(PROP_DEFAULT_GATEWAY, \"b\")",
                                    "cursor 3: setProperty(PROP_IPV4_SUBNET_MASK, \"c\")",
                                    "cursor 4: setProperty(PROP_DNS_DOMAIN, \"d\")"));
}

TEST_F(Modification, NoAdaptersAtAllAreAFailureWithoutAMessage) {
    EXPECT_EQ(modify("eth1"), 1);
    EXPECT_THAT(normalised(flow()),
                ElementsAre(ENTERING, "cursor 1: Instrumentation()", "cursor 1: selectNode(NODE_NETWORK_ADAPTER)",
                            "cursor 1: bool = false", "cursor 1: ~Instrumentation()"));
}

TEST_F(Modification, UnknownAdapterIsASuccessThatWritesNothing) {
    addAdapter("eth0");
    addAdapter("eth1 ");
    addAdapter("ETH1");
    EXPECT_EQ(modify("eth1"), 0);
    EXPECT_THAT(normalised(recorded("log")), ElementsAre(ENTERING));
    EXPECT_THAT(recorded("cursor 1: setProperty"), IsEmpty());
}

TEST_F(Modification, IdentityThatCannotBeReadIsReadAgainAndAgainUntilItAnswers) {
    addBareAdapter();
    int reads = 0;
    script().before = [&](std::string_view call) {
        if (call == "getProperty(PROP_NODE_STRING)" && ++reads == 100) {
            script().nodes.back().texts[PROP_NODE_STRING] = "eth1";
        }
    };
    EXPECT_EQ(modify("eth1"), 0);
    EXPECT_EQ(reads, 100);
    EXPECT_THAT(recorded("cursor 1: ++"), IsEmpty()) << "the node is not passed over";
    EXPECT_THAT(recorded("cursor 1: setProperty"), testing::SizeIs(4));
}

TEST_F(Modification, IdentityThatCannotBeReadIsReadUntilTheAgentThrows) {
    addBareAdapter();
    addAdapter("eth1");
    failAt("getProperty(PROP_NODE_STRING)", 100, [] { throw std::runtime_error("gone"); });
    EXPECT_EQ(modify("eth1"), 1);
    EXPECT_THAT(normalised(recorded("log")), ElementsAre(ENTERING, CAUGHT));
    EXPECT_THAT(recorded("cursor 1: setProperty"), IsEmpty());
}

TEST_F(Modification, EveryCallOfTheAgentThatThrowsIsCaught) {
    for (const char* call :
         {"Instrumentation()", "selectNode", "bool", "getProperty", "++", "setProperty(PROP_IPV4_A",
          "setProperty(PROP_IPV4_S", "setProperty(PROP_DEF", "setProperty(PROP_DNS"}) {
        scripted_agent::reset();
        addAdapter("eth0");
        addAdapter("eth1");
        failAt(call, 1, [] { throw std::runtime_error("gone"); });
        EXPECT_EQ(modify("eth1"), 1) << call;
        EXPECT_EQ(normalised(recorded("log")).back(), CAUGHT) << call;
    }
    EXPECT_THAT(recorded("cursor 1: setProperty"), testing::SizeIs(3)) << "what came before the failure stays";
}

TEST_F(Modification, WhatIsNoStandardExceptionLeavesIt) {
    addAdapter("eth1");
    failAt("setProperty", 1, [] { throw 42; });
    EXPECT_THROW(modify("eth1"), int);
}

} // namespace
