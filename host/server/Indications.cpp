#include "host/server/Indications.h"

#include "host/delivery/Trust.h"
#include "host/delivery/Url.h"
#include "host/security/WholeFile.h"
#include "host/subscriptions/Service.h"

#include <algorithm>
#include <mutex>
#include <utility>

namespace marlo::server {

namespace {

constexpr const char* databaseName = "marlo.db";

/** Seconds since 1970; 0 for none. */
std::uint64_t secondsOf(const std::optional<std::chrono::system_clock::time_point>& time) {
    return time ? static_cast<std::uint64_t>(
                      std::chrono::duration_cast<std::chrono::seconds>(time->time_since_epoch()).count())
                : 0;
}

} // namespace

struct Indications::State {
    /** Says who is believed to be the listener of a destination. */
    void trust(delivery::Destination& destination) {
        const std::lock_guard lock(mutex);
        const std::string host = delivery::Url::parse(destination.url).host;
        destination.authorityFile = configuration.authorityFile;
        destination.isVerified = std::find(configuration.unverified.begin(), configuration.unverified.end(), host) ==
                                 configuration.unverified.end();
    }

    std::mutex mutex; ///< guards the one below
    IndicationOptions configuration;
    std::shared_ptr<subscriptions::Service> service;
};

Indications::Indications(ObjectManager& manager, const IndicationOptions& configuration, const Options& options)
    : _state(std::make_unique<State>()) {
    security::makeDirectory(options.stateDirectory);
    _state->configuration = configuration;
    subscriptions::Options serviceOptions;
    serviceOptions.database = std::filesystem::path(options.stateDirectory) / databaseName;
    serviceOptions.delivery.queueLength = configuration.queueLength;
    serviceOptions.delivery.queueBytes = configuration.queueBytes;
    serviceOptions.mayRead = options.mayRead;
    serviceOptions.trust = [state = _state.get()](delivery::Destination& destination) { state->trust(destination); };
    serviceOptions.log = options.log;
    _state->service = std::make_shared<subscriptions::Service>(manager, std::move(serviceOptions));
    manager.add(_state->service);
    _state->service->start();
}

Indications::~Indications() {
    stop(std::chrono::milliseconds(0));
}

void Indications::check(const IndicationOptions& configuration) {
    if (!configuration.authorityFile.empty()) {
        delivery::Trust().of({{}, {}, true, configuration.authorityFile});
    }
}

void Indications::configure(const IndicationOptions& configuration) {
    {
        const std::lock_guard lock(_state->mutex);
        _state->configuration = configuration;
    }
    _state->service->review();
}

void Indications::stop(std::chrono::milliseconds patience) {
    if (_state->service) {
        _state->service->stop(patience);
    }
}

std::vector<DeliveryState> Indications::deliveries() const {
    std::vector<DeliveryState> states;
    for (const delivery::Counters& each : _state->service->counters()) {
        DeliveryState state;
        state.destination = each.destination;
        state.url = each.url;
        state.queued = each.queued;
        state.queuedBytes = each.queuedBytes;
        state.sent = each.sent;
        state.retried = each.retried;
        state.dropped = each.dropped;
        state.lastError = each.lastError;
        state.failingSince = secondsOf(each.failingSince);
        state.latency.median = static_cast<std::uint64_t>(each.latencyMedian.count());
        state.latency.high = static_cast<std::uint64_t>(each.latency99.count());
        states.push_back(std::move(state));
    }
    return states;
}

} // namespace marlo::server
