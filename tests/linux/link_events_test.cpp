// From the kernel's messages to events, without a kernel.
#include "agent/linux/LinkEvents.h"
#include "tests/linux/EventRecorder.h"
#include "tests/linux/Facts.h"
#include "tests/linux/NoHardware.h"
#include "tests/linux/TemporaryHost.h"

#include <map>
#include <optional>
#include <vector>

#include <gmock/gmock.h>
#include <gtest/gtest.h>

namespace Orv::Agent::Linux {
namespace {

using namespace NodeLexicon;
using namespace Orv::Test;
using testing::ElementsAre;

/** A state that a test changes link by link. */
struct LinkEventsTest : testing::Test {
    void begin(const std::vector<Link>& links) {
        for (const Link& known : links) {
            state.apply(Change<Link>{known, false});
        }
        configuration.refresh();
        tree.update(state, configuration, state.takeChanges());
        events.emplace(tree, recorder, state);
    }

    std::vector<Seen> after(const Message& message) {
        state.apply(message);
        events->take(state, configuration, state.takeChanges());
        return recorder.take();
    }

    std::vector<Seen> comes(const Link& fresh) { return after(Change<Link>{fresh, false}); }

    std::vector<Seen> goes(int index) { return after(Change<Link>{link(index, ""), true}); }

    TemporaryHost host;
    HostConfiguration configuration{host.root()};
    KernelState state;
    HostTree tree{noHardware()};
    EventRecorder recorder;
    std::optional<LinkEvents> events;
};

constexpr unsigned upAndRunning = IFF_UP | IFF_LOWER_UP;

TEST_F(LinkEventsTest, areTheStatusesOneAfterTheOther) {
    begin({link(2, "eth0")});
    EXPECT_THAT(comes(link(2, "eth0", IFF_UP, IF_OPER_DOWN)), ElementsAre(statusOfAdapter("eth0", 12)));
    EXPECT_THAT(comes(link(2, "eth0", IFF_UP, IF_OPER_LOWERLAYERDOWN)), ElementsAre());
    EXPECT_THAT(comes(link(2, "eth0")), ElementsAre(statusOfAdapter("eth0", 1)));
    EXPECT_THAT(comes(link(2, "eth0", 0, IF_OPER_DOWN)), ElementsAre(statusOfAdapter("eth0", 5)));
}

TEST_F(LinkEventsTest, areNoneOfTheLoopback) {
    Link loopback = link(1, "lo");
    loopback.hardwareType = ARPHRD_LOOPBACK;
    begin({loopback});
    loopback.flags = 0;
    EXPECT_THAT(comes(loopback), ElementsAre());
    EXPECT_THAT(goes(1), ElementsAre());
}

TEST_F(LinkEventsTest, tellOfInterfacesThatComeAndGoWhereTheyRun) {
    begin({});
    EXPECT_THAT(comes(link(2, "eth0")), ElementsAre(statusOfAdapter("eth0", 1)));
    EXPECT_THAT(comes(link(3, "eth1", 0, IF_OPER_DOWN)), ElementsAre());
    EXPECT_THAT(goes(2), ElementsAre(statusOfAdapter("eth0", 5)));
    EXPECT_THAT(goes(3), ElementsAre());
}

TEST_F(LinkEventsTest, tellOfNamesAndAddresses) {
    begin({link(2, "eth0")});
    EXPECT_THAT(comes(link(2, "lan0")), ElementsAre(Seen{"lan0", EventCode::name, 1}));
    EXPECT_THAT(after(Change<Address>{address(2, "192.0.2.10/24"), false}),
                ElementsAre(Seen{"lan0", EventCode::address, 1}));
    EXPECT_THAT(after(Change<Address>{address(2, "192.0.2.11/24"), false}), ElementsAre())
        << "not the address that is reported";
    Link changed = link(2, "lan0", IFF_UP, IF_OPER_DOWN);
    changed.address = {2, 0, 0, 0, 0, 1};
    EXPECT_THAT(comes(changed), ElementsAre(statusOfAdapter("lan0", 12), Seen{"lan0", EventCode::address, 12}));
}

TEST_F(LinkEventsTest, carryTheNodeAsItWasAndWhatIsAboveIt) {
    begin({link(2, "eth0")});
    state.apply(Change<Link>{link(2, "eth0", IFF_UP, IF_OPER_DOWN), false});
    events->take(state, configuration, state.takeChanges());
    ASSERT_EQ(recorder.events.size(), 1U);
    const Event& event = recorder.events[0];
    ASSERT_EQ(event.ancestors.size(), 3U);
    EXPECT_EQ(event.ancestors[0]->path, event.node->parentPath);
    EXPECT_EQ(event.ancestors[1]->path, event.ancestors[0]->parentPath);
    EXPECT_EQ(event.ancestors[1]->description, "Chassis");
    EXPECT_EQ(event.ancestors[2]->path, event.ancestors[1]->parentPath);
    EXPECT_EQ(event.ancestors[2]->parentPath, "");
}

Link bond(int active, int primary, std::uint8_t operationalState = IF_OPER_UP) {
    Link made = link(9, "bond0", upAndRunning, operationalState);
    made.kind = "bond";
    made.activeMember = active;
    made.primaryMember = primary;
    return made;
}

TEST_F(LinkEventsTest, tellOfABondThatMovesOffItsPrimaryAndBack) {
    begin({link(2, "eth0"), link(3, "eth1"), bond(2, 2)});
    EXPECT_THAT(comes(bond(3, 2)), ElementsAre(statusOfAdapter("bond0", 32)));
    EXPECT_EQ(Agent::statusOf(*tree.adapter(9)), 1U) << "it works all the time";
    EXPECT_THAT(comes(bond(3, 2)), ElementsAre());
    EXPECT_THAT(comes(bond(2, 2)), ElementsAre(statusOfAdapter("bond0", 33)));
}

TEST_F(LinkEventsTest, tellOfEveryMoveToABackup) {
    begin({bond(2, 2)});
    EXPECT_THAT(comes(bond(3, 2)), ElementsAre(statusOfAdapter("bond0", 32)));
    EXPECT_THAT(comes(bond(4, 2)), ElementsAre(statusOfAdapter("bond0", 32)));
}

TEST_F(LinkEventsTest, knowNoWayBackForABondWithoutAPrimary) {
    begin({bond(2, 0)});
    EXPECT_THAT(comes(bond(3, 0)), ElementsAre(statusOfAdapter("bond0", 32)));
    EXPECT_THAT(comes(bond(2, 0)), ElementsAre(statusOfAdapter("bond0", 32)));
}

TEST_F(LinkEventsTest, tellOfABondThatWasDownOnItsWay) {
    begin({bond(2, 2)});
    EXPECT_THAT(comes(bond(0, 2, IF_OPER_DOWN)), ElementsAre(statusOfAdapter("bond0", 12)));
    EXPECT_THAT(comes(bond(3, 2)), ElementsAre(statusOfAdapter("bond0", 1), statusOfAdapter("bond0", 32)));
    EXPECT_THAT(comes(bond(0, 2, IF_OPER_DOWN)), ElementsAre(statusOfAdapter("bond0", 12)));
    EXPECT_THAT(comes(bond(3, 2)), ElementsAre(statusOfAdapter("bond0", 1))) << "where it was";
}

TEST_F(LinkEventsTest, tellNothingOfTheFirstMemberAndOfAnotherPrimary) {
    begin({bond(0, 0)});
    EXPECT_THAT(comes(bond(3, 2)), ElementsAre());
    EXPECT_THAT(comes(bond(3, 3)), ElementsAre());
    EXPECT_THAT(comes(bond(3, 0)), ElementsAre());
}

TEST_F(LinkEventsTest, forgetABondThatIsGone) {
    begin({bond(2, 2)});
    EXPECT_THAT(goes(9), ElementsAre(statusOfAdapter("bond0", 5)));
    EXPECT_THAT(comes(bond(3, 2)), ElementsAre(statusOfAdapter("bond0", 1)));
}

TEST_F(LinkEventsTest, tellOfABondThatMovesToAPrimaryThatIsAnotherByThen) {
    begin({bond(2, 2)});
    EXPECT_THAT(comes(bond(3, 3)), ElementsAre(statusOfAdapter("bond0", 33)));
}

/** A team of ports with these priorities, of which the first carries it. */
struct TeamEventsTest : LinkEventsTest {
    void beginWith(const std::map<int, int>& priorities) {
        Link team = link(9, "team0");
        team.kind = "team";
        state.apply(Change<Link>{team, false});
        TeamOptions options{9, priorities.begin()->first, {}};
        for (const auto& [port, priority] : priorities) {
            options.priorities[port] = priority;
        }
        state.apply(options);
        begin({});
    }

    std::vector<Seen> moves(int port) { return after(TeamOptions{9, port, {}}); }

    const Seen switchOver = statusOfAdapter("team0", 32);
    const Seen switchBack = statusOfAdapter("team0", 33);
};

TEST_F(TeamEventsTest, tellOfATeamThatMovesOffItsPreferredPortAndBack) {
    beginWith({{2, 100}, {3, 10}});
    EXPECT_THAT(moves(3), ElementsAre(switchOver));
    EXPECT_EQ(Agent::statusOf(*tree.adapter(9)), 1U) << "it works all the time";
    EXPECT_THAT(moves(3), ElementsAre());
    EXPECT_THAT(moves(2), ElementsAre(switchBack));
}

TEST_F(TeamEventsTest, tellOfEveryMoveToABackup) {
    beginWith({{2, 100}, {3, 10}, {4, 0}});
    EXPECT_THAT(moves(3), ElementsAre(switchOver));
    EXPECT_THAT(moves(4), ElementsAre(switchOver));
    EXPECT_THAT(moves(3), ElementsAre(switchOver)) << "better than the last, but not the best";
    EXPECT_THAT(moves(2), ElementsAre(switchBack));
}

TEST_F(TeamEventsTest, knowNoWayBackAmongEqualPorts) {
    beginWith({{2, 0}, {3, 0}});
    EXPECT_THAT(moves(3), ElementsAre(switchOver));
    EXPECT_THAT(moves(2), ElementsAre(switchOver));
}

TEST_F(TeamEventsTest, tellOfTheReturnToAnyOfTheBest) {
    beginWith({{2, 100}, {3, 100}, {4, 10}});
    EXPECT_THAT(moves(3), ElementsAre(switchOver));
    EXPECT_THAT(moves(4), ElementsAre(switchOver));
    EXPECT_THAT(moves(3), ElementsAre(switchBack));
}

TEST_F(TeamEventsTest, tellOfAMoveAwayFromAPortThatIsTakenAway) {
    beginWith({{2, 0}, {3, 0}});
    EXPECT_THAT(after(TeamOptions{9, 0, {{2, std::nullopt}}}), ElementsAre());
    EXPECT_THAT(moves(3), ElementsAre(switchOver)) << "the port that is left was not preferred to the other";
}

TEST_F(TeamEventsTest, goByThePrioritiesAsTheyAreAtTheMove) {
    beginWith({{2, 100}, {3, 10}});
    EXPECT_THAT(after(TeamOptions{9, std::nullopt, {{3, 200}}}), ElementsAre());
    EXPECT_THAT(moves(3), ElementsAre(switchBack));
    EXPECT_THAT(moves(2), ElementsAre(switchOver));
}

TEST_F(TeamEventsTest, tellNothingOfTheFirstPortAndOfTeamsWithoutAnActiveOne) {
    beginWith({{2, 100}, {3, 10}});
    EXPECT_THAT(goes(9), ElementsAre(statusOfAdapter("team0", 5)));
    Link team = link(9, "team0");
    team.kind = "team";
    EXPECT_THAT(comes(team), ElementsAre(statusOfAdapter("team0", 1)));
    EXPECT_THAT(after(TeamOptions{9, 3, {{3, 10}, {2, 100}}}), ElementsAre());
    EXPECT_THAT(moves(0), ElementsAre()) << "it has left the mode that has one";
    EXPECT_THAT(moves(3), ElementsAre()) << "where it was last";
}

} // namespace
} // namespace Orv::Agent::Linux
