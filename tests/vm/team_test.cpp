// Fail-over of a real team under a real teamd, from the pulled plug to the agent's events.
#include "tests/vm/Guest.h"

#include <gmock/gmock.h>

namespace Orv::Test {
namespace {

using testing::ElementsAre;
using testing::IsSupersetOf;

TEST_F(PreferringTeamTest, worksWhicheverPortCarriesIt) {
    pullCable("eth0");
    expectCarrier("eth1");
    expectStatus("eth0", 12);
    EXPECT_EQ(statusOf("eth1"), 1U);
    EXPECT_EQ(statusOf("team0"), 1U);
    plugCable("eth0");
    expectCarrier("eth0");
    expectStatus("eth0", 1);
    EXPECT_EQ(statusOf("team0"), 1U);
}

TEST_F(PreferringTeamTest, withoutAnyPortItIsLost) {
    pullCable("eth0");
    pullCable("eth1");
    expectStatus("team0", 12);
    plugCable("eth1");
    expectStatus("team0", 1);
    ip("link set team0 down");
    expectStatus("team0", 5);
}

TEST_F(PreferringTeamTest, switchesOverAndBackOnceEach) {
    StatusWatch watch;
    pullCable("eth0");
    EXPECT_THAT(watch.take(2), ElementsAre("eth0 12", "team0 32"));
    plugCable("eth0");
    EXPECT_THAT(watch.take(2), ElementsAre("eth0 1", "team0 33"));
    EXPECT_EQ(statusOf("team0"), 1U);
}

TEST_F(PreferringTeamTest, losingTheBackupIsNoSwitch) {
    StatusWatch watch;
    pullCable("eth1");
    EXPECT_THAT(watch.take(1), ElementsAre("eth1 12"));
    plugCable("eth1");
    EXPECT_THAT(watch.take(1), ElementsAre("eth1 1"));
}

TEST_F(PreferringTeamTest, thatLostBothPortsComesBackOnItsBackup) {
    StatusWatch watch;
    pullCable("eth1");
    pullCable("eth0");
    EXPECT_THAT(watch.take(3), ElementsAre("eth1 12", "eth0 12", "team0 12"));
    plugCable("eth1");
    EXPECT_THAT(watch.take(3), ElementsAre("eth1 1", "team0 1", "team0 32"));
    plugCable("eth0");
    EXPECT_THAT(watch.take(2), ElementsAre("eth0 1", "team0 33"));
}

TEST_F(PreferringTeamTest, everySwitchOfManyIsReported) {
    constexpr int rounds = 10;
    StatusWatch watch;
    std::vector<std::string> expected;
    for (int round = 0; round < rounds; ++round) {
        pullCable("eth0");
        expectCarrier("eth1");
        plugCable("eth0");
        expectCarrier("eth0");
        expected.insert(expected.end(), {"eth0 12", "team0 32", "eth0 1", "team0 33"});
    }
    EXPECT_EQ(watch.take(expected.size()), expected);
}

TEST_F(PreferringTeamTest, returnsWhenThePortThatCarriesItIsTakenAway) {
    StatusWatch watch;
    shell("teamnl team0 setoption activeport $(cat /sys/class/net/eth1/ifindex)");
    EXPECT_THAT(watch.take(1), ElementsAre("team0 32"));
    ip("link set eth1 nomaster");
    EXPECT_THAT(watch.take(2), testing::UnorderedElementsAre("eth1 5", "team0 33"));
}

TEST_F(TeamTest, ofEqualPortsStaysWhereItIs) {
    startTeam(0, 0);
    expectStatus("team0", 1);
    expectStatus("eth0", 1);
    expectStatus("eth1", 1);
    expectCarrier("eth0");
    StatusWatch watch;
    pullCable("eth0");
    EXPECT_THAT(watch.take(2), ElementsAre("eth0 12", "team0 32"));
    plugCable("eth0");
    EXPECT_THAT(watch.take(1), ElementsAre("eth0 1"));
    expectCarrier("eth1");
    pullCable("eth1");
    EXPECT_THAT(watch.take(2), ElementsAre("eth1 12", "team0 32"));
}

TEST_F(TeamTest, thatComesLaterIsFollowedFromItsBeginning) {
    StatusWatch watch;
    for (int round = 0; round < 2; ++round) {
        startTeam(100, 10);
        EXPECT_THAT(watch.take(3), IsSupersetOf({"eth0 1", "eth1 1", "team0 1"}));
        expectCarrier("eth0");
        pullCable("eth0");
        EXPECT_THAT(watch.take(2), ElementsAre("eth0 12", "team0 32"));
        plugCable("eth0");
        EXPECT_THAT(watch.take(2), ElementsAre("eth0 1", "team0 33"));
        stopTeam();
        EXPECT_THAT(watch.take(3), IsSupersetOf({"eth0 5", "eth1 5", "team0 5"}));
        // The driver that comes back has other numbers for its messages.
        shell("modprobe -r team_mode_activebackup && modprobe team_mode_activebackup");
    }
}

} // namespace
} // namespace Orv::Test
