/**
 * @file
 * Utilities of the agent library that the providers use. All of them may be called from any thread at any time.
 */
#pragma once

#include "instrumentation/Export.h"

#include <string>

#include <cmpidt.h>

namespace Orv {

/** CIM type of a property that mapProperty copies. The numbers are part of the interface. */
enum DataType : int {
    DATA_TYPE_UINT16 = 1,
    DATA_TYPE_UINT64 = 3,
    DATA_TYPE_BOOLEAN = 7,
    DATA_TYPE_STRING = 8,
};

/** True when two texts are equal but for the case of ASCII letters, as CIM compares names. Null equals only null. */
ORV_API bool textEqual(const char* left, const char* right);

/** `text` without its spaces (U+0020), wherever they stand. */
ORV_API std::string stripSpaces(std::string text);

/** The host's fully qualified domain name where it has one, else its host name. */
ORV_API std::string getSystemName();

/**
 * True when two object paths name the same object: the class names are equal but for case, and the key bindings are
 * the same, names compared without case, types and values exactly. The order of the keys and the hosts do not count;
 * the namespaces count (without case) when `compareNameSpace` is true. False when either path is null.
 */
ORV_API bool isObjPathsEqual(const CMPIObjectPath* left, const CMPIObjectPath* right, bool compareNameSpace);

/**
 * Copies one property from an instance to another under the same name.
 *
 * `source` is an element of a broker's enumeration whose value is an instance. The property is set on `target` as the
 * CIM type that `type` denotes: to NULL of that type when the source property is NULL or absent. A value of another
 * type sets nothing and reports CMPI_RC_ERR_TYPE_MISMATCH through `status`, as does a null `target` with
 * CMPI_RC_ERR_INVALID_PARAMETER; otherwise `status` (which may be null) ends as the write left it.
 */
ORV_API void mapProperty(CMPIData source, CMPIInstance* target, const char* name, DataType type, CMPIStatus* status);

} // namespace Orv
