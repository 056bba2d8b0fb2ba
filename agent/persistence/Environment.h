/**
 * @file
 * Where persistent configuration finds the host; tests put other places here.
 */
#pragma once

#include "agent/config/Configuration.h"

#include <chrono>
#include <functional>
#include <string>
#include <vector>

namespace Orv::Agent::Persistence {

using Agent::ManagerChoice;

/** Programs of the host that are run, by path; each with the arguments that come first. */
struct Commands {
    std::vector<std::string> ifup{"/sbin/ifup"};
    std::vector<std::string> dhclient{"/sbin/dhclient"};
    std::vector<std::string> udhcpc{"/sbin/udhcpc"};
    std::vector<std::string> dhcpcd{"/sbin/dhcpcd"};
    std::vector<std::string> resolvconf{"/sbin/resolvconf"};
    std::chrono::milliseconds patience{
        std::chrono::seconds(90)}; ///< for one command; a DHCP client tries for 60 itself
};

struct Environment {
    std::string root;      ///< prefix of all files; empty for the host itself
    std::string systemBus; ///< D-Bus address (sd_bus_set_address); empty: the host's own system bus
    ManagerChoice choice = ManagerChoice::automatic;
    Commands commands;
    std::function<void(const std::string&)> report; ///< takes lines for the log; may be empty; any thread
};

} // namespace Orv::Agent::Persistence
