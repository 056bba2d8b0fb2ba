// From the kernel's messages to events, without a kernel and with one.
#include "agent/events/Differences.h"
#include "agent/linux/KernelReader.h"
#include "agent/linux/LinkEvents.h"
#include "agent/linux/LinuxBackEnd.h"
#include "tests/linux/Facts.h"
#include "tests/linux/NoHardware.h"
#include "tests/linux/TemporaryHost.h"
#include "tests/linux/TreeReading.h"
#include "tests/support/Namespace.h"

#include <map>
#include <ostream>

#include <gmock/gmock.h>
#include <gtest/gtest.h>

namespace Orv::Agent::Linux {
namespace {

using namespace NodeLexicon;
using namespace Orv::Test;
using testing::ElementsAre;

struct Seen {
    std::string name;
    EventCode code;
    unsigned status;

    bool operator==(const Seen&) const = default;

    friend std::ostream& operator<<(std::ostream& out, const Seen& seen) {
        return out << seen.name << ' ' << static_cast<unsigned>(seen.code) << ' ' << seen.status;
    }
};

Seen statusOfAdapter(const std::string& name, unsigned status) {
    return {name, EventCode::status, status};
}

class Recorder : public EventSink {
  public:
    void post(Event event) override {
        seen.push_back({event.node->description, event.code, Agent::statusOf(*event.node).value_or(0)});
        events.push_back(std::move(event));
    }

    void report(const std::string& text) override { ADD_FAILURE() << text; }

    std::vector<Seen> take() {
        events.clear();
        return std::exchange(seen, {});
    }

    std::vector<Seen> seen;
    std::vector<Event> events;
};

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
    Recorder recorder;
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

/** A back end in a namespace, watched without a thread: nothing is read until a test says so. */
struct WatchTest : testing::Test {
    void SetUp() override {
        REQUIRE_NAMESPACES();
        space = std::make_unique<Namespace>();
        space->shell("echo 1 > /proc/sys/net/ipv6/conf/default/disable_ipv6");
        space->run([&] { backEnd = makeLinuxBackEnd({host.root()}); });
        space->ipBatch("link add left type veth peer name right\nlink set left up\nlink set right up\n");
        awaited(1U, [&] { return numberOf(*backEnd->snapshot(), "left", PROP_STATUS); });
        awaited(1U, [&] { return numberOf(*backEnd->snapshot(), "right", PROP_STATUS); });
        watch = backEnd->watch(recorder);
    }

    /** What the kernel says until the adapter's status is this. */
    void settle(const std::string& name, const std::string& state) {
        awaited(true, [&] { return space->ip("-o link show " + name).find("state " + state) != std::string::npos; });
    }

    TemporaryHost host;
    std::unique_ptr<Namespace> space;
    std::unique_ptr<BackEnd> backEnd;
    Recorder recorder;
    std::unique_ptr<EventWatch> watch;
};

TEST_F(WatchTest, reportsAFlapThatIsOverBeforeItIsRead) {
    space->ip("link set right down");
    settle("left", "LOWERLAYERDOWN");
    space->ip("link set right up");
    settle("left", "UP");
    watch->collect();
    std::map<std::string, std::vector<unsigned>> statuses;
    for (const Seen& seen : recorder.take()) {
        if (seen.code == EventCode::status) {
            statuses[seen.name].push_back(seen.status);
        }
    }
    EXPECT_THAT(statuses["left"], ElementsAre(12, 1));
    EXPECT_EQ(statuses["right"].front(), 5U);
    EXPECT_EQ(statuses["right"].back(), 1U);
    watch->collect();
    EXPECT_THAT(recorder.take(), ElementsAre());
}

TEST_F(WatchTest, reportsWhatAReaderOfTheTreeFindsFirst) {
    space->ip("link set right down");
    settle("left", "LOWERLAYERDOWN");
    EXPECT_EQ(numberOf(*backEnd->snapshot(), "left", PROP_STATUS), 12U);
    EXPECT_THAT(recorder.take(),
                testing::UnorderedElementsAre(statusOfAdapter("right", 5), statusOfAdapter("left", 12)));
    watch->collect();
    EXPECT_THAT(recorder.take(), ElementsAre());
}

TEST_F(WatchTest, leavesTheTreeToItsReaders) {
    space->ip("link set right down");
    settle("left", "LOWERLAYERDOWN");
    watch->collect();
    EXPECT_EQ(numberOf(*backEnd->snapshot(), "left", PROP_STATUS), 12U) << "what the watch has read is in the tree";
    watch.reset();
    recorder.take();
    space->ip("link set left down");
    EXPECT_EQ(numberOf(*backEnd->snapshot(), "left", PROP_STATUS), 5U);
    EXPECT_THAT(recorder.take(), ElementsAre()) << "the watch has ended";
}

/** A reader with the smallest queue there is, and the events that come of it. */
struct OverrunTest : testing::Test {
    void SetUp() override {
        REQUIRE_NAMESPACES();
        space = std::make_unique<Namespace>();
        space->shell("echo 1 > /proc/sys/net/ipv6/conf/default/disable_ipv6");
        std::string lines;
        for (int pair = 0; pair < pairs; ++pair) {
            const std::string number = std::to_string(pair);
            lines += "link add a" + number + " type veth peer name b" + number + "\nlink set a" + number +
                     " up\nlink set b" + number + " up\n";
        }
        space->ipBatch(lines);
        awaited(true, [&] {
            const std::string shown = space->ip("-o link show");
            return shown.find("LOWERLAYERDOWN") == std::string::npos && shown.find("NO-CARRIER") == std::string::npos;
        });
        space->run([&] { reader = std::make_unique<KernelReader>(1); });
        configuration.refresh();
        reader->update();
        tree.update(reader->state(), configuration, reader->takeChanges());
        events.emplace(tree, recorder, reader->state());
        reader->onStep(
            [this](const KernelState& state) { events->take(state, configuration, reader->takeChanges()); });
    }

    /** `command` for each pair. */
    void forEachPair(const std::string& command) {
        std::string lines;
        for (int pair = 0; pair < pairs; ++pair) {
            lines += "link " + command + " a" + std::to_string(pair) + (command == "set" ? " down\n" : "\n");
        }
        space->ipBatch(lines);
    }

    static constexpr int pairs = 200;

    TemporaryHost host;
    std::unique_ptr<Namespace> space;
    std::unique_ptr<KernelReader> reader;
    HostConfiguration configuration{host.root()};
    HostTree tree{noHardware()};
    Recorder recorder;
    std::optional<LinkEvents> events;
};

TEST_F(OverrunTest, reportsOnceAndInOrderWhatChangedMeanwhile) {
    const unsigned reads = reader->fullReads();
    forEachPair("set");
    awaited(true, [&] {
        reader->follow();
        return recorder.seen.size() >= 2U * pairs;
    });
    EXPECT_GT(reader->fullReads(), reads) << "nothing was lost";
    std::map<std::string, std::vector<unsigned>> statuses;
    for (const Seen& seen : recorder.take()) {
        statuses[seen.name].push_back(seen.status);
    }
    EXPECT_EQ(statuses.size(), 2U * pairs);
    for (const auto& [name, list] : statuses) {
        EXPECT_THAT(list, ElementsAre(name[0] == 'a' ? 5U : 12U)) << name;
    }
}

TEST_F(OverrunTest, reportsInterfacesThatVanishedMeanwhile) {
    const unsigned reads = reader->fullReads();
    forEachPair("del");
    reader->follow();
    EXPECT_GT(reader->fullReads(), reads) << "nothing was lost";
    std::map<std::string, std::vector<unsigned>> statuses;
    for (const Seen& seen : recorder.take()) {
        statuses[seen.name].push_back(seen.status);
    }
    EXPECT_EQ(statuses.size(), 2U * pairs);
    for (const auto& [name, list] : statuses) {
        EXPECT_EQ(list.back(), 5U) << name;
    }
}

} // namespace
} // namespace Orv::Agent::Linux
