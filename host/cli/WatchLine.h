/**
 * @file
 * An indication on a line.
 */
#pragma once

#include "host/model/Instance.h"
#include "host/schema/Schema.h"

#include <string>

namespace marlo::cli {

/**
 * Time, adapter, event, severity and message in columns, "-" for what the indication does not tell. The time is the
 * event's own, to the second, in the event's time zone. The adapter is the Tag of AlertingManagedElement, or all of
 * it where it is no path with a Tag; the event is the class without what the classes of adapters have in common.
 */
std::string showIndication(const Schema& schema, const Instance& indication);

} // namespace marlo::cli
