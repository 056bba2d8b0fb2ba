#include "tests/subscriptions/ScriptedDelivery.h"

#include <algorithm>
#include <memory>

namespace marlo::test {

namespace {

std::shared_ptr<ScriptedDelivery>& latestOne() {
    static std::shared_ptr<ScriptedDelivery> one;
    return one;
}

} // namespace

ScriptedDelivery& ScriptedDelivery::latest() {
    return *latestOne();
}

} // namespace marlo::test

namespace marlo::delivery {

using test::ScriptedDelivery;

class Delivery::State {
  public:
    std::shared_ptr<ScriptedDelivery> script = std::make_shared<ScriptedDelivery>();
};

Delivery::Delivery(const std::filesystem::path& /*database*/, const Options& /*options*/, PolicyHandler onPolicy,
                   Log /*log*/)
    : _state(std::make_unique<State>()) {
    _state->script->onPolicy = std::move(onPolicy);
    test::latestOne() = _state->script;
}

Delivery::~Delivery() = default;

void Delivery::setDestination(const Destination& destination) {
    const std::lock_guard lock(_state->script->mutex);
    if (!_state->script->refusal.empty() && !destination.authorityFile.empty()) {
        throw std::invalid_argument(_state->script->refusal);
    }
    _state->script->destinations[destination.key] = destination;
}

void Delivery::removeDestination(const std::string& key) {
    const std::lock_guard lock(_state->script->mutex);
    _state->script->destinations.erase(key);
}

void Delivery::setSubscription(const Subscription& subscription) {
    const std::lock_guard lock(_state->script->mutex);
    if (_state->script->destinations.count(subscription.destination) == 0) {
        throw std::invalid_argument("no destination " + subscription.destination);
    }
    _state->script->subscriptions[subscription.key] = subscription;
}

void Delivery::removeSubscription(const std::string& key) {
    const std::lock_guard lock(_state->script->mutex);
    _state->script->subscriptions.erase(key);
}

Delivery::Ticket Delivery::post(std::span<const std::string> subscriptions, const Instance& indication) {
    const std::lock_guard lock(_state->script->mutex);
    for (const std::string& key : subscriptions) {
        _state->script->posts.emplace_back(key, indication);
    }
    return _state->script->posts.size();
}

void Delivery::wait(Ticket /*ticket*/) {
    const std::lock_guard lock(_state->script->mutex);
    ++_state->script->waits;
    if (_state->script->diskIsFull) {
        throw NotKept("the disk is full");
    }
}

void Delivery::start() {
    const std::lock_guard lock(_state->script->mutex);
    _state->script->isStarted = true;
}

void Delivery::stop(std::chrono::milliseconds /*patience*/) {
    const std::lock_guard lock(_state->script->mutex);
    _state->script->isStopped = true;
}

/** As many sent as were posted, to every destination; enough to tell counters of destinations apart. */
std::vector<Counters> Delivery::counters() const {
    const std::lock_guard lock(_state->script->mutex);
    std::vector<Counters> all;
    for (const auto& [key, destination] : _state->script->destinations) {
        Counters counters;
        counters.destination = key;
        counters.url = destination.url;
        counters.sequenceContext = "context " + key;
        counters.sent = static_cast<std::uint64_t>(std::count_if(
            _state->script->posts.begin(), _state->script->posts.end(), [&, to = key](const auto& post) {
                const auto known = _state->script->subscriptions.find(post.first);
                return known != _state->script->subscriptions.end() && known->second.destination == to;
            }));
        all.push_back(std::move(counters));
    }
    return all;
}

} // namespace marlo::delivery
