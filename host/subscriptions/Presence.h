/**
 * @file
 * What clients see of the indication service beside filters, destinations and subscriptions (DSP1054).
 */
#pragma once

#include "host/cimom/ObjectManager.h"
#include "host/delivery/Delivery.h"
#include "host/subscriptions/Registry.h"

#include <string>
#include <vector>

namespace marlo::subscriptions {

inline constexpr std::size_t mostDestinations = 1000;
inline constexpr std::size_t mostFilters = 10000;
inline constexpr std::size_t mostSubscriptions = 10000;

/** The classes that presence() has instances of. */
std::vector<std::string> presenceClasses();

/**
 * All instances of one of these classes: the service, its capabilities, what it manages, and what was counted of each
 * destination since `start`. Counters tell destinations by Object::key().
 */
std::vector<Instance> presence(const std::string& className, const Registry& registry,
                               const std::vector<delivery::Counters>& counters, Time start);

} // namespace marlo::subscriptions
