/**
 * @file
 * The back end that is this host: rtnetlink, udev, ethtool and the host's own configuration files.
 */
#pragma once

#include "agent/persistence/Environment.h"
#include "agent/tree/BackEnd.h"

#include <memory>
#include <string>

namespace Orv::Agent::Linux {

/** Where the back end looks for files; tests put other places here. */
struct HostPaths {
    std::string root; ///< prefix of /etc, /run, /proc and /sys; empty for the host itself
};

/**
 * The back end for the network namespace that the calling thread is in. Subscribes to the kernel's notifications,
 * then reads links, addresses, routes and neighbours once. Throws std::system_error with the request that failed.
 *
 * What is written goes to the kernel of that namespace and to the host as `host` describes it, whose root is that of
 * `paths`; programs that are run for it run in the namespaces of the thread that writes.
 */
std::unique_ptr<BackEnd> makeLinuxBackEnd(HostPaths paths = {}, Persistence::Environment host = {});

} // namespace Orv::Agent::Linux
