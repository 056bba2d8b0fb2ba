#include "tests/linux/MonitorFixture.h"

#include <gmock/gmock.h>
#include <gtest/gtest.h>

namespace Orv::Agent::Linux {
namespace {

using namespace NodeLexicon;
using namespace Orv::Test;

class LinuxMonitorTest : public MonitorFixture {};

TEST_F(LinuxMonitorTest, reportsALostCarrierAndItsReturn) {
    addPair();
    expectStatus("left", 1);
    startMonitoring();
    space->ip("link set right down");
    expectEvents("left", {12});
    expectEvents("right", {5});
    space->ip("link set right up");
    expectEvents("left", {12, 1});
}

TEST_F(LinuxMonitorTest, reportsAnAdapterThatIsStoppedAndStarted) {
    addPair();
    expectStatus("left", 1);
    startMonitoring();
    space->ip("link set left down");
    expectEvents("left", {5});
    space->ip("link set left up");
    awaited(true, [&] { return !statusesOf("left").empty() && statusesOf("left").back() == 1; });
    EXPECT_EQ(statusesOf("left").back(), 1U);
}

} // namespace
} // namespace Orv::Agent::Linux
