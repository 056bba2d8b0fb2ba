// What becomes of the messages of a real bond, recorded while its cables were pulled and put back in.
#include "tests/linux/RecordedTest.h"

#include <gmock/gmock.h>
#include <gtest/gtest.h>

namespace Orv::Agent::Linux {
namespace {

using namespace Orv::Test;
using testing::ElementsAre;
using testing::IsEmpty;

class RecordedBondTest : public RecordedTest {
  protected:
    RecordedBondTest() : RecordedTest(recordedBond) {}
};

TEST_F(RecordedBondTest, comesUpWithItsMembers) {
    EXPECT_THAT(play("ip link add bond0 type bond mode active-backup miimon 100 primary_reselect always"), IsEmpty());
    EXPECT_THAT(play("ip link set eth0 master bond0"), ElementsAre("eth0 1"));
    EXPECT_THAT(play("ip link set eth1 master bond0"), ElementsAre("eth1 1"));
    EXPECT_THAT(play("ip link set bond0 type bond primary eth0"), IsEmpty());
    EXPECT_THAT(play("ip link set bond0 up"), ElementsAre("bond0 1"));
}

TEST_F(RecordedBondTest, thatLostBothMembersComesBackOnItsBackup) {
    playUpTo("cable eth1 off");
    play("cable eth1 off");
    EXPECT_THAT(play("cable eth0 off"), ElementsAre("eth0 12", "bond0 12"));
    // The kernel names the member first, and says only then that there is a carrier.
    EXPECT_THAT(play("cable eth1 on"), ElementsAre("eth1 1", "bond0 32", "bond0 1"));
    EXPECT_THAT(play("cable eth0 on"), ElementsAre("eth0 1", "bond0 33"));
}

TEST_F(RecordedBondTest, moveByHandIsASwitchOfTheBondAlone) {
    playUpTo("ip link set bond0 type bond active_slave eth1");
    EXPECT_THAT(play("ip link set bond0 type bond active_slave eth1"), ElementsAre("bond0 32"));
    EXPECT_THAT(play("ip link set eth1 nomaster"), ElementsAre("bond0 33", "eth1 5"));
}

TEST_F(RecordedBondTest, isStoppedWhenItIsRemoved) {
    playUpTo("ip link del bond0");
    EXPECT_THAT(play("ip link del bond0"), ElementsAre("bond0 5", "eth0 5"));
    EXPECT_EQ(liveStatus(), 0U);
    EXPECT_EQ(next, steps.size());
}

} // namespace
} // namespace Orv::Agent::Linux
