/**
 * @file
 * Values as they cross the CMPI boundary.
 */
#pragma once

#include "host/broker/Arena.h"

#include <cmpift.h>

namespace marlo::broker {

/** What may be stored: CIM's own types, or bare pointers as well (arguments and context entries). */
enum class Accepted { cim, cimAndPointers };

/** The type under which a value is kept: texts as CMPI_string. */
CMPIType storedType(CMPIType type);

/** True for a plain CIM type (no array). */
bool isCimType(CMPIType type);

/**
 * Copies a value that a caller passes in into `arena`. A null `value`, or a null handle in it, is NULL of the type.
 * Answers CMPI_RC_ERR_INVALID_DATA_TYPE for a type code that is none, CMPI_RC_ERR_TYPE_MISMATCH for a handle of
 * another type than `type` says; `data` is set for CMPI_RC_OK only.
 */
CMPIrc takeValue(Arena& arena, const CMPIValue* value, CMPIType type, Accepted accepted, CMPIData& data);

/** Copies stored data; immutable objects that lie in `arena` already are shared. */
CMPIData copyData(Arena& arena, const CMPIData& data);

/** A key binding is never NULL nor an array. */
inline bool canBeKey(const CMPIData& data) {
    return (data.state & CMPI_nullValue) == 0 && (data.type & CMPI_ARRAY) == 0;
}

/** NULL of a type. */
inline CMPIData nullData(CMPIType type) {
    CMPIData data{};
    data.type = type;
    data.state = CMPI_nullValue;
    return data;
}

/** What is answered for a name or index that does not exist. */
inline CMPIData noData() {
    CMPIData data{};
    data.state = CMPI_nullValue | CMPI_notFound;
    return data;
}

} // namespace marlo::broker
