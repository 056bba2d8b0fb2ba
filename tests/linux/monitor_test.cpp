#include "tests/linux/MonitorFixture.h"

#include <algorithm>
#include <atomic>
#include <filesystem>
#include <iterator>
#include <thread>

#include <gmock/gmock.h>
#include <gtest/gtest.h>

namespace Orv::Agent::Linux {
namespace {

using namespace NodeLexicon;
using namespace Orv::Test;
using testing::Each;

class LinuxMonitorTest : public MonitorFixture {
  protected:
    void startWithAPair() {
        addPair();
        expectStatus("left", 1);
        expectStatus("right", 1);
        startMonitoring();
    }
};

TEST_F(LinuxMonitorTest, reportsALostCarrierAndItsReturn) {
    startWithAPair();
    space->ip("link set right down");
    expectEvents("left", {12});
    expectEvents("right", {5});
    space->ip("link set right up");
    expectEvents("left", {12, 1});
    expectAgreementWithIpMonitor();
}

TEST_F(LinuxMonitorTest, reportsAnAdapterThatIsStoppedAndStarted) {
    startWithAPair();
    space->ip("link set left down");
    expectEvents("left", {5});
    space->ip("link set left up");
    expectStatus("left", 1);
    expectAgreementWithIpMonitor();
    EXPECT_EQ(statusesOf("left").back(), 1U);
}

TEST_F(LinuxMonitorTest, reportsAnInterfaceThatComesUpAndGoes) {
    startMonitoring();
    addPair();
    expectStatus("left", 1);
    expectStatus("right", 1);
    expectAgreementWithIpMonitor();
    EXPECT_EQ(statusesOf("left").back(), 1U);
    space->ip("link del left");
    expectAgreementWithIpMonitor();
    EXPECT_EQ(statusesOf("left").back(), 5U);
    EXPECT_EQ(statusesOf("right").back(), 5U) << "the other end goes with it";
}

TEST_F(LinuxMonitorTest, saysNothingOfAnInterfaceThatComesAndGoesDown) {
    startMonitoring();
    space->ip("link add left type veth peer name right");
    space->ip("link del left");
    EXPECT_EQ(expectAgreementWithIpMonitor(), 0U);
}

TEST_F(LinuxMonitorTest, reportsARenameUnderTheNewNameAndWithAnotherCode) {
    startWithAPair();
    space->ip("link set left down");
    space->ip("link set left name wrong");
    space->ip("link set wrong name uplink");
    expectEvents("left", {5});
    const auto renames = [&] {
        const auto codes = reader->ignored.now(); // addresses that the link takes with it are among them
        return std::count(codes.begin(), codes.end(), EventCode::name);
    };
    EXPECT_EQ(awaited(std::ptrdiff_t{2}, renames), 2);
    space->ip("link set uplink up");
    expectStatus("uplink", 1);
    expectAgreementWithIpMonitor();
    EXPECT_EQ(statusesOf("uplink").back(), 1U);
}

TEST_F(LinuxMonitorTest, reportsAddressesWithAnotherCode) {
    startWithAPair();
    space->ip("addr add 192.0.2.10/24 dev left");
    EXPECT_THAT(reader->ignored.await(1), Each(EventCode::address));
    const std::size_t count = reader->ignored.now().size();
    space->ip("link set right address 02:00:00:00:00:0b");
    EXPECT_GT(reader->ignored.await(count + 1).size(), count);
    EXPECT_EQ(expectAgreementWithIpMonitor(), 0U);
}

TEST_F(LinuxMonitorTest, reportsAnInterfaceThatMovesAwayAsStopped) {
    startWithAPair();
    const Namespace there;
    space->ip("link set left netns " + there.descriptorPath());
    expectStatus("right", 12);
    expectAgreementWithIpMonitor();
    EXPECT_EQ(statusesOf("left").back(), 5U);
    EXPECT_EQ(statusesOf("right").back(), 12U);
    there.ip("link set left netns " + space->descriptorPath());
    space->ip("link set left up");
    expectStatus("left", 1);
    expectAgreementWithIpMonitor();
    EXPECT_EQ(statusesOf("left").back(), 1U);
}

TEST_F(LinuxMonitorTest, showsTheHostAboveAnAdapterThatIsGone) {
    startWithAPair();
    Collection<std::string> paths;
    const Monitor::Key key{NODE_NETWORK_ADAPTER, 2, this};
    monitor->start(key, [&](const Handover::Delivery& delivery) {
        if (delivery.code == EventCode::status) {
            Cursor cursor(*backEnd);
            cursor.select(delivery.path);
            cursor.select(cursor.parentPath());
            paths.add(cursor.node() == nullptr ? "" : cursor.node()->description);
            cursor.select(cursor.parentPath());
            paths.add(cursor.node() == nullptr ? "" : cursor.node()->description);
        }
    });
    space->ip("link del left");
    EXPECT_THAT(paths.await(4), Each(testing::AnyOf("veth", "Chassis")));
    monitor->stop(key);
}

TEST_F(LinuxMonitorTest, followsFiveHundredInterfacesThatFlapAtOnce) {
    std::string make;
    std::string down;
    std::string up;
    for (int pair = 0; pair < 250; ++pair) {
        const std::string number = std::to_string(pair);
        make += "link add a" + number + " type veth peer name b" + number + "\n";
        up += "link set a" + number + " up\nlink set b" + number + " up\n";
        down += "link set a" + number + " down\n";
    }
    space->ipBatch(make);
    space->ipBatch(up);
    expectStatus("b249", 1);
    startMonitoring();
    for (int round = 0; round < 3; ++round) {
        space->ipBatch(down + up);
    }
    expectStatus("a249", 1);
    expectStatus("b249", 1);
    EXPECT_GE(expectAgreementWithIpMonitor(), 3U * 500 * 2);
}

TEST_F(LinuxMonitorTest, followsTenThousandEventsInOneBurst) {
    startWithAPair();
    std::string flaps;
    for (int i = 0; i < 5000; ++i) {
        flaps += "link set right down\nlink set right up\n";
    }
    space->ipBatch(flaps);
    expectStatus("left", 1);
    EXPECT_GE(expectAgreementWithIpMonitor(), 10000U);
}

TEST_F(LinuxMonitorTest, followsWhileOthersReadTheTree) {
    startWithAPair();
    std::atomic<bool> isDone{false};
    std::thread other([&] {
        while (!isDone) {
            EXPECT_NE(adapterOf(*backEnd->snapshot(), "left"), nullptr);
        }
    });
    std::string flaps;
    for (int i = 0; i < 250; ++i) {
        flaps += "link set right down\nlink set right up\n";
    }
    space->ipBatch(flaps);
    isDone = true;
    other.join();
    EXPECT_GE(expectAgreementWithIpMonitor(), 500U);
}

TEST_F(LinuxMonitorTest, leaksNothingWhenStartedAndStoppedAThousandTimes) {
    const auto count = [](const char* directory) {
        const std::filesystem::directory_iterator entries(directory);
        return std::distance(begin(entries), end(entries));
    };
    Monitor often(*backEnd, [](int, const std::string&) {});
    const Monitor::Key key{NODE_NETWORK_ADAPTER, 2, this};
    const auto threads = count("/proc/self/task");
    const auto files = count("/proc/self/fd");
    for (int i = 0; i < 1000; ++i) {
        often.start(key, [](const Handover::Delivery&) {});
        often.stop(key);
    }
    // The kernel lists a thread for a moment longer than it can be joined.
    EXPECT_TRUE(awaited(true, [&] { return count("/proc/self/task") <= threads; }));
    EXPECT_EQ(count("/proc/self/fd"), files);
}

} // namespace
} // namespace Orv::Agent::Linux
