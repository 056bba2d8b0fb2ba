/**
 * @file
 * Link settings of all interfaces at once.
 */
#pragma once

#include "agent/hardware/LinkModes.h"
#include "agent/hardware/Links.h"

#include <unordered_map>
#include <vector>

namespace Orv::Agent::Hardware {

/** Settings by interface index; interfaces whose driver has none are missing. */
using SettingsByIndex = std::unordered_map<int, LinkSettings>;

/**
 * Reads the settings of these links: by two dumps of ethtool netlink, or, where the kernel has no such family (before
 * Linux 5.6) or a dump fails on the way (it ends at the first device that is asleep), by ioctl for the rest. Throws
 * std::system_error when there is not even a socket.
 */
SettingsByIndex readLinkSettings(const std::vector<Link>& links);

} // namespace Orv::Agent::Hardware
