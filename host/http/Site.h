/**
 * @file
 * What all connections of a server share.
 */
#pragma once

#include "host/http/Seats.h"
#include "host/http/Server.h"
#include "host/http/Workers.h"

#include <atomic>
#include <cstdint>
#include <utility>

namespace marlo::http {

struct Site {
    Site(Handler& handlerOfAll, const Limits& limitsOfAll, Server::Log logOfAll, std::size_t loops)
        : handler(handlerOfAll),
          limits(limitsOfAll),
          log(std::move(logOfAll)),
          seats(limits.connections, limits.connectionsPerPeer),
          workers(loops, {limits.workers, limits.queued, limits.aside}, log) {}

    Handler& handler;
    const Limits limits;
    const Server::Log log;
    Seats seats;
    std::atomic<std::uint64_t> accepted{0};
    std::atomic<std::uint64_t> requests{0};
    std::atomic<std::uint64_t> refusedConnections{0};
    std::atomic<std::uint64_t> tooSlow{0};
    std::atomic<bool> isStopping{false};
    Workers workers; ///< last: its threads use all of the above
};

} // namespace marlo::http
