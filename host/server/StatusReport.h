/**
 * @file
 * How a running server is, as it tells those who ask (GET /status) and as it is shown.
 */
#pragma once

#include "host/http/Server.h"
#include "host/server/Statistics.h"

#include <cstdint>
#include <string>
#include <vector>

namespace marlo::server {

struct ProviderState {
    std::string name;
    std::string library;
    std::string state;   ///< "idle" before its first request, "loaded", "failed"
    std::string failure; ///< the latest reason why it could not be loaded
};

/** What one listener of indications has seen since the start. */
struct DeliveryState {
    std::string destination; ///< the name of the destination
    std::string url;
    std::uint64_t queued = 0;
    std::uint64_t queuedBytes = 0;
    std::uint64_t sent = 0;
    std::uint64_t retried = 0;
    std::uint64_t dropped = 0;
    std::string lastError;
    std::uint64_t failingSince = 0; ///< seconds since 1970; 0: the last try was good
    Latency latency;                ///< from the provider to the listener's answer; no highest
};

struct StatusReport {
    std::string version;
    std::uint64_t process = 0;
    std::uint64_t uptimeSeconds = 0;
    std::string configuration;          ///< the file that is in force; empty: none
    std::vector<std::string> reasons;   ///< why its health is degraded; none: it is well
    std::vector<std::string> listeners; ///< "http 127.0.0.1:5988", "local /run/marlo/marlo.sock"
    http::Counters counters;
    std::vector<RequestCount> requests;
    Latency latency;
    std::uint64_t openEnumerations = 0;
    std::vector<ProviderState> providers;
    std::vector<DeliveryState> deliveries;
    std::uint64_t residentBytes = 0;
    std::uint64_t lostLogLines = 0;
};

/** One JSON object, on one line. */
std::string toJson(const StatusReport& report);

/** What toJson wrote; throws std::invalid_argument for anything else. */
StatusReport parseStatusReport(const std::string& text);

/** Of this process (proc(5), statm); 0 where that cannot be read. */
std::uint64_t residentBytes();

} // namespace marlo::server
