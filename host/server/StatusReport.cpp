#include "host/server/StatusReport.h"

#include <fstream>
#include <nlohmann/json.hpp>
#include <stdexcept>

#include <unistd.h>

namespace marlo::server {

namespace {

using Json = nlohmann::ordered_json;

Json requestsJson(const std::vector<RequestCount>& requests) {
    Json list = Json::array();
    for (const RequestCount& each : requests) {
        list.push_back({{"operation", each.operation}, {"result", each.result}, {"count", each.count}});
    }
    return list;
}

Json providersJson(const std::vector<ProviderState>& providers) {
    Json list = Json::array();
    for (const ProviderState& each : providers) {
        list.push_back(
            {{"name", each.name}, {"library", each.library}, {"state", each.state}, {"failure", each.failure}});
    }
    return list;
}

Json deliveriesJson(const std::vector<DeliveryState>& deliveries) {
    Json list = Json::array();
    for (const DeliveryState& each : deliveries) {
        list.push_back({{"destination", each.destination},
                        {"url", each.url},
                        {"queued", each.queued},
                        {"queued_bytes", each.queuedBytes},
                        {"sent", each.sent},
                        {"retried", each.retried},
                        {"dropped", each.dropped},
                        {"last_error", each.lastError},
                        {"failing_since", each.failingSince},
                        {"latency_us", {{"median", each.latency.median}, {"p99", each.latency.high}}}});
    }
    return list;
}

DeliveryState readDelivery(const Json& json) {
    DeliveryState state;
    state.destination = json.at("destination");
    state.url = json.at("url");
    state.queued = json.at("queued");
    state.queuedBytes = json.at("queued_bytes");
    state.sent = json.at("sent");
    state.retried = json.at("retried");
    state.dropped = json.at("dropped");
    state.lastError = json.at("last_error");
    state.failingSince = json.at("failing_since");
    state.latency.median = json.at("latency_us").at("median");
    state.latency.high = json.at("latency_us").at("p99");
    return state;
}

} // namespace

std::string toJson(const StatusReport& report) {
    const Json json = {
        {"version", report.version},
        {"health", report.reasons.empty() ? "ok" : "degraded"},
        {"reasons", report.reasons},
        {"pid", report.process},
        {"uptime_seconds", report.uptimeSeconds},
        {"configuration", report.configuration},
        {"listeners", report.listeners},
        {"connections",
         {{"open", report.counters.connections},
          {"accepted", report.counters.accepted},
          {"refused", report.counters.refusedConnections},
          {"too_slow", report.counters.tooSlow}}},
        {"requests",
         {{"received", report.counters.requests},
          {"busy", report.counters.busy},
          {"aside", report.counters.aside},
          {"answered", requestsJson(report.requests)}}},
        {"latency_us",
         {{"median", report.latency.median}, {"p99", report.latency.high}, {"highest", report.latency.highest}}},
        {"open_enumerations", report.openEnumerations},
        {"providers", providersJson(report.providers)},
        {"deliveries", deliveriesJson(report.deliveries)},
        {"resident_bytes", report.residentBytes},
        {"lost_log_lines", report.lostLogLines},
    };
    return json.dump(-1, ' ', false, Json::error_handler_t::replace);
}

StatusReport parseStatusReport(const std::string& text) {
    StatusReport report;
    try {
        const Json json = Json::parse(text);
        report.version = json.at("version");
        json.at("reasons").get_to(report.reasons);
        report.process = json.at("pid");
        report.uptimeSeconds = json.at("uptime_seconds");
        report.configuration = json.at("configuration");
        json.at("listeners").get_to(report.listeners);
        const Json& connections = json.at("connections");
        report.counters.connections = connections.at("open");
        report.counters.accepted = connections.at("accepted");
        report.counters.refusedConnections = connections.at("refused");
        report.counters.tooSlow = connections.at("too_slow");
        report.counters.requests = json.at("requests").at("received");
        report.counters.busy = json.at("requests").at("busy");
        report.counters.aside = json.at("requests").at("aside");
        for (const Json& each : json.at("requests").at("answered")) {
            report.requests.push_back({each.at("operation"), each.at("result"), each.at("count")});
        }
        const Json& latency = json.at("latency_us");
        report.latency = {latency.at("median"), latency.at("p99"), latency.at("highest")};
        report.openEnumerations = json.at("open_enumerations");
        for (const Json& each : json.at("providers")) {
            report.providers.push_back({each.at("name"), each.at("library"), each.at("state"), each.at("failure")});
        }
        for (const Json& each : json.at("deliveries")) {
            report.deliveries.push_back(readDelivery(each));
        }
        report.residentBytes = json.at("resident_bytes");
        report.lostLogLines = json.at("lost_log_lines");
    } catch (const Json::exception& error) {
        throw std::invalid_argument(std::string("this is no status: ") + error.what());
    }
    return report;
}

std::uint64_t residentBytes() {
    std::uint64_t size = 0;
    std::uint64_t resident = 0;
    std::ifstream("/proc/self/statm") >> size >> resident;
    return resident * static_cast<std::uint64_t>(::sysconf(_SC_PAGESIZE));
}

} // namespace marlo::server
