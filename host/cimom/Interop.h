/**
 * @file
 * What a client learns of this object manager itself in the namespace where it looks first (DSP1033).
 */
#pragma once

#include "host/cimom/BuiltIn.h"

#include <functional>
#include <memory>
#include <string>
#include <vector>

namespace marlo {

/** What others serve in the interop namespace. */
struct InteropNeighbours {
    /** Whether a provider serves a class, which is then left to it. */
    std::function<bool(const std::string& className)> isServed;
    /** The paths of the instances of a class; none where nobody serves it. */
    std::function<std::vector<ObjectPath>(const std::string& className)> namesOf;
};

/**
 * Serves CIM_Namespace (one for each of the schema), CIM_ObjectManager (one) with CIM_NamespaceInManager between
 * them, and CIM_RegisteredProfile with CIM_ElementConformsToProfile: Profile Registration (DSP1033), and Indications
 * (DSP1054) while there is a CIM_IndicationService. Null where the schema, which outlives it, has none of these
 * classes in "root/interop".
 */
std::shared_ptr<BuiltIn> makeInterop(const Schema& schema, InteropNeighbours neighbours);

/**
 * The name of this host in all keys that name a system (CIM_ComputerSystem.Name): the one that it gives itself, which
 * no name service is asked for.
 */
std::string systemName();

} // namespace marlo
