/**
 * @file
 * What fails over from eth0 to eth1 and back: once as a bond, once as a team.
 */
#pragma once

#include "tests/vm/Guest.h"

#include <string>
#include <type_traits>

namespace Orv::Test {

/** "NAME STATUS" as a watch of statuses has it. */
inline std::string event(const std::string& name, unsigned int status) {
    return name + ' ' + std::to_string(status);
}

/** Of one of the two. */
template <typename Fixture>
class FailOverTest : public Fixture {
  protected:
    using Fixture::expectCarrier;

    /** The device that is made of the two. */
    const std::string device = Fixture::device;

    const std::string switchOver = event(device, 32);
    const std::string switchBack = event(device, 33);

    /** Has eth1 carry the device, and eth0 again. */
    static void switchOverAndBack() {
        pullCable("eth0");
        expectCarrier("eth1");
        plugCable("eth0");
        expectCarrier("eth0");
    }
};

using FailOvers = testing::Types<BondTest, PreferringTeamTest>;

struct FailOverNames {
    template <typename Fixture>
    static std::string GetName(int /*index*/) {
        return std::is_same_v<Fixture, BondTest> ? "Bond" : "Team";
    }
};

} // namespace Orv::Test
