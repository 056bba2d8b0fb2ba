#include "configuration/ConfigurationInventory.h"
#include "tests/provider/Tree.h"

#include <stdexcept>

#include <gmock/gmock.h>
#include <gtest/gtest.h>

namespace {

using namespace Orv::NodeLexicon;
using Orv::NetworkAdapterComposite::getMacAddressFromNetworkPort;
using provider_test::addAdapter;
using provider_test::line;
using provider_test::normalised;
using scripted_agent::failAt;
using scripted_agent::recorded;
using scripted_agent::script;
using testing::ElementsAre;

const std::string LOGGER = "Hearth.NetworkAdapterProvider";
const std::string UNIT = "NetworkAdapterConfiguration";

class PortLookup : public testing::Test {
  protected:
    PortLookup() { scripted_agent::reset(); }

    static void addPort(const std::string& identity, const std::string& mac) {
        scripted_agent::Node port{.type = NODE_NETWORK_PORT};
        port.texts[PROP_NODE_STRING] = identity;
        port.texts[PROP_MAC_ADDRESS] = mac;
        script().nodes.push_back(port);
    }

    static std::vector<std::string> logged(const char* sink) { return normalised(recorded(sink)); }

    static std::string entering(const char* sink) {
        return line(sink, 4000, LOGGER, UNIT, "getMacAddressFromNetworkPort",
                    "ENTERING: getMacAddressFromNetworkPort() in NetworkAdapterConfiguration [Line: N]");
    }

    static std::string exiting(const char* sink) {
        return line(sink, 4000, LOGGER, UNIT, "getMacAddressFromNetworkPort",
                    "EXITING: getMacAddressFromNetworkPort() in NetworkAdapterConfiguration [Line: N]");
    }

    std::string mac = "before";
};

TEST_F(PortLookup, FindsThePortByItsIdentity) {
    addPort("port1", "01");
    addPort("port2", "02");
    addPort("port3", "03");
    EXPECT_TRUE(getMacAddressFromNetworkPort("port2", mac));
    EXPECT_EQ(mac, "02");
    for (const char* sink : {"log", "trace"}) {
        EXPECT_THAT(logged(sink), ElementsAre(entering(sink), exiting(sink)));
    }
}

TEST_F(PortLookup, OfTwoPortsWithOneIdentityTheLaterCounts) {
    addPort("port1", "01");
    addPort("port1", "02");
    EXPECT_TRUE(getMacAddressFromNetworkPort("port1", mac));
    EXPECT_EQ(mac, "02");
}

TEST_F(PortLookup, LaterPortWithoutAddressLeavesTheEarlierOnes) {
    addPort("port1", "01");
    addPort("port1", "02");
    script().nodes.back().texts.erase(PROP_MAC_ADDRESS);
    EXPECT_TRUE(getMacAddressFromNetworkPort("port1", mac));
    EXPECT_EQ(mac, "01");
}

TEST_F(PortLookup, IdentityIsComparedByteForByte) {
    addPort("port1", "01");
    addPort("port1 ", "02");
    addPort("PORT1", "03");
    addPort("port", "04");
    EXPECT_TRUE(getMacAddressFromNetworkPort("port1", mac));
    EXPECT_EQ(mac, "01");
}

TEST_F(PortLookup, UnknownPortLeavesTheOutputAlone) {
    addPort("port1", "01");
    EXPECT_FALSE(getMacAddressFromNetworkPort("port9", mac));
    EXPECT_EQ(mac, "before");
}

TEST_F(PortLookup, PortWithoutIdentityIsNotThePortOfTheEmptyString) {
    addPort("", "01");
    script().nodes.back().texts.erase(PROP_NODE_STRING);
    EXPECT_FALSE(getMacAddressFromNetworkPort("", mac));
}

TEST_F(PortLookup, AdaptersAreNoPorts) {
    addAdapter("port1").texts[PROP_MAC_ADDRESS] = "01";
    EXPECT_FALSE(getMacAddressFromNetworkPort("port1", mac));
}

TEST_F(PortLookup, NoPortsAtAllIsNotFound) {
    EXPECT_FALSE(getMacAddressFromNetworkPort("port1", mac));
    EXPECT_THAT(logged("log"), ElementsAre(entering("log"), exiting("log")));
}

TEST_F(PortLookup, ExceptionIsLoggedAndKeepsWhatWasFound) {
    addPort("port1", "01");
    addPort("port2", "02");
    failAt("getProperty(PROP_NODE_STRING)", 2, [] { throw std::runtime_error("gone"); });
    EXPECT_TRUE(getMacAddressFromNetworkPort("port1", mac));
    EXPECT_EQ(mac, "01");
    for (const char* sink : {"log", "trace"}) {
        EXPECT_THAT(logged(sink),
                    ElementsAre(entering(sink), line(sink, 6000, LOGGER, UNIT, "getMacAddressFromNetworkPort",
                                                     "MESSAGE [File: NetworkAdapterConfiguration, Line: N]: "
                                                     "Caught Exception")));
    }
}

TEST_F(PortLookup, AgentThatCannotBeReachedIsNotFound) {
    failAt("Instrumentation()", 1, [] { throw std::runtime_error("gone"); });
    EXPECT_FALSE(getMacAddressFromNetworkPort("port1", mac));
}

} // namespace
