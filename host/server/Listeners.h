/**
 * @file
 * Which places a server listens on, of those that are wanted.
 */
#pragma once

#include "host/server/Configuration.h"

#include <string>
#include <vector>

namespace marlo::server {

struct Listeners {
    std::vector<http::Endpoint> endpoints;
    std::vector<std::string> notes; ///< what is not as it was wanted
};

/**
 * Every place that the configuration names, and the usual ones where it names none. On trial a busy port gives way to
 * one that is free, and a busy Unix domain socket to none: whoever tries things must not be in a server's way. Makes
 * the directory of the Unix domain socket. Throws std::runtime_error where that cannot be.
 */
Listeners chooseListeners(const Listening& wanted, const std::string& usualSocket, bool trial);

} // namespace marlo::server
