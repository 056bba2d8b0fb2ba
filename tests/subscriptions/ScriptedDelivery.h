/**
 * @file
 * Delivery that sends nothing: it has the symbols of the real one, remembers what it was told, and fails as it is
 * told.
 */
#pragma once

#include "host/delivery/Delivery.h"

#include <map>
#include <mutex>
#include <string>
#include <utility>
#include <vector>

namespace marlo::test {

/** One life of a delivery, from its construction on. Any thread. */
struct ScriptedDelivery {
    std::mutex mutex; ///< guards all below
    delivery::Delivery::PolicyHandler onPolicy;
    std::map<std::string, delivery::Destination> destinations;
    std::map<std::string, delivery::Subscription> subscriptions;
    std::vector<std::pair<std::string, Instance>> posts; ///< by subscription
    unsigned waits = 0;
    bool isStarted = false;
    bool isStopped = false;
    std::string refusal;     ///< of setDestination, as std::invalid_argument
    bool diskIsFull = false; ///< wait() throws NotKept

    /** The one that was constructed last; valid until the next one is. */
    static ScriptedDelivery& latest();

    [[nodiscard]] std::vector<std::pair<std::string, Instance>> posted() {
        const std::lock_guard lock(mutex);
        return posts;
    }
};

} // namespace marlo::test
