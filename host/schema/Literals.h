/**
 * @file
 * Values of MOF as values of CIM types.
 */
#pragma once

#include "host/model/Value.h"
#include "host/schema/Declarations.h"

#include <string>
#include <string_view>

namespace marlo::mof {

/** The CMPI type of a MOF type name, CMPI_null for others. */
CMPIType findType(std::string_view name);

/** How MOF writes a type: "uint16[]". */
std::string showType(CMPIType type);

/**
 * What was written as a value of a type. Throws Error where it is none: another kind of literal, an integer out of
 * the type's range, one value for an array, a text that is no date-time or no object path. `what` names the thing
 * that has the value.
 */
Value makeValue(CMPIType type, const Initializer& written, const std::string& what);

} // namespace marlo::mof
