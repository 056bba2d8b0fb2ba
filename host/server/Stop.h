/**
 * @file
 * The end of a server.
 */
#pragma once

#include "host/http/Server.h"
#include "host/server/Log.h"
#include "host/server/Signals.h"

#include <chrono>

namespace marlo::server {

/** Requests that are under way when the server is to end get this long. */
constexpr std::chrono::seconds StopPatience(30);

/**
 * Stops within StopPatience, or until one more SIGTERM or SIGINT comes. A provider that does not return by then
 * cannot be ended, nor what it uses taken away from it: the process ends on the spot, in failure, as one that was
 * killed. True when all ended by itself.
 */
bool stopServer(http::Server& server, const Signals& signals, Log& log);

} // namespace marlo::server
