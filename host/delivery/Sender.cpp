#include "host/delivery/Sender.h"

#include <algorithm>
#include <cmath>
#include <random>
#include <utility>

namespace marlo::delivery {
namespace {

/** Between four and six fifths: listeners that went away together are not all tried at the same moment. */
double spread() {
    static thread_local std::minstd_rand numbers{std::random_device()()};
    return std::uniform_real_distribution<double>(0.8, 1.2)(numbers);
}

} // namespace

Sender::Sender(Network& network, Ledger& ledger, const Options& options, Ledger::LaneId lane, Policy policy)
    : _network(network),
      _ledger(ledger),
      _options(options),
      _lane(lane),
      _policy(std::move(policy)),
      _pause(network) {}

void Sender::setDestination(const Destination& destination, const TlsClient& tls) {
    if (_isBusy) {
        _client->close();
        _isBusy = false;
        _ledger.giveBack(_lane);
    }
    _client = std::make_shared<Client>(_network, _options, destination, tls);
    _pause.cancel();
    _isPausing = false;
    _failures = 0;
    send();
}

void Sender::wake() {
    if (!_isBusy && !_isPausing) {
        send();
    }
}

void Sender::send() {
    std::optional<Consignment> consignment = _ledger.begin(_lane);
    if (!consignment) {
        return;
    }
    _isBusy = true;
    const std::int64_t number = consignment->number;
    if (!consignment->problem.empty()) {
        onOutcome(number, consignment->problem);
        return;
    }
    _client->send(std::move(consignment->body),
                  [this, number](const std::string& problem) { onOutcome(number, problem); });
}

void Sender::onOutcome(std::int64_t number, const std::string& problem) {
    _isBusy = false;
    if (problem.empty()) {
        _failures = 0;
        _ledger.delivered(_lane, number);
        send();
        return;
    }
    ++_failures;
    const Consequences consequences = _ledger.failed(_lane, problem);
    for (const auto& [subscription, policy] : consequences.fired) {
        _policy(subscription, policy);
    }
    pause(consequences.untilNext);
}

void Sender::pause(std::optional<std::chrono::milliseconds> atMost) {
    const double doubled = static_cast<double>(_options.firstRetry.count()) * std::exp2(std::min(_failures - 1, 30U));
    const double capped = std::min(doubled, static_cast<double>(_options.lastRetry.count()));
    std::chrono::milliseconds time(static_cast<std::int64_t>(capped * spread()));
    if (atMost) {
        time = std::min(time, *atMost);
    }
    _isPausing = true;
    _pause.after(time, [this] {
        _isPausing = false;
        send();
    });
}

} // namespace marlo::delivery
