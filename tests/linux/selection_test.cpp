#include "agent/linux/Selection.h"
#include "tests/linux/Facts.h"

#include <gtest/gtest.h>

namespace Orv::Agent::Linux {
namespace {

using namespace Orv::Test;

std::string chosen4(const KernelState::Addresses& addresses) {
    const Address* found = reportedIpv4(addresses);
    return found == nullptr ? "" : found->local.text();
}

std::string chosen6(const KernelState::Addresses& addresses) {
    const Address* found = reportedIpv6(addresses);
    return found == nullptr ? "" : found->local.text();
}

TEST(Status, followsFlagsAndOperationalState) {
    struct Case {
        unsigned flags;
        std::uint8_t state;
        AdapterStatus expected;
    };

    constexpr unsigned up = IFF_UP | IFF_RUNNING | IFF_LOWER_UP;
    const std::vector<Case> cases{
        {up, IF_OPER_UP, AdapterStatus::running},
        {up, IF_OPER_UNKNOWN, AdapterStatus::running},
        {IFF_UP | IFF_LOWER_UP, IF_OPER_UNKNOWN, AdapterStatus::running},
        {IFF_UP, IF_OPER_UNKNOWN, AdapterStatus::lostCommunication},
        {IFF_UP, IF_OPER_DOWN, AdapterStatus::lostCommunication},
        {up, IF_OPER_LOWERLAYERDOWN, AdapterStatus::lostCommunication},
        {up, IF_OPER_DORMANT, AdapterStatus::lostCommunication},
        {up, IF_OPER_TESTING, AdapterStatus::lostCommunication},
        {up, IF_OPER_NOTPRESENT, AdapterStatus::lostCommunication},
        {0, IF_OPER_DOWN, AdapterStatus::stopped},
        {IFF_LOWER_UP, IF_OPER_UP, AdapterStatus::stopped},
    };
    for (const Case& entry : cases) {
        EXPECT_EQ(statusOf(link(2, "eth0", entry.flags, entry.state)), entry.expected)
            << entry.flags << ' ' << int{entry.state};
    }
}

TEST(Status, hasTheCodesOfTheTree) {
    EXPECT_EQ(static_cast<unsigned>(AdapterStatus::running), 1U);
    EXPECT_EQ(static_cast<unsigned>(AdapterStatus::stopped), 5U);
    EXPECT_EQ(static_cast<unsigned>(AdapterStatus::lostCommunication), 12U);
}

TEST(Loopback, isToldByItsHardwareTypeNotItsName) {
    Link loopback = link(1, "renamed");
    loopback.hardwareType = ARPHRD_LOOPBACK;
    EXPECT_TRUE(isLoopback(loopback));
    EXPECT_FALSE(isLoopback(link(2, "lo")));
}

TEST(ReportedIpv4, isThePrimaryOneOfTheWidestScope) {
    EXPECT_EQ(chosen4({}), "");
    EXPECT_EQ(chosen4({address(2, "10.0.0.1/24"), address(2, "10.0.0.2/24")}), "10.0.0.1");
    EXPECT_EQ(chosen4({address(2, "10.0.0.9/24", IFA_F_SECONDARY), address(2, "10.0.0.1/24")}), "10.0.0.1");
    EXPECT_EQ(chosen4({address(2, "169.254.0.1/16", IFA_F_PERMANENT, RT_SCOPE_LINK), address(2, "10.0.0.1/24")}),
              "10.0.0.1");
    EXPECT_EQ(chosen4({address(2, "169.254.0.1/16", IFA_F_PERMANENT, RT_SCOPE_LINK)}), "169.254.0.1");
    EXPECT_EQ(chosen4({address(2, "fd00::1/64")}), "");
}

TEST(ReportedIpv6, prefersTheGlobalOne) {
    const Address local = address(2, "fe80::1/64", IFA_F_PERMANENT, RT_SCOPE_LINK);
    EXPECT_EQ(chosen6({local, address(2, "fd00::1/64")}), "fd00::1");
    EXPECT_EQ(chosen6({local}), "fe80::1");
    EXPECT_EQ(chosen6({address(2, "10.0.0.1/24")}), "");
}

TEST(ReportedIpv6, prefersOneThatCanBeUsed) {
    const Address local = address(2, "fe80::1/64", IFA_F_PERMANENT, RT_SCOPE_LINK);
    EXPECT_EQ(chosen6({address(2, "fd00::1/64", IFA_F_TENTATIVE), local}), "fe80::1");
    EXPECT_EQ(chosen6({address(2, "fd00::1/64", IFA_F_DADFAILED), local}), "fe80::1");
    EXPECT_EQ(chosen6({address(2, "fd00::1/64", IFA_F_TENTATIVE | IFA_F_OPTIMISTIC), local}), "fd00::1");
    EXPECT_EQ(chosen6({address(2, "fd00::1/64", IFA_F_TENTATIVE)}), "fd00::1");
    EXPECT_EQ(chosen6({address(2, "fd00::1/64", IFA_F_DEPRECATED), address(2, "fd00::2/64")}), "fd00::2");
    EXPECT_EQ(chosen6({address(2, "fd00::1/64", IFA_F_DEPRECATED), local}), "fd00::1");
}

TEST(ReportedIpv6, prefersOneThatLasts) {
    EXPECT_EQ(chosen6({address(2, "fd00::1/64", IFA_F_TEMPORARY), address(2, "fd00::2/64", 0)}), "fd00::2");
    EXPECT_EQ(chosen6({address(2, "fd00::1/64", IFA_F_TEMPORARY), address(2, "fd00::2/64", IFA_F_DEPRECATED)}),
              "fd00::1");
}

std::string gateway(const std::vector<Route>& routes) {
    KernelState state;
    for (const std::uint8_t family : addressFamilies) {
        state.setRoutes(family, routes);
    }
    const auto found = gatewayOf(state, 2);
    return found ? found->text() : "";
}

TEST(Gateway, isThatOfTheLowestMetric) {
    EXPECT_EQ(gateway({}), "");
    EXPECT_EQ(gateway({route(2, "10.0.0.1", 200), route(2, "10.0.0.2", 100)}), "10.0.0.2");
    EXPECT_EQ(gateway({route(2, "10.0.0.1", 100), route(2, "10.0.0.2", 100)}), "10.0.0.1");
    EXPECT_EQ(gateway({route(3, "10.0.0.1", 0)}), "");
}

TEST(Gateway, isAnIpv6OneOnlyWithoutAnIpv4One) {
    EXPECT_EQ(gateway({route(2, "fe80::1", 1), route(2, "10.0.0.1", 500)}), "10.0.0.1");
    EXPECT_EQ(gateway({route(2, "fe80::1", 1)}), "fe80::1");
    EXPECT_EQ(gateway({route(2, "fe80::1", 1), route(2, "", 0)}), "fe80::1");
}

TEST(Gateway, isNoneWhenTheBestRouteNeedsNone) {
    EXPECT_EQ(gateway({route(2, "", 0), route(2, "10.0.0.1", 100)}), "");
}

TEST(Gateway, ofADeadRouteYieldsToAnother) {
    Route dead = route(2, "10.0.0.1", 0);
    dead.hops.front().flags = RTNH_F_DEAD;
    EXPECT_EQ(gateway({dead, route(2, "10.0.0.2", 0)}), "10.0.0.2");
    EXPECT_EQ(gateway({dead}), "10.0.0.1");
}

TEST(Gateway, followsTheRouterPreference) {
    const auto preferred = [](const char* address, std::uint8_t preference) {
        Route made = route(2, address, 1024);
        made.preference = preference;
        return made;
    };
    constexpr std::uint8_t high = 1;
    constexpr std::uint8_t medium = 0;
    constexpr std::uint8_t low = 3;
    EXPECT_EQ(gateway({preferred("fe80::1", low), preferred("fe80::2", medium)}), "fe80::2");
    EXPECT_EQ(gateway({preferred("fe80::1", medium), preferred("fe80::2", high)}), "fe80::2");
}

TEST(HardwareAddress, isWrittenInLowerCaseWithColons) {
    using Octets = std::vector<std::uint8_t>;
    EXPECT_EQ(hardwareAddressText(Octets{0x02, 0xAB, 0, 0x0F, 0xFF, 1}), "02:ab:00:0f:ff:01");
    EXPECT_EQ(hardwareAddressText(Octets{0, 0, 0, 0, 0, 0, 0, 1}), "00:00:00:00:00:00:00:01");
    EXPECT_EQ(hardwareAddressText(Octets(20, 0xAA))->size(), 59U);
    EXPECT_EQ(hardwareAddressText(Octets(6, 0)), std::nullopt);
    EXPECT_EQ(hardwareAddressText(Octets{10, 0, 0, 1}), std::nullopt);
    EXPECT_EQ(hardwareAddressText(Octets(16, 1)), std::nullopt);
    EXPECT_EQ(hardwareAddressText(Octets()), std::nullopt);
}

TEST(IpAddress, isWrittenAsItsFamilyIs) {
    EXPECT_EQ(ipAddress("192.0.2.1").text(), "192.0.2.1");
    EXPECT_EQ(ipAddress("2001:DB8:0:0:1:0:0:1").text(), "2001:db8::1:0:0:1");
    EXPECT_EQ(IpAddress().text(), "");
}

TEST(Mask, hasEveryLength) {
    EXPECT_EQ(maskText(0), "0.0.0.0");
    EXPECT_EQ(maskText(1), "128.0.0.0");
    EXPECT_EQ(maskText(20), "255.255.240.0");
    EXPECT_EQ(maskText(24), "255.255.255.0");
    EXPECT_EQ(maskText(31), "255.255.255.254");
    EXPECT_EQ(maskText(32), "255.255.255.255");
}

} // namespace
} // namespace Orv::Agent::Linux
