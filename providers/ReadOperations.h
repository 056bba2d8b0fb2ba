/**
 * @file
 * GetInstance, EnumInstanceNames and EnumInstances, which all instance providers answer in the same way: build every
 * instance of the class afresh, then return all of them, their paths, or the one that was asked for.
 */
#pragma once

#include "factory/NetworkAdapterObjectFactory.h"

#include <string>

#include <cmpift.h>

namespace Orv::NetworkAdapterComposite {

/** The factory's enumeration of a provider's class. */
using Enumeration = int (NetworkAdapterObjectFactory::*)(const CMPIBroker*, const CMPIContext*, const CMPIObjectPath*,
                                                         const char*, const char**, bool, std::vector<CMPIInstance*>&,
                                                         CMPIStatus*);

/** What makes one MI function different from the others of its kind. */
struct ReadFunction {
    const std::string& logger;
    const char* file;
    const char* function; ///< its name in the log
    const CMPIBroker* broker;
    Enumeration enumerate;
    const char* failure; ///< logged when the enumeration does not produce the class
    unsigned line = __builtin_LINE();
};

/*
 * All three: the class of `reference` selects what is enumerated. An enumeration that fails ends the call with the
 * status that it left, without CMReturnDone and without an exit mark. Exceptions of the broker and of the agent leave
 * the call.
 */

/**
 * Returns the first instance whose path equals `reference`; none when there is none, which is a success. A reference
 * without keys is answered CMPI_RC_ERR_FAILED.
 */
CMPIStatus getInstance(const ReadFunction& self, const CMPIContext* context, const CMPIResult* result,
                       const CMPIObjectPath* reference, const char** properties);

/** Returns the path of every instance, in the namespace of `reference` and on this system. */
CMPIStatus enumInstanceNames(const ReadFunction& self, const CMPIContext* context, const CMPIResult* result,
                             const CMPIObjectPath* reference);

/** Returns every instance as the factory made it, even one that is null: the object manager tells what it is. */
CMPIStatus enumInstances(const ReadFunction& self, const CMPIContext* context, const CMPIResult* result,
                         const CMPIObjectPath* reference, const char** properties);

} // namespace Orv::NetworkAdapterComposite
