// What becomes of the messages of a real team, recorded while its ports' cables were pulled and put back in.
#include "agent/hardware/GenericFamily.h"
#include "tests/linux/RecordedTest.h"

#include <gmock/gmock.h>
#include <gtest/gtest.h>
#include <linux/if_team.h>

namespace Orv::Agent::Linux {
namespace {

using namespace Orv::Test;
using testing::Each;
using testing::ElementsAre;
using testing::IsEmpty;
using testing::Pair;
using testing::UnorderedElementsAre;

class RecordedTeamTest : public RecordedTest {
  protected:
    RecordedTeamTest() : RecordedTest(recordedTeam) {}

    [[nodiscard]] Carrier carrier() const { return state.carrierOf(state.links().at(4)); }
};

TEST_F(RecordedTeamTest, hasAFamilyThatAnnouncesItsChanges) {
    ASSERT_EQ(steps.at(1).command, "family");
    const auto family = Hardware::parseFamily(steps.at(1).messages.at(0).payload());
    ASSERT_TRUE(family);
    playUpTo("teamd -d");
    EXPECT_EQ(family->type, steps.at(next).messages.back().bytes.message().nlmsg_type);
    EXPECT_THAT(family->groups, ElementsAre(Pair(TEAM_GENL_CHANGE_EVENT_MC_GRP_NAME, testing::Gt(0))));
}

TEST_F(RecordedTeamTest, comesUpOnItsPreferredPort) {
    playUpTo("teamd -d");
    EXPECT_THAT(play("teamd -d"), UnorderedElementsAre("eth0 1", "eth1 1"));
    EXPECT_THAT(play("ip link set team0 up"), ElementsAre("team0 1"));
    EXPECT_EQ(carrier(), (Carrier{2, Carrier::Rank::first}));
}

TEST_F(RecordedTeamTest, answersWithWhatItHadAnnounced) {
    playUpTo("options team0");
    ASSERT_EQ(steps.at(next).messages.size(), 1U);
    EXPECT_EQ(steps.at(next).messages[0].parse(),
              Message((TeamOptions{4, 2, {{2, std::int32_t{100}}, {3, std::int32_t{10}}}})));
    EXPECT_THAT(play("options team0"), IsEmpty());
    EXPECT_THAT(liveStatuses, Each(1U));
}

TEST_F(RecordedTeamTest, thatLostBothPortsComesBackOnItsBackup) {
    playUpTo("cable eth1 off");
    play("cable eth1 off");
    EXPECT_THAT(play("cable eth0 off"), ElementsAre("eth0 12", "team0 12"));
    EXPECT_THAT(play("cable eth1 on"), ElementsAre("eth1 1", "team0 1", "team0 32"));
    EXPECT_THAT(play("cable eth0 on"), ElementsAre("eth0 1", "team0 33"));
}

TEST_F(RecordedTeamTest, moveByHandIsASwitchOfTheTeamAlone) {
    playUpTo("teamnl team0 setoption activeport 3");
    EXPECT_THAT(play("teamnl team0 setoption activeport 3"), ElementsAre("team0 32"));
}

TEST_F(RecordedTeamTest, returnsWhenThePortThatCarriesItIsTakenAway) {
    playUpTo("ip link set eth1 nomaster");
    EXPECT_THAT(play("ip link set eth1 nomaster"), ElementsAre("eth1 5", "team0 33"));
    EXPECT_EQ(carrier(), (Carrier{2, Carrier::Rank::first}));
}

TEST_F(RecordedTeamTest, isStoppedWhenItIsRemoved) {
    playUpTo("teamd -k");
    EXPECT_THAT(play("teamd -k"), ElementsAre("eth0 5", "team0 12", "team0 5")) << "its last port goes first";
    EXPECT_EQ(liveStatus(), 0U);
    EXPECT_FALSE(state.hasTeams());
    EXPECT_EQ(next, steps.size());
}

} // namespace
} // namespace Orv::Agent::Linux
