/**
 * @file
 * Subscriptions at work: what the object manager was told of them, and the way of indications to their queues.
 */
#pragma once

#include "host/cimom/ObjectManager.h"
#include "host/delivery/Delivery.h"
#include "host/subscriptions/Objects.h"

#include <functional>
#include <map>
#include <memory>
#include <mutex>
#include <string>
#include <vector>

namespace marlo::subscriptions {

/** Starting and stopping is for one thread at a time; asking for any. */
class Activations {
  public:
    /** `mayRead` says whether a user may read instances at all; nobody is told of what he could not read. */
    Activations(ObjectManager& manager, std::shared_ptr<delivery::Delivery> delivery,
                std::function<bool(const std::string& user)> mayRead)
        : _manager(manager), _delivery(std::move(delivery)), _mayRead(std::move(mayRead)) {}

    /**
     * Activates a filter, in all of its namespaces or none, in the name of the subscription's owner. What was active
     * for the subscription before ends when that has succeeded. From its return on, and maybe before, indications are
     * queued for the subscription, which delivery knows by its key: on disk when the provider's CBDeliverIndication
     * has its answer.
     */
    Status start(const Object& subscription, const Instance& filter);

    /** Whatever providers answer; the first failure is given. */
    Status stop(Id subscription);
    void stopAll();

    [[nodiscard]] bool isActive(Id subscription) const;

  private:
    using Numbers = std::vector<SubscriptionId>;

    Status subscribe(const Object& subscription, const Instance& filter, Numbers& numbers);
    Status unsubscribe(const Numbers& numbers);
    Numbers exchange(Id subscription, Numbers numbers);

    ObjectManager& _manager;
    const std::shared_ptr<delivery::Delivery> _delivery;
    const std::function<bool(const std::string&)> _mayRead;
    mutable std::mutex _mutex; ///< guards _active
    std::map<Id, Numbers> _active;
};

} // namespace marlo::subscriptions
