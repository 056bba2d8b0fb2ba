/**
 * @file
 * Filters, destinations and subscriptions as they are kept.
 */
#pragma once

#include "host/model/Instance.h"
#include "host/subscriptions/Properties.h"

#include <cstdint>
#include <memory>
#include <optional>
#include <string>
#include <vector>

namespace marlo::subscriptions {

inline constexpr const char* interop = "root/interop";
inline constexpr const char* filterClass = "CIM_IndicationFilter";
inline constexpr const char* destinationClass = "CIM_ListenerDestinationCIMXML";
inline constexpr const char* handlerClass = "CIM_IndicationHandlerCIMXML"; ///< the older name of the one above
inline constexpr const char* subscriptionClass = "CIM_IndicationSubscription";

/** Tells an object from every other one that there is or was. */
using Id = std::int64_t;

enum class Kind { filter, destination, subscription };

/** Values of CIM_AbstractIndicationSubscription.SubscriptionState. */
inline constexpr std::uint64_t stateEnabled = 2;
inline constexpr std::uint64_t stateDisabled = 4;

/** Value of CIM_ListenerDestination.PersistenceType for what does not outlive a restart. */
inline constexpr std::uint64_t persistenceTransient = 3;

struct Object {
    Id id = 0;
    Kind kind = Kind::filter;
    bool isFixed = false; ///< of the server's own making: nobody changes or removes it
    std::string owner;    ///< the user who made it
    Instance instance;    ///< all properties that it has, keys too; a complete path without a host

    /** What delivery and the log tell it by. */
    [[nodiscard]] std::string key() const { return std::to_string(id); }

    [[nodiscard]] std::string path() const { return instance.path.toString(); }
};

/** Never changed once made: another one takes its place. */
using ObjectPointer = std::shared_ptr<const Object>;

/** Nothing for a class that is none of these. */
std::optional<Kind> kindOf(const std::string& className);

/** The namespaces that a filter's indications come from, as its properties were completed. */
std::vector<std::string> namespacesOf(const Instance& filter);

/** Whether a subscription is to be delivered to, as far as its owner says. */
bool isWanted(const Object& subscription);

/** When a subscription ends; nothing for one that lasts. */
std::optional<Time> endOf(const Instance& subscription);

/** What a subscription's `Filter` or `Handler` points at. */
std::string targetOf(const Object& subscription, const char* role);

} // namespace marlo::subscriptions
