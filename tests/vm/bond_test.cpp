// What only a bond does, from the pulled plug to the agent's events.
#include "tests/vm/Guest.h"

#include <gmock/gmock.h>

namespace Orv::Test {
namespace {

using testing::ElementsAre;

TEST_F(BondTest, switchesOverWhenItsPrimaryIsStopped) {
    StatusWatch watch;
    ip("link set eth0 down");
    EXPECT_THAT(watch.take(2), ElementsAre("eth0 5", "bond0 32"));
    ip("link set eth0 up");
    EXPECT_THAT(watch.take(2), ElementsAre("eth0 1", "bond0 33"));
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
