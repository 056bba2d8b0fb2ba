#include "host/delivery/Delivery.h"

#include "host/delivery/Ledger.h"
#include "host/delivery/Network.h"
#include "host/delivery/Policies.h"
#include "host/delivery/Sender.h"

#include <atomic>
#include <unordered_map>
#include <utility>

namespace marlo::delivery {

class Delivery::State {
  public:
    using LaneId = Ledger::LaneId;

    State(const std::filesystem::path& database, const Options& itsOptions, PolicyHandler onPolicy, const Log& log)
        : options(itsOptions),
          ledger(database, options, log, [this](const std::vector<LaneId>& lanes) { wake(lanes); }),
          policies(std::move(onPolicy), log) {}

    /** Any thread, as all below. */
    void wake(const std::vector<LaneId>& lanes) {
        if (!isSending) {
            return;
        }
        network.post([this, lanes] {
            for (const LaneId lane : lanes) {
                if (const auto found = senders.find(lane); found != senders.end()) {
                    found->second.wake();
                }
            }
        });
    }

    /** Whom a destination is believed by; null for one without TLS. Throws std::invalid_argument. */
    TlsClient trustFor(const Destination& destination) {
        return Url::parse(destination.url).isSecure ? network.trust().of(destination) : nullptr;
    }

    void direct(LaneId lane, const Destination& destination, const TlsClient& tls) {
        if (!isSending) {
            return;
        }
        network.post([this, lane, destination, tls] {
            const auto onPolicy = [this](const std::string& subscription, OnFatalError policy) {
                policies.fire(subscription, policy);
            };
            senders.try_emplace(lane, network, ledger, options, lane, onPolicy)
                .first->second.setDestination(destination, tls);
        });
    }

    void dismiss(LaneId lane) {
        if (isSending) {
            network.post([this, lane] { senders.erase(lane); });
        }
    }

    const Options options;
    Network network;
    Ledger ledger;
    Policies policies; ///< its handler may use all of the above
    std::atomic<bool> isSending{false};
    bool hasStopped = false;
    std::unordered_map<LaneId, Sender> senders; ///< on the network's thread only
};

Delivery::Delivery(const std::filesystem::path& database, const Options& options, PolicyHandler onPolicy, Log log)
    : _state(std::make_unique<State>(database, options, std::move(onPolicy), log)) {}

Delivery::~Delivery() {
    stop(std::chrono::milliseconds(0));
}

/** What would fail for good is found now, and not when there is something to send. */
void Delivery::setDestination(const Destination& destination) {
    const TlsClient tls = _state->trustFor(destination);
    _state->direct(_state->ledger.setDestination(destination), destination, tls);
}

void Delivery::removeDestination(const std::string& key) {
    if (const auto lane = _state->ledger.removeDestination(key)) {
        _state->dismiss(*lane);
    }
}

void Delivery::setSubscription(const Subscription& subscription) {
    _state->ledger.setSubscription(subscription);
}

void Delivery::removeSubscription(const std::string& key) {
    _state->ledger.removeSubscription(key);
}

Delivery::Ticket Delivery::post(std::span<const std::string> subscriptions, const Instance& indication) {
    return _state->ledger.post(subscriptions, indication);
}

void Delivery::wait(Ticket ticket) {
    _state->ledger.wait(ticket);
}

void Delivery::start() {
    const auto destinations = _state->ledger.forgetUnset();
    _state->network.start();
    _state->isSending = true;
    for (const auto& [lane, destination] : destinations) {
        _state->direct(lane, destination, _state->trustFor(destination));
    }
}

void Delivery::stop(std::chrono::milliseconds patience) {
    if (std::exchange(_state->hasStopped, true)) {
        return;
    }
    _state->ledger.refuse();
    if (_state->isSending) {
        _state->ledger.awaitSent(patience);
        _state->isSending = false;
        _state->network.post([this] { _state->senders.clear(); });
        _state->network.stop();
    }
    _state->ledger.end();
}

std::vector<Counters> Delivery::counters() const {
    return _state->ledger.counters();
}

} // namespace marlo::delivery
