/**
 * @file
 * What the operations on named values have in common.
 */
#pragma once

#include "host/broker/Slot.h"
#include "host/broker/Values.h"

namespace marlo::broker {

/** The value of a name; `missing` is the status when there is none. */
inline CMPIData getNamed(CMPIStatus& status, const NamedList& list, const char* name, CMPIrc missing) {
    if (name == nullptr) {
        status.rc = CMPI_RC_ERR_INVALID_PARAMETER;
        return noData();
    }
    const NamedData* entry = list.find(name);
    if (entry == nullptr) {
        status.rc = missing;
        return noData();
    }
    return entry->data;
}

/** The value at an index and, where wanted, its name, which lives as long as the object. */
inline CMPIData getNamedAt(CMPIStatus& status, const NamedList& list, CMPICount index, CMPIString** name,
                           CMPIrc missing) {
    const NamedData* entry = list.at(index);
    if (name != nullptr) {
        *name = entry == nullptr ? nullptr : &entry->name->handle;
    }
    if (entry == nullptr) {
        status.rc = missing;
        return noData();
    }
    return entry->data;
}

inline CMPIrc setNamed(Arena& arena, NamedList& list, const char* name, const CMPIValue* value, CMPIType type,
                       Accepted accepted) {
    if (name == nullptr) {
        return CMPI_RC_ERR_INVALID_PARAMETER;
    }
    CMPIData taken;
    const CMPIrc code = takeValue(arena, value, type, accepted, taken);
    if (code == CMPI_RC_OK) {
        list.set(name, taken);
    }
    return code;
}

} // namespace marlo::broker
