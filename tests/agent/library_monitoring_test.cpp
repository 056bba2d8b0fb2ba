// Monitoring as users of the agent library do it, over a described host.
#include "instrumentation/Instrumentation.h"
#include "tests/agent/Collection.h"
#include "tests/agent/TemporaryFile.h"

#include <atomic>
#include <ctime>
#include <filesystem>
#include <functional>
#include <iterator>
#include <map>
#include <numeric>
#include <thread>

#include <gmock/gmock.h>
#include <gtest/gtest.h>
#include <malloc.h>

namespace {

using namespace Orv::NodeLexicon;
using namespace std::chrono_literals;
using Orv::DateTime;
using Orv::Instrumentation;
using Orv::Test::Collection;
using Orv::Test::TemporaryFile;
using testing::ElementsAre;
using testing::StartsWith;

const TemporaryFile& treeFile() {
    static const TemporaryFile file("lab.toml", "");
    return file;
}

std::string controlPath() {
    return (treeFile().directory() / "control").string();
}

class Environment : public testing::Environment {
  public:
    void SetUp() override {
        const TemporaryFile configuration("agent.toml", "");
        ::setenv("ORV_AGENT_CONFIG", configuration.path().c_str(), 1);
        ::setenv("ORV_AGENT_TREE", treeFile().path().c_str(), 1);
        ::setenv("ORV_AGENT_CONTROL", controlPath().c_str(), 1);
        const Instrumentation first; // reads the configuration while its file is there
    }
};

const auto* const environment = testing::AddGlobalTestEnvironment(std::make_unique<Environment>().release());

std::string hostWithStatus(unsigned int status) {
    return "[[adapter]]\nidentity = \"eth0\"\ndescription = \"Uplink\"\ndevice = \"Card\"\nstatus = " +
           std::to_string(status) + "\n";
}

void command(const std::string& line) {
    std::ofstream(controlPath()) << line << std::endl;
}

struct Call {
    unsigned int code;
    DateTime time;
    std::string path;
};

/** What a callback does with each of its calls. */
struct Receiver {
    std::function<void(const Call&)> take;
    bool keepsPaths = true;
    Collection<std::string> paths;

    static void callback(unsigned int code, DateTime time, std::string path, const void* context) {
        auto* receiver = const_cast<Receiver*>(static_cast<const Receiver*>(context));
        receiver->take({code, time, path});
        if (receiver->keepsPaths) {
            receiver->paths.add(std::move(path));
        }
    }

    void start() { Instrumentation().startMonitoring(NODE_NETWORK_ADAPTER, callback, this); }

    void stop() { Instrumentation().stopMonitoring(NODE_NETWORK_ADAPTER, callback, this); }
};

unsigned int statusAt(const std::string& path) {
    Instrumentation cursor;
    cursor.selectNode(path);
    unsigned int status = 0;
    cursor.getProperty(PROP_STATUS, status);
    return status;
}

struct LibraryMonitoringTest : testing::Test {
    LibraryMonitoringTest() {
        treeFile().replace(hostWithStatus(1));
        receiver.take = [](const Call&) {};
    }

    ~LibraryMonitoringTest() override { receiver.stop(); }

    Receiver receiver;
};

TEST_F(LibraryMonitoringTest, SelectsTheNodeAsItWasAtTheEvent) {
    receiver.start();
    treeFile().replace(hostWithStatus(12));
    ASSERT_EQ(receiver.paths.await(1).size(), 1U);
    treeFile().replace(hostWithStatus(1));
    Instrumentation cursor;
    cursor.selectNode(receiver.paths.now()[0]);
    ASSERT_TRUE(cursor);
    unsigned int status = 0;
    std::string identity;
    EXPECT_TRUE(cursor.getProperty(PROP_STATUS, status));
    EXPECT_TRUE(cursor.getProperty(PROP_NODE_STRING, identity));
    EXPECT_EQ(status, 12U);
    EXPECT_EQ(identity, "eth0");
    EXPECT_EQ(cursor.getNodeDescription(), "Uplink");
    ++cursor;
    EXPECT_FALSE(cursor);
    EXPECT_EQ(statusAt(receiver.paths.await(2).at(1)), 1U);
}

TEST_F(LibraryMonitoringTest, ClimbsFromTheNodeOfAnEventThoughTheHostHasLostIt) {
    receiver.start();
    treeFile().replace("[[adapter]]\nidentity = \"eth1\"\n");
    ASSERT_EQ(receiver.paths.await(1).size(), 1U);
    Instrumentation cursor;
    cursor.selectNode(receiver.paths.now()[0]);
    unsigned int status = 0;
    cursor.getProperty(PROP_STATUS, status);
    EXPECT_EQ(status, 5U) << "an adapter that is gone is stopped";
    Instrumentation climber;
    climber.selectNode(cursor.getPathToParentNode());
    EXPECT_EQ(climber.getNodeDescription(), "Card");
    climber.selectNode(climber.getPathToParentNode());
    EXPECT_EQ(climber.getNodeDescription(), "Chassis");
}

TEST_F(LibraryMonitoringTest, TellsCodeAndLocalTime) {
    Collection<Call> calls;
    receiver.take = [&](const Call& call) { calls.add(call); };
    const time_t before = std::time(nullptr);
    receiver.start();
    command("status eth0 12");
    ASSERT_EQ(calls.await(1).size(), 1U);
    const Call call = calls.now()[0];
    EXPECT_EQ(call.code, 0U);
    tm calendar{};
    calendar.tm_year = call.time.getYear() - 1900;
    calendar.tm_mon = call.time.getMonth() - 1;
    calendar.tm_mday = call.time.getDay();
    calendar.tm_hour = call.time.getHour();
    calendar.tm_min = call.time.getMinute();
    calendar.tm_sec = call.time.getSecond();
    calendar.tm_isdst = -1;
    const time_t told = std::mktime(&calendar);
    EXPECT_GE(told, before);
    EXPECT_LE(told, std::time(nullptr));
    EXPECT_LT(call.time.getMillisecond(), 1000);
    tm local{};
    ::localtime_r(&told, &local);
    EXPECT_EQ(call.time.getOffset(), local.tm_gmtoff / 3600);
}

TEST_F(LibraryMonitoringTest, CallsOnceForEveryEventHoweverOftenItWasStarted) {
    std::atomic<int> calls{0};
    receiver.take = [&](const Call& call) {
        ++calls;
        statusAt(call.path);
    };
    receiver.start();
    receiver.start();
    command("burst eth0 100");
    EXPECT_EQ(receiver.paths.await(100).size(), 100U);
    receiver.stop();
    EXPECT_EQ(calls, 100);
    treeFile().replace(hostWithStatus(12));
    receiver.start(); // waits for a thread that still runs
    receiver.stop();
    EXPECT_EQ(calls, 100) << "one stop ends both";
}

TEST_F(LibraryMonitoringTest, KeepsABurstCompleteAndInOrderForAReceiverThatStartsAThreadForEach) {
    std::string record;
    std::mutex mutex;
    Collection<unsigned int> statuses;
    receiver.take = [&](const Call& call) {
        const std::lock_guard lock(mutex);
        record = call.path;
        std::thread([&] {
            std::string path;
            {
                const std::lock_guard threadLock(mutex);
                path = record;
            }
            statuses.add(statusAt(path));
        }).detach();
    };
    receiver.start();
    command("burst eth0 10000");
    const std::vector<unsigned int> seen = statuses.await(10000);
    ASSERT_EQ(seen.size(), 10000U);
    for (std::size_t i = 0; i < seen.size(); ++i) {
        ASSERT_EQ(seen[i], i % 2 == 0 ? 12U : 1U) << i;
    }
}

TEST_F(LibraryMonitoringTest, LeadsOldPathsToTheNodeAsItIs) {
    receiver.take = [](const Call& call) { statusAt(call.path); };
    receiver.start();
    command("status eth0 33");
    ASSERT_EQ(receiver.paths.await(1).size(), 1U);
    EXPECT_EQ(statusAt(receiver.paths.now()[0]), 33U) << "not so old yet";
    command("burst eth0 1000");
    ASSERT_EQ(receiver.paths.await(1001).size(), 1001U);
    EXPECT_EQ(statusAt(receiver.paths.now()[0]), 1U);
    EXPECT_EQ(statusAt("event/0:a:eth0"), 1U) << "one that never was";
    EXPECT_EQ(statusAt("event/1"), 0U) << "no path at all";
}

TEST_F(LibraryMonitoringTest, MayBeStoppedAndStartedFromWithinTheCallback) {
    std::atomic<int> calls{0};
    receiver.take = [&](const Call& call) {
        statusAt(call.path);
        receiver.stop();
        if (++calls == 1) {
            receiver.start();
        }
    };
    receiver.start();
    command("status eth0 12");
    EXPECT_EQ(receiver.paths.await(1).size(), 1U);
    command("burst eth0 2");
    EXPECT_EQ(receiver.paths.await(2).size(), 2U);
    receiver.stop();
    EXPECT_EQ(calls, 2);
    receiver.start(); // which joins the thread that could not join itself
    receiver.stop();
}

TEST_F(LibraryMonitoringTest, StopsWhenNoCallbackRunsAlsoForAHolderOfACursor) {
    std::atomic<bool> isRunning{false};
    std::atomic<bool> hasEnded{false};
    receiver.take = [&](const Call& call) {
        isRunning = true;
        std::this_thread::sleep_for(100ms);
        statusAt(call.path);
        hasEnded = true;
    };
    Instrumentation cursor;
    cursor.selectNode(NODE_NETWORK_ADAPTER);
    receiver.start();
    command("status eth0 12");
    while (!isRunning) {
        std::this_thread::yield();
    }
    receiver.stop();
    EXPECT_TRUE(hasEnded);
    EXPECT_TRUE(cursor);
}

std::size_t entriesOf(const char* directory) {
    const std::filesystem::directory_iterator entries(directory);
    return static_cast<std::size_t>(std::distance(begin(entries), end(entries)));
}

/** Bytes that are allocated now. Sanitizers, which keep what is freed for a while, say 0 and look for leaks
 * themselves. */
std::size_t allocatedBytes() {
    const auto information = ::mallinfo2();
    return information.uordblks + information.hblkhd;
}

constexpr std::size_t someBytes = 64UL * 1024; ///< what the process does besides

TEST_F(LibraryMonitoringTest, LeaksNothingWhenStartedAndStoppedAThousandTimes) {
    const auto cycle = [&] {
        receiver.start();
        receiver.stop();
    };
    cycle();
    const std::size_t threads = entriesOf("/proc/self/task");
    const std::size_t files = entriesOf("/proc/self/fd");
    for (int i = 0; i < 100; ++i) {
        cycle();
    }
    const std::size_t bytes = allocatedBytes();
    for (int i = 0; i < 1000; ++i) {
        cycle();
    }
    // The kernel lists a thread for a moment longer than it can be joined.
    for (int attempt = 0; attempt < 100 && entriesOf("/proc/self/task") > threads; ++attempt) {
        std::this_thread::sleep_for(10ms);
    }
    EXPECT_LE(entriesOf("/proc/self/task"), threads);
    EXPECT_EQ(entriesOf("/proc/self/fd"), files);
    EXPECT_LE(allocatedBytes(), bytes + someBytes);
}

TEST_F(LibraryMonitoringTest, StaysFlatHoweverManyEventsGoThrough) {
    std::atomic<std::size_t> count{0};
    receiver.keepsPaths = false;
    receiver.take = [&](const Call& call) {
        statusAt(call.path);
        ++count;
    };
    receiver.start();
    const auto burst = [&] {
        count = 0;
        command("burst eth0 1000");
        while (count < 1000) {
            std::this_thread::sleep_for(1ms);
        }
    };
    burst();
    const std::size_t bytes = allocatedBytes();
    for (int i = 0; i < 50; ++i) {
        burst();
    }
    EXPECT_LE(allocatedBytes(), bytes + someBytes);
}

} // namespace
