// What only a team under a real teamd does, from the pulled plug to the agent's events.
#include "tests/vm/Guest.h"

#include <gmock/gmock.h>

namespace Orv::Test {
namespace {

using testing::ElementsAre;
using testing::IsSupersetOf;

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
