#include "agent/linux/KernelState.h"
#include "agent/linux/Selection.h"
#include "tests/linux/Facts.h"

#include <gtest/gtest.h>
#include <linux/if.h>
#include <linux/if_addr.h>
#include <linux/if_arp.h>
#include <linux/neighbour.h>
#include <linux/rtnetlink.h>

namespace Orv::Agent::Linux {
namespace {

using namespace Orv::Test;

template <typename Object>
void comes(KernelState& state, const Object& object) {
    state.apply(Change<Object>{object, false});
}

template <typename Object>
void goes(KernelState& state, const Object& object) {
    state.apply(Change<Object>{object, true});
}

/** A state in which nothing is left to be read or reported. */
KernelState quietState(const std::vector<Link>& links = {}) {
    KernelState state;
    for (const Link& known : links) {
        comes(state, known);
    }
    state.setRoutes(AF_INET, {});
    state.setRoutes(AF_INET6, {});
    state.takeChanges();
    return state;
}

TEST(KernelState, reportsEachLinkThatComesChangesAndGoes) {
    KernelState state = quietState();
    comes(state, link(2, "eth0"));
    EXPECT_EQ(state.takeChanges(), std::set<int>{2});
    comes(state, link(2, "lan0"));
    EXPECT_EQ(state.takeChanges(), std::set<int>{2});
    EXPECT_EQ(state.links().at(2).name, "lan0");
    goes(state, link(2, ""));
    EXPECT_EQ(state.takeChanges(), std::set<int>{2});
    EXPECT_TRUE(state.links().empty());
}

Link team(int index) {
    Link made = link(index, "team0");
    made.kind = "team";
    return made;
}

TEST(KernelState, keepsATeamsOptionsThatAreNotInAMessage) {
    KernelState state = quietState({team(9)});
    EXPECT_EQ(state.teams(), std::vector<int>{9});
    EXPECT_EQ(state.carrierOf(team(9)), Carrier());
    state.apply(TeamOptions{9, 2, {{2, std::int32_t{100}}, {3, std::int32_t{10}}}});
    EXPECT_EQ(state.takeChanges(), std::set<int>{9});
    EXPECT_EQ(state.carrierOf(team(9)), (Carrier{2, Carrier::Rank::first}));
    state.apply(TeamOptions{9, 3, {}});
    EXPECT_EQ(state.carrierOf(team(9)), (Carrier{3, Carrier::Rank::backup}));
    state.apply(TeamOptions{9, std::nullopt, {{3, std::int32_t{100}}}});
    EXPECT_EQ(state.carrierOf(team(9)), (Carrier{3, Carrier::Rank::first})) << "with an equal";
    state.takeChanges();
    state.apply(TeamOptions{9, 3, {{3, std::int32_t{100}}}});
    EXPECT_FALSE(state.hasChanges());
}

TEST(KernelState, knowsNoCarrierOfATeamWhosePortIsLeaving) {
    KernelState state = quietState({team(9)});
    state.apply(TeamOptions{9, 2, {{2, std::int32_t{100}}, {3, std::int32_t{10}}}});
    state.apply(TeamOptions{9, std::nullopt, {{2, std::nullopt}}});
    EXPECT_EQ(state.carrierOf(team(9)), Carrier());
    state.apply(TeamOptions{9, 3, {}});
    EXPECT_EQ(state.carrierOf(team(9)), (Carrier{3, Carrier::Rank::first}));
}

TEST(KernelState, forgetsATeamWithItsLink) {
    KernelState state = quietState({team(9)});
    state.apply(TeamOptions{9, 2, {{2, std::int32_t{0}}}});
    goes(state, team(9));
    EXPECT_FALSE(state.hasTeams());
    state.takeChanges();
    state.apply(TeamOptions{9, 3, {{3, std::int32_t{0}}}});
    EXPECT_FALSE(state.hasChanges()) << "its last words come late";
    comes(state, team(9));
    EXPECT_EQ(state.carrierOf(team(9)), Carrier());
}

TEST(KernelState, knowsWhatCarriesABond) {
    const KernelState state;
    Link bond = link(9, "bond0");
    EXPECT_EQ(state.carrierOf(bond), Carrier());
    bond.primaryMember = 2;
    EXPECT_EQ(state.carrierOf(bond), Carrier());
    bond.activeMember = 2;
    EXPECT_EQ(state.carrierOf(bond), (Carrier{2, Carrier::Rank::named}));
    bond.activeMember = 3;
    EXPECT_EQ(state.carrierOf(bond), (Carrier{3, Carrier::Rank::backup}));
}

TEST(KernelState, reportsNothingWhenAMessageRepeatsWhatIsKnown) {
    KernelState state = quietState({link(2, "eth0")});
    const Address known = address(2, "10.0.0.1/24");
    comes(state, known);
    state.takeChanges();
    comes(state, link(2, "eth0"));
    comes(state, known);
    goes(state, address(2, "10.0.0.2/24"));
    EXPECT_TRUE(state.takeChanges().empty());
}

TEST(KernelState, losesTheAddressesOfALinkWithTheLink) {
    KernelState state = quietState({link(2, "eth0")});
    comes(state, address(2, "10.0.0.1/24"));
    goes(state, link(2, ""));
    EXPECT_TRUE(state.addressesOf(2).empty());
}

TEST(KernelState, putsNewAddressesWhereTheKernelDoes) {
    KernelState state = quietState({link(2, "eth0")});
    for (const char* text : {"10.0.0.1/24", "10.0.1.1/24", "fd00::1/64", "fd00::2/64"}) {
        comes(state, address(2, text));
    }
    const KernelState::Addresses& addresses = state.addressesOf(2);
    EXPECT_EQ(reportedIpv4(addresses)->local.text(), "10.0.0.1");
    EXPECT_EQ(reportedIpv6(addresses)->local.text(), "fd00::2");
}

TEST(KernelState, takesAddressesOfADumpInItsOrder) {
    KernelState state;
    state.load(Change<Address>{address(2, "fd00::2/64"), false});
    state.load(Change<Address>{address(2, "fd00::1/64"), false});
    EXPECT_EQ(reportedIpv6(state.addressesOf(2))->local.text(), "fd00::2");
}

TEST(KernelState, movesAPromotedAddressBehindThePrimaryOnes) {
    KernelState state = quietState({link(2, "eth0")});
    const Address first = address(2, "10.0.0.1/24");
    Address second = address(2, "10.0.0.2/24", IFA_F_PERMANENT | IFA_F_SECONDARY);
    const Address other = address(2, "10.9.0.1/24");
    comes(state, first);
    comes(state, second);
    comes(state, other);
    goes(state, first);
    second.flags = IFA_F_PERMANENT;
    comes(state, second);
    EXPECT_EQ(reportedIpv4(state.addressesOf(2))->local.text(), "10.9.0.1");
}

TEST(KernelState, tellsApartAddressesThatDifferInTheirPeerOnly) {
    KernelState state = quietState({link(2, "tun0")});
    Address one = address(2, "10.0.0.1/32");
    Address other = one;
    one.peer = address(2, "10.0.0.2/32").local;
    other.peer = address(2, "10.0.0.3/32").local;
    comes(state, one);
    comes(state, other);
    goes(state, one);
    EXPECT_EQ(state.addressesOf(2), KernelState::Addresses{other});
}

TEST(KernelState, hasStaleRoutesUntilTheyAreRead) {
    KernelState state;
    EXPECT_TRUE(state.routesStale(AF_INET));
    EXPECT_TRUE(state.routesStale(AF_INET6));
    state.setRoutes(AF_INET, {});
    EXPECT_FALSE(state.routesStale(AF_INET));
    EXPECT_TRUE(state.routesStale(AF_INET6));
}

TEST(KernelState, readsRoutesAgainAfterWhateverTakesThemAwaySilently) {
    const Link up = link(2, "eth0", IFF_UP);
    const Link down = link(2, "eth0", 0);
    const std::vector<std::pair<const char*, std::function<void(KernelState&)>>> causes{
        {"a default route comes", [](KernelState& state) { comes(state, route(2, "10.0.0.254", 0)); }},
        {"a default route goes", [](KernelState& state) { goes(state, route(2, "10.0.0.254", 0)); }},
        {"the link goes down", [&](KernelState& state) { comes(state, down); }},
        {"the link goes", [&](KernelState& state) { goes(state, down); }},
        {"an address goes", [](KernelState& state) { goes(state, address(2, "10.0.0.1/24")); }},
    };
    for (const auto& [name, cause] : causes) {
        KernelState state = quietState({up});
        comes(state, address(2, "10.0.0.1/24"));
        state.setRoutes(AF_INET, {route(2, "10.0.0.254", 0)});
        ASSERT_FALSE(state.routesStale(AF_INET));
        cause(state);
        EXPECT_TRUE(state.routesStale(AF_INET)) << name;
    }
}

TEST(KernelState, leavesRoutesAloneWhenAnAddressGoesThatTakesNoneWithIt) {
    KernelState state = quietState({link(2, "eth0"), link(3, "eth1")});
    for (const char* text : {"10.0.0.1/24", "10.0.0.2/32", "10.0.0.3/24"}) {
        comes(state, address(2, text));
    }
    Route sourced = route(3, "10.0.1.254", 0);
    sourced.source = ipAddress("10.0.0.2");
    state.setRoutes(AF_INET, {route(2, "10.0.0.254", 0), sourced});
    goes(state, address(2, "10.0.0.1/24"));
    EXPECT_FALSE(state.routesStale(AF_INET)) << "others stay, and no route has it as its source";
    goes(state, address(2, "10.0.0.2/32"));
    EXPECT_TRUE(state.routesStale(AF_INET)) << "another interface's route has it as its source";
    state.setRoutes(AF_INET, {route(2, "10.0.0.254", 0)});
    comes(state, address(2, "fd00::1/64"));
    goes(state, address(2, "10.0.0.3/24"));
    EXPECT_TRUE(state.routesStale(AF_INET)) << "the last of its family";
}

TEST(KernelState, leavesRoutesAloneWhenOnlyAnotherTableChanges) {
    KernelState state = quietState({link(2, "eth0")});
    Route other = route(2, "10.0.0.254", 0);
    other.table = 100;
    comes(state, other);
    comes(state, address(2, "10.0.0.1/24"));
    EXPECT_FALSE(state.routesStale(AF_INET));
}

TEST(KernelState, reportsTheInterfacesWhoseRoutesChanged) {
    KernelState state = quietState({link(2, "eth0"), link(3, "eth1")});
    state.setRoutes(AF_INET, {route(2, "10.0.0.254", 0), route(3, "10.0.1.254", 0)});
    EXPECT_EQ(state.takeChanges(), (std::set<int>{2, 3}));
    state.setRoutes(AF_INET, {route(2, "10.0.0.254", 0), route(3, "10.0.1.253", 0)});
    EXPECT_EQ(state.takeChanges(), std::set<int>{3});
    state.setRoutes(AF_INET, {route(2, "10.0.0.254", 0)});
    EXPECT_EQ(state.takeChanges(), std::set<int>{3});
}

TEST(KernelState, keepsTheRoutesOfTheOtherFamily) {
    KernelState state = quietState({link(2, "eth0")});
    state.setRoutes(AF_INET6, {route(2, "fe80::1", 1024)});
    state.setRoutes(AF_INET, {route(2, "10.0.0.254", 0)});
    EXPECT_EQ(state.routesOf(2).size(), 2U);
}

TEST(KernelState, takesEveryHopOfARoute) {
    KernelState state = quietState({link(2, "eth0"), link(3, "eth1")});
    Route both = route(2, "10.0.0.254", 0);
    both.hops.push_back(route(3, "10.0.1.254", 0).hops.front());
    state.setRoutes(AF_INET, {both});
    EXPECT_EQ(gatewayOf(state, 2)->text(), "10.0.0.254");
    EXPECT_EQ(gatewayOf(state, 3)->text(), "10.0.1.254");
}

TEST(KernelState, knowsNoGatewayFromOtherTablesOrFromRoutesThatRefuse) {
    KernelState state = quietState({link(2, "eth0")});
    Route otherTable = route(2, "10.0.0.254", 0);
    otherTable.table = RT_TABLE_LOCAL;
    Route refusing = route(2, "10.0.0.254", 0);
    refusing.type = RTN_UNREACHABLE;
    state.setRoutes(AF_INET, {otherTable, refusing});
    EXPECT_EQ(gatewayOf(state, 2), std::nullopt);
}

TEST(KernelState, watchesTheNeighboursThatDecideBetweenEqualRoutesAndNoOthers) {
    KernelState state = quietState({link(2, "eth0")});
    state.setRoutes(AF_INET, {route(2, "10.0.0.1", 0), route(2, "10.0.0.2", 0), route(2, "10.0.0.3", 9)});
    const IpAddress first = address(2, "10.0.0.1/24").local;
    const IpAddress second = address(2, "10.0.0.2/24").local;
    const IpAddress third = address(2, "10.0.0.3/24").local;
    EXPECT_EQ(state.contestedGateways(), (std::set<GatewayKey>{{2, first}, {2, second}}));
    state.takeChanges();

    comes(state, Neighbour{2, NUD_FAILED, third});
    EXPECT_TRUE(state.takeChanges().empty());
    comes(state, Neighbour{2, NUD_FAILED, first});
    EXPECT_EQ(state.takeChanges(), std::set<int>{2});
    EXPECT_EQ(gatewayOf(state, 2), second);
    comes(state, Neighbour{2, NUD_REACHABLE, first});
    EXPECT_EQ(gatewayOf(state, 2), first);
    comes(state, Neighbour{2, NUD_FAILED, first});
    goes(state, Neighbour{2, NUD_FAILED, first});
    EXPECT_EQ(gatewayOf(state, 2), first);
}

TEST(KernelState, forgetsANeighbourThatDecidesNothingAnyMore) {
    KernelState state = quietState({link(2, "eth0")});
    const std::vector<Route> equal{route(2, "10.0.0.1", 0), route(2, "10.0.0.2", 0)};
    state.setRoutes(AF_INET, equal);
    comes(state, Neighbour{2, NUD_FAILED, address(2, "10.0.0.1/24").local});
    state.setRoutes(AF_INET, {route(2, "10.0.0.1", 0)});
    EXPECT_TRUE(state.contestedGateways().empty());
    EXPECT_EQ(gatewayOf(state, 2)->text(), "10.0.0.1");
    state.setRoutes(AF_INET, equal);
    EXPECT_EQ(gatewayOf(state, 2)->text(), "10.0.0.1");
}

} // namespace
} // namespace Orv::Agent::Linux
