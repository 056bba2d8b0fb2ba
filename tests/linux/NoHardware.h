/**
 * @file
 * A host of which nothing is known but its interfaces.
 */
#pragma once

#include "agent/linux/HostTree.h"

#include <optional>
#include <string>

namespace Orv::Test {

inline Agent::Linux::HardwareSource noHardware() {
    return {[](const Agent::Linux::DeviceName&) { return std::nullopt; },
            [](const std::string&) { return std::nullopt; }, [](const std::string&) { return std::nullopt; }};
}

} // namespace Orv::Test
