#include "host/server/Health.h"

namespace marlo::server {

void Health::configured(const std::string& file, const std::string& refusal) {
    const std::lock_guard lock(_mutex);
    _file = file;
    _refusal = refusal;
}

std::string Health::configuration() const {
    const std::lock_guard lock(_mutex);
    return _file;
}

void Health::complete(StatusReport& report, bool logIsFailing, std::size_t workers) const {
    const auto age = std::chrono::steady_clock::now() - _start;
    report.uptimeSeconds = static_cast<std::uint64_t>(std::chrono::duration_cast<std::chrono::seconds>(age).count());
    for (const ProviderState& provider : report.providers) {
        if (provider.state == "failed") {
            report.reasons.push_back(provider.failure);
        }
    }
    if (logIsFailing) {
        report.reasons.push_back("the log takes no lines, " + std::to_string(report.lostLogLines) + " are lost");
    }
    if (report.counters.busy >= workers + report.counters.aside) {
        report.reasons.push_back("all " + std::to_string(workers) + " workers are busy");
    }
    const std::lock_guard lock(_mutex);
    if (!_refusal.empty()) {
        report.reasons.push_back("the configuration is not taken: " + _refusal);
    }
}

} // namespace marlo::server
