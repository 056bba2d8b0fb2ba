#include "tests/linux/BackEndFixture.h"

#include <gmock/gmock.h>
#include <gtest/gtest.h>

namespace Orv::Agent::Linux {
namespace {

using namespace NodeLexicon;
using namespace Orv::Test;
using testing::HasSubstr;

/** Addresses and gateways, of which an adapter has many and shows one. */
class LinuxBackEndAddressTest : public BackEndFixture {};

TEST_F(LinuxBackEndAddressTest, reportsThePrimaryGlobalAddressOfSeveral) {
    addPair();
    space->ip("addr add 169.254.7.7/16 dev left scope link");
    EXPECT_EQ(textOf(*tree(), "left", PROP_IPV4_ADDRESS), "169.254.7.7");
    space->ip("addr add 192.0.2.10/24 dev left");
    space->ip("addr add 192.0.2.11/24 dev left");
    space->ip("addr add 198.51.100.1/31 dev left");
    EXPECT_EQ(textOf(*tree(), "left", PROP_IPV4_ADDRESS), "192.0.2.10");
    expectAgreement();
    space->ip("addr del 192.0.2.10/24 dev left");
    EXPECT_EQ(textOf(*tree(), "left", PROP_IPV4_ADDRESS), "198.51.100.1");
    EXPECT_EQ(textOf(*tree(), "left", PROP_IPV4_SUBNET_MASK), "255.255.255.254");
    expectAgreement();
}

TEST_F(LinuxBackEndAddressTest, followsAnAddressThatIsPromoted) {
    addPair();
    space->shell("echo 1 > /proc/sys/net/ipv4/conf/left/promote_secondaries");
    for (const char* address : {"192.0.2.10/24", "192.0.2.11/24", "198.51.100.1/24"}) {
        space->ip(std::string("addr add ") + address + " dev left");
    }
    (void)tree();
    space->ip("addr del 192.0.2.10/24 dev left");
    expectAgreement();
}

TEST_F(LinuxBackEndAddressTest, reportsTheOwnEndOfAPointToPointAddress) {
    addPair();
    space->ip("addr add 192.0.2.1 peer 192.0.2.2 dev left");
    EXPECT_EQ(textOf(*tree(), "left", PROP_IPV4_ADDRESS), "192.0.2.1");
    EXPECT_EQ(textOf(*tree(), "left", PROP_IPV4_SUBNET_MASK), "255.255.255.255");
    space->ip("addr add fd00::1 peer fd00::2 dev right");
    expectIpv6("right", "fd00::1");
    expectAgreement();
}

TEST_F(LinuxBackEndAddressTest, reportsAGlobalIpv6AddressBeforeALinkLocalOne) {
    addPair();
    EXPECT_EQ(awaited(2U, [&] { return numberOf(*tree(), "left", PROP_IP_SUPPORT); }), 2U);
    EXPECT_THAT(textOf(*tree(), "left", PROP_IPV6_ADDRESS), HasSubstr("fe80::"));
    space->ip("addr add 2001:db8::1/64 dev left");
    space->ip("addr add 2001:db8::2/64 dev left");
    expectAgreement();
    backEnd = makeBackEnd();
    expectAgreement();
    space->ip("addr change 2001:db8::2/64 dev left preferred_lft 0");
    expectIpv6("left", "2001:db8::1");
}

TEST_F(LinuxBackEndAddressTest, reportsTheGatewayOfTheLowestMetric) {
    addPair();
    space->ip("addr add 192.0.2.10/24 dev left");
    space->ip("route add default via 192.0.2.3 dev left metric 300");
    space->ip("route add default via 192.0.2.1 dev left metric 100");
    space->ip("route add default via 192.0.2.2 dev left metric 200");
    EXPECT_EQ(textOf(*tree(), "left", PROP_DEFAULT_GATEWAY), "192.0.2.1");
    space->ip("route del default via 192.0.2.1 dev left metric 100");
    EXPECT_EQ(textOf(*tree(), "left", PROP_DEFAULT_GATEWAY), "192.0.2.2");
    space->ip("route replace default via 192.0.2.9 dev left metric 200");
    EXPECT_EQ(textOf(*tree(), "left", PROP_DEFAULT_GATEWAY), "192.0.2.9");
    expectAgreement();
}

TEST_F(LinuxBackEndAddressTest, reportsEachHopOfARouteThroughSeveralAdapters) {
    addPair();
    space->ip("addr add 192.0.2.10/24 dev left");
    space->ip("addr add 198.51.100.10/24 dev right");
    space->ip("route add default nexthop via 192.0.2.1 dev left nexthop via 198.51.100.1 dev right");
    EXPECT_EQ(textOf(*tree(), "left", PROP_DEFAULT_GATEWAY), "192.0.2.1");
    EXPECT_EQ(textOf(*tree(), "right", PROP_DEFAULT_GATEWAY), "198.51.100.1");
    expectAgreement();
}

TEST_F(LinuxBackEndAddressTest, reportsAnIpv6GatewayWhereThereIsNoOther) {
    addPair();
    space->ip("addr add fd00::10/64 dev left");
    space->ip("-6 route add default via fd00::1 dev left");
    EXPECT_EQ(textOf(*tree(), "left", PROP_DEFAULT_GATEWAY), "fd00::1");
    space->ip("addr add 192.0.2.10/24 dev left");
    space->ip("route add default dev left");
    EXPECT_EQ(textOf(*tree(), "left", PROP_DEFAULT_GATEWAY), "fd00::1");
    space->ip("route replace default via 192.0.2.1 dev left");
    EXPECT_EQ(textOf(*tree(), "left", PROP_DEFAULT_GATEWAY), "192.0.2.1");
    expectAgreement();
}

TEST_F(LinuxBackEndAddressTest, takesNoGatewayFromOtherTables) {
    addPair();
    space->ip("addr add 192.0.2.10/24 dev left");
    space->ip("route add default via 192.0.2.1 dev left table 100");
    EXPECT_EQ(textOf(*tree(), "left", PROP_DEFAULT_GATEWAY), "");
}

TEST_F(LinuxBackEndAddressTest, losesTheGatewayThatTheKernelWithdrawsSilently) {
    addPair();
    space->ip("addr add 192.0.2.10/24 dev left");
    space->ip("route add default via 192.0.2.1 dev left");
    EXPECT_EQ(textOf(*tree(), "left", PROP_DEFAULT_GATEWAY), "192.0.2.1");
    space->ip("link set left down");
    EXPECT_EQ(textOf(*tree(), "left", PROP_DEFAULT_GATEWAY), "");
    space->ip("link set left up");
    space->ip("route add default via 192.0.2.1 dev left src 192.0.2.10");
    EXPECT_EQ(textOf(*tree(), "left", PROP_DEFAULT_GATEWAY), "192.0.2.1");
    space->ip("addr del 192.0.2.10/24 dev left");
    EXPECT_EQ(textOf(*tree(), "left", PROP_DEFAULT_GATEWAY), "");
    expectAgreement();
}

TEST_F(LinuxBackEndAddressTest, knowsWhichGatewaysGoWithAnAddressAmongOthers) {
    addPair();
    for (const char* address : {"192.0.2.10/24", "192.0.2.11/24", "198.51.100.10/24"}) {
        space->ip(std::string("addr add ") + address + " dev left");
    }
    space->ip("addr add 203.0.113.10/24 dev right");
    space->ip("route add default via 192.0.2.1 dev left");
    space->ip("route add default via 203.0.113.1 dev right metric 9 src 198.51.100.10");
    EXPECT_EQ(textOf(*tree(), "right", PROP_DEFAULT_GATEWAY), "203.0.113.1");
    space->ip("addr del 192.0.2.11/24 dev left");
    expectAgreement();
    space->ip("addr del 198.51.100.10/24 dev left");
    EXPECT_EQ(textOf(*tree(), "right", PROP_DEFAULT_GATEWAY), "");
    EXPECT_EQ(textOf(*tree(), "left", PROP_DEFAULT_GATEWAY), "192.0.2.1");
    space->ip("addr del 192.0.2.10/24 dev left");
    EXPECT_EQ(textOf(*tree(), "left", PROP_DEFAULT_GATEWAY), "");
    expectAgreement();
}

TEST_F(LinuxBackEndAddressTest, passesOverAGatewayThatCannotBeReached) {
    addPair();
    space->ip("addr add 192.0.2.10/24 dev left");
    space->ip("route add default via 192.0.2.1 dev left");
    space->ip("route append default via 192.0.2.2 dev left");
    EXPECT_EQ(textOf(*tree(), "left", PROP_DEFAULT_GATEWAY), "192.0.2.1");
    // A packet to a host that does not answer: the kernel gives it up after one unanswered question.
    space->shell("cd /proc/sys/net/ipv4/neigh/left && echo 1 > mcast_solicit && echo 50 > retrans_time_ms && "
                 "bash -c 'echo > /dev/udp/192.0.2.1/9' && "
                 "until ip neigh show dev left | grep -q '192.0.2.1.*FAILED'; do sleep 0.05; done");
    EXPECT_EQ(textOf(*tree(), "left", PROP_DEFAULT_GATEWAY), "192.0.2.2");
    EXPECT_EQ(textOf(*makeBackEnd()->snapshot(), "left", PROP_DEFAULT_GATEWAY), "192.0.2.2");
    space->ip("neigh replace 192.0.2.1 lladdr 02:00:00:00:00:01 dev left nud reachable");
    EXPECT_EQ(textOf(*tree(), "left", PROP_DEFAULT_GATEWAY), "192.0.2.1");
}

} // namespace
} // namespace Orv::Agent::Linux
