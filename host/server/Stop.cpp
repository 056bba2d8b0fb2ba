#include "host/server/Stop.h"

#include "host/server/Endpoints.h"

#include <csignal>
#include <cstdlib>
#include <future>
#include <string>

#include <unistd.h>

namespace marlo::server {

namespace {

using Clock = std::chrono::steady_clock;

/** How long a signal may go unseen while the server ends. */
constexpr std::chrono::milliseconds Glance(20);

/** For what is left to do once all connections are cut. */
constexpr std::chrono::seconds Grace(2);

[[noreturn]] void endAtOnce(const http::Server& server, Log& log, const std::string& reason) {
    log.write(LogLevel::error, "stop", reason + "; " + std::to_string(server.counters().busy) + " requests are cut");
    for (const http::Endpoint& endpoint : server.endpoints()) {
        if (endpoint.transport == http::Transport::local) {
            ::unlink(endpoint.address.c_str());
        }
    }
    ::_exit(EXIT_FAILURE);
}

} // namespace

bool stopServer(http::Server& server, const Signals& signals, Log& log) {
    const Clock::time_point end = Clock::now() + StopPatience + Grace;
    const auto stopped = std::async(std::launch::async, [&server] { server.stop(StopPatience); });
    while (stopped.wait_for(Glance) != std::future_status::ready) {
        const auto signal = signals.take();
        if (signal && (*signal == SIGTERM || *signal == SIGINT)) {
            endAtOnce(server, log, "told once more to end");
        }
        if (Clock::now() > end) {
            endAtOnce(server, log, "a provider does not return");
        }
    }
    return true;
}

} // namespace marlo::server
