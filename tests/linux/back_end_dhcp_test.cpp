#include "tests/linux/WriteFixture.h"

#include <gmock/gmock.h>
#include <gtest/gtest.h>

namespace Orv::Agent::Linux {
namespace {

using namespace NodeLexicon;
using namespace Orv::Test;
using testing::AllOf;
using testing::ElementsAre;
using testing::HasSubstr;
using testing::IsEmpty;
using testing::MatchesRegex;
using testing::Not;

constexpr unsigned dhcp = 1;
constexpr unsigned fixed = 3;

/** With a real server in the other namespace and the host's own client. */
class LinuxDhcpTest : public WriteFixture {
  protected:
    void SetUp() override {
        WriteFixture::SetUp();
        if (space) {
            startServer();
        }
    }

    /** A static configuration as callers write it: the mode, the mask, the address, the gateway. */
    void makeStatic(const std::string& address, const std::string& mask, const std::string& gateway) const {
        set(PROP_DHCP_ENABLED, fixed);
        set(PROP_IPV4_ADDRESS, mask);
        set(PROP_IPV4_SUBNET_MASK, address);
        set(PROP_DEFAULT_GATEWAY, gateway);
    }

    void expectLease() const {
        EXPECT_THAT(addresses(),
                    ElementsAre(MatchesRegex("198\\.51\\.100\\.[56][0-9]/24 brd 198.51.100.255 dynamic")));
        EXPECT_THAT(routes(), ElementsAre("default via 198.51.100.1"));
        EXPECT_THAT(clients(), MatchesRegex(".*dhclient .*left *\n"));
        EXPECT_THAT(read("/etc/resolv.conf"), HasSubstr("nameserver 198.51.100.53"));
        EXPECT_EQ(numberOf(*tree(), "left", PROP_DHCP_ENABLED), dhcp);
        EXPECT_THAT(textOf(*tree(), "left", PROP_IPV4_ADDRESS), HasSubstr("198.51.100."));
        EXPECT_EQ(textOf(*tree(), "left", PROP_DEFAULT_GATEWAY), "198.51.100.1");
        EXPECT_THAT(interfaces(), AllOf(HasSubstr("iface left inet dhcp"), Not(HasSubstr("192.0.2"))));
    }
};

TEST_F(LinuxDhcpTest, getsALeaseThatTheTreeShows) {
    set(PROP_DHCP_ENABLED, dhcp);
    expectLease();
}

TEST_F(LinuxDhcpTest, startsNoSecondClient) {
    set(PROP_DHCP_ENABLED, dhcp);
    const Lines leased = addresses();
    const std::string running = clients();
    set(PROP_DHCP_ENABLED, dhcp);
    EXPECT_EQ(addresses(), leased);
    EXPECT_EQ(clients(), running);
}

TEST_F(LinuxDhcpTest, keepsTheLeasedAddressForGoodWhenItIsMadeStatic) {
    set(PROP_DHCP_ENABLED, dhcp);
    const std::string address = textOf(*tree(), "left", PROP_IPV4_ADDRESS);
    set(PROP_DHCP_ENABLED, fixed);
    EXPECT_THAT(clients(), IsEmpty());
    EXPECT_THAT(addresses(), ElementsAre(address + "/24 brd 198.51.100.255"));
    EXPECT_THAT(routes(), ElementsAre("default via 198.51.100.1"));
    EXPECT_EQ(numberOf(*tree(), "left", PROP_DHCP_ENABLED), fixed);
    EXPECT_THAT(interfaces(),
                AllOf(HasSubstr("iface left inet static"), HasSubstr(address), HasSubstr("198.51.100.1")));
}

TEST_F(LinuxDhcpTest, leavesNoLeaseBehindAStaticConfiguration) {
    set(PROP_DHCP_ENABLED, dhcp);
    makeStatic("203.0.113.5", "255.255.255.0", "203.0.113.1");
    EXPECT_THAT(clients(), IsEmpty());
    EXPECT_THAT(addresses(), ElementsAre("203.0.113.5/24 brd 203.0.113.255"));
    EXPECT_THAT(routes(), ElementsAre("default via 203.0.113.1"));
    EXPECT_THAT(interfaces(), AllOf(HasSubstr("iface left inet static"), HasSubstr("203.0.113.5"),
                                    HasSubstr("gateway 203.0.113.1"), Not(HasSubstr("198.51.100"))));
}

TEST_F(LinuxDhcpTest, goesThereAndBackAgain) {
    for (int round = 0; round < 3; ++round) {
        set(PROP_DHCP_ENABLED, dhcp);
        expectLease();
        makeStatic("192.0.2.30", "255.255.255.0", "192.0.2.1");
        EXPECT_THAT(clients(), IsEmpty());
        EXPECT_THAT(addresses(), ElementsAre("192.0.2.30/24 brd 192.0.2.255"));
        EXPECT_THAT(routes(), ElementsAre("default via 192.0.2.1"));
        EXPECT_EQ(numberOf(*tree(), "left", PROP_DHCP_ENABLED), fixed);
    }
}

TEST_F(LinuxDhcpTest, keepsOtherAddressesAndRoutesOnTheWay) {
    space->ip("addr add 192.0.2.11/24 dev left");
    space->ip("addr add 203.0.113.7/24 dev left");
    space->ip("route add 10.0.0.0/8 via 203.0.113.9 dev left");
    set(PROP_DHCP_ENABLED, dhcp);
    EXPECT_THAT(textOf(*tree(), "left", PROP_IPV4_ADDRESS), HasSubstr("198.51.100."));
    EXPECT_THAT(addresses(), ElementsAre(HasSubstr("dynamic"), "203.0.113.7/24", "192.0.2.11/24"));
    EXPECT_THAT(routes(), ElementsAre("10.0.0.0/8 via 203.0.113.9", "default via 198.51.100.1"));
    makeStatic("192.0.2.30", "255.255.255.0", "192.0.2.1");
    EXPECT_THAT(addresses(),
                ElementsAre("192.0.2.30/24 brd 192.0.2.255", "203.0.113.7/24", "192.0.2.11/24 secondary"));
    EXPECT_THAT(routes(), ElementsAre("10.0.0.0/8 via 203.0.113.9", "default via 192.0.2.1"));
}

TEST_F(LinuxDhcpTest, bootsIntoTheLease) {
    set(PROP_DHCP_ENABLED, dhcp);
    boot();
    expectLease();
}

TEST_F(LinuxDhcpTest, bootsIntoWhatItMadeOfALease) {
    set(PROP_DHCP_ENABLED, dhcp);
    makeStatic("203.0.113.5", "255.255.255.128", "203.0.113.1");
    const Lines liveAddresses = addresses();
    const Lines liveRoutes = routes();
    boot();
    EXPECT_EQ(addresses(), liveAddresses);
    EXPECT_EQ(routes(), liveRoutes);
    EXPECT_THAT(clients(), IsEmpty());
}

TEST_F(LinuxDhcpTest, refusesAnAddressWhileTheModeIsDhcp) {
    set(PROP_DHCP_ENABLED, dhcp);
    EXPECT_THAT(failureOf(PROP_IPV4_ADDRESS, Text("192.0.2.20")), HasSubstr("DHCP"));
    expectLease();
}

TEST_F(LinuxDhcpTest, goesOnTryingWhereNoServerAnswers) {
    stopServer();
    set(PROP_DHCP_ENABLED, dhcp);
    EXPECT_THAT(clients(), HasSubstr("dhclient"));
    EXPECT_THAT(addresses(), IsEmpty());
    EXPECT_THAT(routes(), IsEmpty());
    EXPECT_EQ(numberOf(*tree(), "left", PROP_DHCP_ENABLED), dhcp);
    makeStatic("192.0.2.30", "255.255.255.0", "192.0.2.1");
    EXPECT_THAT(clients(), IsEmpty());
    EXPECT_THAT(addresses(), ElementsAre("192.0.2.30/24 brd 192.0.2.255"));
}

TEST_F(LinuxDhcpTest, staysStaticWhenNoClientCanBeStarted) {
    const Lines before = addresses();
    const std::string file = interfaces();
    space->shell("mount --bind /bin/false /sbin/dhclient; mount --bind /bin/false /sbin/ifup");
    EXPECT_THAT(failureOf(PROP_DHCP_ENABLED, dhcp), HasSubstr("left: DHCPEnabled cannot be set to 1"));
    EXPECT_EQ(addresses(), before);
    EXPECT_THAT(routes(), ElementsAre("default via 192.0.2.1"));
    EXPECT_EQ(interfaces(), file);
    EXPECT_THAT(clients(), IsEmpty());
}

} // namespace
} // namespace Orv::Agent::Linux
