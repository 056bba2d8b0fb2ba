/**
 * @file
 * What clients leave out of filters, destinations and subscriptions, and what is wrong with what they write.
 */
#pragma once

#include "host/schema/Schema.h"
#include "host/subscriptions/Objects.h"

namespace marlo::subscriptions {

/** Most bytes that the texts of one object may take together. */
inline constexpr std::size_t longestObject = 65536;

/**
 * The keys of a new object and its path: the system is this host and the class its own where nothing else is said,
 * and the name is made of `object.id`. What a client says of the system stands: some say their own. Throws
 * RequestError for a CreationClassName of another class and for texts that are too long.
 */
void completeKeys(const Schema& schema, Object& object);

/**
 * Compares the filter with the schema, and gives both SourceNamespaces and, where there is only one, SourceNamespace.
 * Without either the namespace is the filter's own. Throws RequestError for a statement, language, namespace or class
 * that there is not, and for a class that is none of indications.
 */
void completeFilter(const Schema& schema, Instance& filter);

/** Throws RequestError for what is no URL of a listener, and for other protocols than CIM-XML. */
void completeDestination(Instance& destination);

/**
 * Gives a new subscription its policies, state and times. Throws RequestError for policies that there are not.
 * Whether what it points at exists is not looked at.
 */
void completeSubscription(Instance& subscription, Time now);

/** Throws RequestError for values of properties that can be changed. */
void checkSubscription(const Instance& subscription);

} // namespace marlo::subscriptions
