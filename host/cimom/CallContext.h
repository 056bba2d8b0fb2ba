/**
 * @file
 * What calls of all management interfaces have in common.
 */
#pragma once

#include "host/broker/Broker.h"
#include "host/cimom/ObjectManager.h"

#include <string>

namespace marlo {

/** Calls a function of an interface; a table may leave out what a provider does not have. */
template <typename Slot, typename MI, typename... Arguments>
CMPIStatus callSlot(Slot slot, MI& mi, Arguments... arguments) {
    return slot == nullptr ? CMPIStatus{CMPI_RC_ERR_NOT_SUPPORTED, nullptr} : slot(&mi, arguments...);
}

/** The context of a call, in the current scope: without flags, for this user and namespace. */
CMPIContext* newCallContext(const broker::Broker& broker, const std::string& principal, const std::string& nameSpace);

/** What a provider answered, as a CIM status; every failure has a message. */
Status statusOf(const CMPIStatus& answered, const std::string& provider);

/** What a provider threw; only while its exception is being handled. */
Status statusOfException(const std::string& provider);

} // namespace marlo
