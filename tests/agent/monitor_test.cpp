// The monitor over a back end whose events the test posts.
#include "agent/events/Monitor.h"
#include "tests/agent/EventReader.h"
#include "tests/agent/EventfulBackEnd.h"

#include <atomic>
#include <filesystem>
#include <fstream>
#include <stdexcept>

#include <gmock/gmock.h>
#include <gtest/gtest.h>

namespace {

using namespace Orv::Agent;
using namespace Orv::NodeLexicon;
using namespace std::chrono_literals;
using Orv::Test::Collection;
using Orv::Test::EventfulBackEnd;
using Orv::Test::EventReader;
using Orv::Test::readEvent;
using Orv::Test::SeenEvent;
using testing::ElementsAre;

struct MonitorTest : testing::Test {
    [[nodiscard]] Monitor::Key key(std::uintptr_t callback = 1, NodeType type = NODE_NETWORK_ADAPTER) const {
        return {type, callback, this};
    }

    /** A callback that reads its event at once. */
    Monitor::Callback reading(Collection<SeenEvent>& events) {
        return
            [&](const Handover::Delivery& delivery) { events.add(readEvent(backEnd, delivery.code, delivery.path)); };
    }

    Collection<std::string> reports;
    EventfulBackEnd backEnd;
    Collection<SeenEvent> seen;
    Monitor monitor{backEnd,
                    [this](int level, const std::string& text) { reports.add(std::to_string(level) + ' ' + text); }};
};

TEST_F(MonitorTest, HandsOverTenThousandEventsToAReceiverWithRoomForOne) {
    EventReader reader(backEnd, monitor);
    std::vector<SeenEvent> expected;
    for (unsigned int i = 0; i < 10000; ++i) {
        const std::string name = "eth" + std::to_string(i % 7);
        backEnd.postStatus(name, i);
        expected.push_back({name, i, EventCode::status});
    }
    EXPECT_EQ(reader.seen.await(expected.size()), expected);
    EXPECT_THAT(reports.now(), ElementsAre());
}

TEST_F(MonitorTest, WatchesTheBackEndAsLongAsSomebodyHasSubscribed) {
    EXPECT_FALSE(backEnd.isWatched());
    monitor.start(key(1), reading(seen));
    EXPECT_TRUE(backEnd.isWatched());
    monitor.start(key(2), reading(seen));
    monitor.stop(key(1));
    EXPECT_TRUE(backEnd.isWatched());
    monitor.stop(key(2));
    EXPECT_FALSE(backEnd.isWatched());
    monitor.stop(key(2));
    monitor.start(key(1), reading(seen));
    backEnd.postStatus("eth0", 12);
    EXPECT_THAT(seen.await(1), ElementsAre(SeenEvent{"eth0", 12, EventCode::status}));
}

TEST_F(MonitorTest, GivesEachSubscriberEveryEventOfItsType) {
    Collection<SeenEvent> others;
    Collection<SeenEvent> ports;
    monitor.start(key(1), reading(seen));
    monitor.start(key(2), reading(others));
    monitor.start(key(1, NODE_NETWORK_PORT), reading(ports));
    monitor.start(key(1), reading(seen));
    for (unsigned int i = 0; i < 100; ++i) {
        backEnd.postStatus("eth0", i);
    }
    EXPECT_EQ(seen.await(100).size(), 100U);
    EXPECT_EQ(others.await(100), seen.now());
    EXPECT_THAT(ports.now(), ElementsAre());
}

TEST_F(MonitorTest, LetsNoSubscriberWaitForAnother) {
    monitor.start(key(1), [](const Handover::Delivery&) {}); // picks nothing up
    monitor.start(key(2), reading(seen));
    const auto start = std::chrono::steady_clock::now();
    for (unsigned int i = 0; i < 100; ++i) {
        backEnd.postStatus("eth0", i);
    }
    EXPECT_EQ(seen.await(100).size(), 100U);
    EXPECT_LT(std::chrono::steady_clock::now() - start, HandoverTimes().whole);
}

TEST_F(MonitorTest, LogsWhatACallbackThrowsAndGoesOn) {
    monitor.start(key(), [&](const Handover::Delivery& delivery) {
        const SeenEvent event = readEvent(backEnd, delivery.code, delivery.path);
        seen.add(event);
        if (event.status == 1) {
            throw std::runtime_error("enough");
        }
        throw event.status;
    });
    backEnd.postStatus("eth0", 1);
    backEnd.postStatus("eth0", 2);
    EXPECT_EQ(seen.await(2).size(), 2U);
    EXPECT_THAT(reports.await(2), ElementsAre("6000 an exception left a monitoring callback: enough",
                                              "6000 an exception of unknown type left a monitoring callback"));
}

TEST_F(MonitorTest, PassesOnThatTheBackEndCannotBeWatched) {
    backEnd.refuses = true;
    EXPECT_THROW(monitor.start(key(), reading(seen)), std::runtime_error);
    backEnd.refuses = false;
    monitor.start(key(), reading(seen));
    backEnd.postStatus("eth0", 1);
    EXPECT_EQ(seen.await(1).size(), 1U);
}

TEST_F(MonitorTest, AsksABackEndAgainThatCouldNotCollectAndComplainsOnce) {
    backEnd.failures = 2;
    monitor.start(key(), reading(seen));
    for (int attempt = 0; attempt < 500 && backEnd.failures > 0; ++attempt) {
        std::this_thread::sleep_for(10ms);
    }
    EXPECT_EQ(backEnd.failures, 0);
    EXPECT_THAT(reports.now(), ElementsAre("6000 events cannot be collected: nothing can be collected"));
}

TEST_F(MonitorTest, ForgetsWhatWasNotHandedOverWhenASubscriptionEnds) {
    Collection<int> calls;
    monitor.start(key(), [&](const Handover::Delivery&) { calls.add(1); });
    backEnd.postStatus("eth0", 1);
    backEnd.postStatus("eth0", 2);
    calls.await(1);
    monitor.stop(key());
    monitor.start(key(), reading(seen));
    backEnd.postStatus("eth0", 3);
    EXPECT_THAT(seen.await(1), ElementsAre(SeenEvent{"eth0", 3, EventCode::status}));
    EXPECT_EQ(calls.now().size(), 1U);
}

TEST_F(MonitorTest, MayBeStoppedByTheCallbackAndByAnotherThreadAtTheSameTime) {
    std::atomic<bool> isRunning{false};
    monitor.start(key(), [&](const Handover::Delivery&) {
        isRunning = true;
        std::this_thread::sleep_for(50ms); // the other stop is waiting by now
        monitor.stop(key());
        isRunning = false;
    });
    backEnd.postStatus("eth0", 1);
    while (!isRunning) {
        std::this_thread::yield();
    }
    monitor.stop(key());
    EXPECT_FALSE(isRunning);
    EXPECT_FALSE(backEnd.isWatched());
}

TEST_F(MonitorTest, TakesStartsAndStopsFromManyThreadsWhileEventsCome) {
    std::atomic<bool> isDone{false};
    std::thread poster([&] {
        while (!isDone) {
            backEnd.postStatus("eth0", 1);
            std::this_thread::yield();
        }
    });
    std::vector<std::thread> threads;
    std::atomic<int> running{0};
    for (std::uintptr_t id = 1; id <= 4; ++id) {
        threads.emplace_back([&, id] {
            for (int i = 0; i < 200; ++i) {
                std::atomic<bool> isStarted{true};
                monitor.start(key(id), [&](const Handover::Delivery& delivery) {
                    EXPECT_TRUE(isStarted);
                    EXPECT_EQ(++running, 1) << "one call at a time";
                    readEvent(backEnd, delivery.code, delivery.path);
                    --running;
                });
                monitor.stop(key(id));
                isStarted = false;
            }
        });
    }
    for (std::thread& thread : threads) {
        thread.join();
    }
    isDone = true;
    poster.join();
    EXPECT_FALSE(backEnd.isWatched());
}

/** How often a thread of this process, by its name, has gone to sleep. */
long sleepsOf(const std::string& name) {
    for (const auto& task : std::filesystem::directory_iterator("/proc/self/task")) {
        std::string known;
        std::getline(std::ifstream(task.path() / "comm") >> std::ws, known);
        if (known != name) {
            continue;
        }
        std::ifstream status(task.path() / "status");
        for (std::string line; std::getline(status, line);) {
            if (line.starts_with("voluntary_ctxt_switches:")) {
                return std::stol(line.substr(line.find(':') + 1));
            }
        }
    }
    return -1;
}

TEST_F(MonitorTest, SleepsWhileNothingHappens) {
    EventReader reader(backEnd, monitor);
    backEnd.postStatus("eth0", 1);
    reader.seen.await(1);
    std::this_thread::sleep_for(300ms); // longer than any of the waits around the one event
    const long sleeps = sleepsOf("orv-monitor");
    ASSERT_GE(sleeps, 0);
    std::this_thread::sleep_for(1s);
    EXPECT_EQ(sleepsOf("orv-monitor"), sleeps);
}

} // namespace
