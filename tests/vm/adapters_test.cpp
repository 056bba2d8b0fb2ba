// What the agent reads of kinds of interfaces that not every kernel has.
#include "tests/vm/Guest.h"

#include <gmock/gmock.h>

namespace Orv::Test {
namespace {

using namespace NodeLexicon;

std::string addressOf(const std::string& name, NodeType type = NODE_NETWORK_ADAPTER) {
    return propertyOf<std::string>(name, PROP_MAC_ADDRESS, type);
}

TEST_F(BondTest, lendsItsAddressToItsMembersWhosePortsKeepTheirs) {
    EXPECT_EQ(addressOf("bond0"), "52:54:00:12:34:01");
    EXPECT_EQ(addressOf("eth0"), "52:54:00:12:34:01");
    EXPECT_EQ(addressOf("eth1"), "52:54:00:12:34:01");
    EXPECT_EQ(addressOf("eth0", NODE_NETWORK_PORT), "52:54:00:12:34:01");
    EXPECT_EQ(addressOf("eth1", NODE_NETWORK_PORT), "52:54:00:12:34:02");
    EXPECT_EQ(addressOf("bond0", NODE_NETWORK_PORT), "");
}

TEST_F(BondTest, hasItsIpConfigurationAndNotItsMembers) {
    ip("address add 192.0.2.10/25 dev bond0");
    ip("route add default via 192.0.2.1");
    EXPECT_EQ(propertyOf<std::string>("bond0", PROP_IPV4_ADDRESS), "192.0.2.10");
    EXPECT_EQ(propertyOf<std::string>("bond0", PROP_IPV4_SUBNET_MASK), "255.255.255.128");
    EXPECT_EQ(propertyOf<std::string>("bond0", PROP_DEFAULT_GATEWAY), "192.0.2.1");
    EXPECT_EQ(propertyOf<std::string>("eth0", PROP_IPV4_ADDRESS), "");
}

TEST_F(BondTest, carriesVlansWithConfigurationsOfTheirOwn) {
    ip("link add link bond0 name bond0.7 type vlan id 7");
    EXPECT_EQ(statusOf("bond0.7"), 5U);
    ip("link set bond0.7 up");
    ip("address add 198.51.100.7/24 dev bond0.7");
    expectStatus("bond0.7", 1);
    EXPECT_EQ(addressOf("bond0.7"), addressOf("bond0"));
    EXPECT_EQ(propertyOf<std::string>("bond0.7", PROP_IPV4_ADDRESS), "198.51.100.7");
    EXPECT_EQ(propertyOf<std::string>("bond0", PROP_IPV4_ADDRESS), "");
}

TEST(Dummy, isUpWithoutOperationalState) {
    ip("link add d0 type dummy");
    EXPECT_EQ(statusOf("d0"), 5U);
    ip("link set d0 up");
    ip("address add 203.0.113.5/32 dev d0");
    EXPECT_EQ(firstLine("/sys/class/net/d0/operstate"), "unknown");
    EXPECT_EQ(statusOf("d0"), 1U);
    EXPECT_EQ(propertyOf<std::string>("d0", PROP_IPV4_ADDRESS), "203.0.113.5");
    EXPECT_EQ(propertyOf<std::string>("d0", PROP_IPV4_SUBNET_MASK), "255.255.255.255");
    ip("link del d0");
    EXPECT_EQ(addressOf("d0"), "");
}

TEST(Card, losesItsCarrierWithItsCable) {
    StatusWatch watch;
    ip("link set eth0 up");
    EXPECT_THAT(watch.take(1), testing::ElementsAre("eth0 1"));
    pullCable("eth0");
    EXPECT_THAT(watch.take(1), testing::ElementsAre("eth0 12"));
    plugCable("eth0");
    EXPECT_THAT(watch.take(1), testing::ElementsAre("eth0 1"));
    ip("link set eth0 down");
    EXPECT_THAT(watch.take(1), testing::ElementsAre("eth0 5"));
}

} // namespace
} // namespace Orv::Test
