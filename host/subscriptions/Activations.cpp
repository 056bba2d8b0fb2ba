#include "host/subscriptions/Activations.h"

#include <algorithm>
#include <span>
#include <utility>

namespace marlo::subscriptions {

namespace {

/** Queues what it gets; the deliverer waits for the disk once, behind all sinks. */
ObjectManager::RoundSink makeSink(const std::shared_ptr<delivery::Delivery>& delivery, const std::string& key) {
    return [delivery, key](Instance&& indication, DeliveryRound& round) {
        const auto ticket = delivery->post(std::span(&key, 1), indication);
        round.afterwards(delivery.get(), [delivery, ticket] { delivery->wait(ticket); });
    };
}

} // namespace

Status Activations::subscribe(const Object& subscription, const Instance& filter, Numbers& numbers) {
    const ActingFor acting(subscription.owner);
    const auto sink = makeSink(_delivery, subscription.key());
    for (const std::string& nameSpace : namespacesOf(filter)) {
        SubscriptionId number = 0;
        Status status =
            _manager.subscribe(nameSpace, textOf(filter, "Query"), textOf(filter, "QueryLanguage"), sink, number);
        if (!status.ok()) {
            static_cast<void>(unsubscribe(numbers)); // what made it fail is what the client is told
            return status;
        }
        numbers.push_back(number);
    }
    return {};
}

Status Activations::unsubscribe(const Numbers& numbers) {
    Status status;
    std::for_each(numbers.rbegin(), numbers.rend(), [&](const Numbers::value_type& number) {
        Status ended = _manager.unsubscribe(number);
        if (status.ok()) {
            status = std::move(ended);
        }
    });
    return status;
}

Activations::Numbers Activations::exchange(Id subscription, Numbers numbers) {
    const std::lock_guard lock(_mutex);
    Numbers former = std::exchange(_active[subscription], std::move(numbers));
    if (_active[subscription].empty()) {
        _active.erase(subscription);
    }
    return former;
}

Status Activations::start(const Object& subscription, const Instance& filter) {
    if (_mayRead && !_mayRead(subscription.owner)) {
        return {CMPI_RC_ERR_ACCESS_DENIED,
                "user '" + subscription.owner + "', whose subscription it is, may not read",
                {}};
    }
    Numbers numbers;
    Status status = subscribe(subscription, filter, numbers);
    if (status.ok()) {
        static_cast<void>(unsubscribe(exchange(subscription.id, std::move(numbers))));
    }
    return status;
}

Status Activations::stop(Id subscription) {
    return unsubscribe(exchange(subscription, {}));
}

void Activations::stopAll() {
    std::map<Id, Numbers> all;
    {
        const std::lock_guard lock(_mutex);
        all = std::exchange(_active, {});
    }
    for (const auto& [id, numbers] : all) {
        static_cast<void>(unsubscribe(numbers));
    }
}

bool Activations::isActive(Id subscription) const {
    const std::lock_guard lock(_mutex);
    return _active.count(subscription) != 0;
}

} // namespace marlo::subscriptions
