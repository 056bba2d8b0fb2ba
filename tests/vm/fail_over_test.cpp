// What a bond and a team do alike, from the pulled plug to the agent's events.
#include "tests/vm/FailOver.h"

#include <gmock/gmock.h>

namespace Orv::Test {
namespace {

using testing::ElementsAre;

TYPED_TEST_SUITE(FailOverTest, FailOvers, FailOverNames);

TYPED_TEST(FailOverTest, worksWhicheverMemberCarriesIt) {
    pullCable("eth0");
    this->expectCarrier("eth1");
    expectStatus("eth0", 12);
    EXPECT_EQ(statusOf("eth1"), 1U);
    EXPECT_EQ(statusOf(this->device), 1U);
    plugCable("eth0");
    this->expectCarrier("eth0");
    expectStatus("eth0", 1);
    EXPECT_EQ(statusOf(this->device), 1U);
}

TYPED_TEST(FailOverTest, withoutAnyMemberItIsLost) {
    pullCable("eth0");
    pullCable("eth1");
    expectStatus(this->device, 12);
    plugCable("eth1");
    expectStatus(this->device, 1);
    ip("link set " + this->device + " down");
    expectStatus(this->device, 5);
}

TYPED_TEST(FailOverTest, switchesOverAndBackOnceEach) {
    StatusWatch watch;
    pullCable("eth0");
    EXPECT_THAT(watch.take(2), ElementsAre("eth0 12", this->switchOver));
    plugCable("eth0");
    EXPECT_THAT(watch.take(2), ElementsAre("eth0 1", this->switchBack));
    EXPECT_EQ(statusOf(this->device), 1U);
}

TYPED_TEST(FailOverTest, losingTheBackupIsNoSwitch) {
    StatusWatch watch;
    pullCable("eth1");
    EXPECT_THAT(watch.take(1), ElementsAre("eth1 12"));
    plugCable("eth1");
    EXPECT_THAT(watch.take(1), ElementsAre("eth1 1"));
}

TYPED_TEST(FailOverTest, everySwitchOfManyIsReported) {
    constexpr int rounds = 10;
    StatusWatch watch;
    std::vector<std::string> expected;
    for (int round = 0; round < rounds; ++round) {
        this->switchOverAndBack();
        expected.insert(expected.end(), {"eth0 12", this->switchOver, "eth0 1", this->switchBack});
    }
    EXPECT_EQ(watch.take(expected.size()), expected);
}

} // namespace
} // namespace Orv::Test
