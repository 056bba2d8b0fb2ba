/**
 * @file
 * What a client learns of this object manager itself in the namespace where it looks first (DSP1033).
 */
#pragma once

#include "host/cimom/BuiltIn.h"

#include <memory>

namespace marlo {

/**
 * Serves CIM_Namespace (one for each of the schema), CIM_ObjectManager (one) with CIM_NamespaceInManager between
 * them, and CIM_RegisteredProfile with CIM_ElementConformsToProfile. Null where the schema, which outlives it, has
 * no namespace "root/interop" with these classes.
 */
std::shared_ptr<BuiltIn> makeInterop(const Schema& schema);

} // namespace marlo
