// What becomes alike of the messages of a real bond and of a real team whose cables were pulled.
#include "tests/linux/RecordedTest.h"

#include <string>

#include <gmock/gmock.h>
#include <gtest/gtest.h>

namespace Orv::Agent::Linux {
namespace {

using namespace Orv::Test;
using testing::Each;
using testing::ElementsAre;

class RecordedFailOverTest : public RecordedTest, public testing::WithParamInterface<RecordedInterface> {
  protected:
    RecordedFailOverTest() : RecordedTest(GetParam()) {}

    /** The interface with this status. */
    static std::string withStatus(unsigned status) {
        return std::string(GetParam().name) + ' ' + std::to_string(status);
    }
};

TEST_P(RecordedFailOverTest, switchesOverAndBackOnceEach) {
    playUpTo("cable eth0 off");
    EXPECT_THAT(play("cable eth0 off"), ElementsAre("eth0 12", withStatus(32)));
    EXPECT_THAT(liveStatuses, Each(1U));
    EXPECT_THAT(play("cable eth0 on"), ElementsAre("eth0 1", withStatus(33)));
    EXPECT_THAT(liveStatuses, Each(1U));
}

TEST_P(RecordedFailOverTest, losingTheBackupIsNoSwitch) {
    playUpTo("cable eth1 off");
    EXPECT_THAT(play("cable eth1 off"), ElementsAre("eth1 12"));
    EXPECT_EQ(liveStatus(), 1U);
}

INSTANTIATE_TEST_SUITE_P(Of, RecordedFailOverTest, testing::Values(recordedBond, recordedTeam),
                         [](const auto& instance) { return std::string(instance.param.name); });

} // namespace
} // namespace Orv::Agent::Linux
