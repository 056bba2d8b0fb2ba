/**
 * @file
 * From declarations to the classes that namespaces show.
 */
#pragma once

#include "host/schema/Declarations.h"
#include "host/schema/Model.h"

namespace marlo::mof {

/** Checks all declarations and works out what is inherited. Throws Error for the first that is wrong. */
Model resolve(const Declarations& declarations);

} // namespace marlo::mof
