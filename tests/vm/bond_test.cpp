// Fail-over of a real bond, from the pulled plug to the agent's events.
#include "tests/vm/Guest.h"

#include <gmock/gmock.h>

namespace Orv::Test {
namespace {

using namespace NodeLexicon;
using testing::ElementsAre;

TEST_F(BondTest, worksWhicheverMemberCarriesIt) {
    pullCable("eth0");
    expectCarrier("eth1");
    expectStatus("eth0", 12);
    EXPECT_EQ(statusOf("eth1"), 1U);
    EXPECT_EQ(statusOf("bond0"), 1U);
    plugCable("eth0");
    expectCarrier("eth0");
    expectStatus("eth0", 1);
    EXPECT_EQ(statusOf("bond0"), 1U);
}

TEST_F(BondTest, withoutAnyMemberItIsLost) {
    pullCable("eth0");
    pullCable("eth1");
    expectStatus("bond0", 12);
    plugCable("eth1");
    expectStatus("bond0", 1);
    ip("link set bond0 down");
    expectStatus("bond0", 5);
}

TEST_F(BondTest, switchesOverAndBackOnceEach) {
    StatusWatch watch;
    pullCable("eth0");
    EXPECT_THAT(watch.take(2), ElementsAre("eth0 12", "bond0 32"));
    plugCable("eth0");
    EXPECT_THAT(watch.take(2), ElementsAre("eth0 1", "bond0 33"));
    EXPECT_EQ(statusOf("bond0"), 1U);
}

TEST_F(BondTest, switchesOverWhenItsPrimaryIsStopped) {
    StatusWatch watch;
    ip("link set eth0 down");
    EXPECT_THAT(watch.take(2), ElementsAre("eth0 5", "bond0 32"));
    ip("link set eth0 up");
    EXPECT_THAT(watch.take(2), ElementsAre("eth0 1", "bond0 33"));
}

TEST_F(BondTest, losingTheBackupIsNoSwitch) {
    StatusWatch watch;
    pullCable("eth1");
    EXPECT_THAT(watch.take(1), ElementsAre("eth1 12"));
    plugCable("eth1");
    EXPECT_THAT(watch.take(1), ElementsAre("eth1 1"));
}

TEST_F(BondTest, everySwitchOfManyIsReported) {
    constexpr int rounds = 10;
    StatusWatch watch;
    std::vector<std::string> expected;
    for (int round = 0; round < rounds; ++round) {
        pullCable("eth0");
        expectCarrier("eth1");
        plugCable("eth0");
        expectCarrier("eth0");
        expected.insert(expected.end(), {"eth0 12", "bond0 32", "eth0 1", "bond0 33"});
    }
    EXPECT_EQ(watch.take(expected.size()), expected);
}

TEST_F(BondTest, staysAsItIsUnderATagOfItsOwn) {
    ip("link add link bond0 name bond0.7 type vlan id 7");
    ip("link set bond0.7 up");
    expectStatus("bond0.7", 1);
    StatusWatch watch;
    pullCable("eth0");
    EXPECT_THAT(watch.take(2), ElementsAre("eth0 12", "bond0 32"));
    pullCable("eth1");
    expectStatus("bond0.7", 12);
}

} // namespace
} // namespace Orv::Test
