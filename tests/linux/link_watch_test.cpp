// From what happens in a kernel to events, read when the test says so.
#include "agent/linux/KernelReader.h"
#include "agent/linux/LinkEvents.h"
#include "agent/linux/LinuxBackEnd.h"
#include "tests/linux/EventRecorder.h"
#include "tests/linux/NoHardware.h"
#include "tests/linux/TemporaryHost.h"
#include "tests/linux/TreeReading.h"
#include "tests/support/Namespace.h"

#include <map>
#include <memory>
#include <optional>
#include <string>
#include <vector>

#include <gmock/gmock.h>
#include <gtest/gtest.h>

namespace Orv::Agent::Linux {
namespace {

using namespace NodeLexicon;
using namespace Orv::Test;
using testing::ElementsAre;

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
    EventRecorder recorder;
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

    /** The status that each event so far came with, by the adapters' names. */
    std::map<std::string, std::vector<unsigned>> takeStatuses() {
        std::map<std::string, std::vector<unsigned>> statuses;
        for (const Seen& seen : recorder.take()) {
            statuses[seen.name].push_back(seen.status);
        }
        return statuses;
    }

    static constexpr int pairs = 200;

    TemporaryHost host;
    std::unique_ptr<Namespace> space;
    std::unique_ptr<KernelReader> reader;
    HostConfiguration configuration{host.root()};
    HostTree tree{noHardware()};
    EventRecorder recorder;
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
    const auto statuses = takeStatuses();
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
    const auto statuses = takeStatuses();
    EXPECT_EQ(statuses.size(), 2U * pairs);
    for (const auto& [name, list] : statuses) {
        EXPECT_EQ(list.back(), 5U) << name;
    }
}

} // namespace
} // namespace Orv::Agent::Linux
