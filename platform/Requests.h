/**
 * @file
 * Answering requests for the objects of one class through the CMPI broker.
 */
#pragma once

#include "platform/Objects.h"

#include <cmpift.h>

namespace Orv::Platform {

/**
 * One request of an object manager. Everything that is created belongs to the broker. Operations throw std::exception
 * when the inventory cannot be read or the broker creates nothing, and return the broker's status when it refuses a
 * result.
 */
struct Request {
    const ObjectClass& objects;
    const CMPIBroker* broker;
    const CMPIResult* result;
    const CMPIObjectPath* reference; ///< gives the namespace, and, where one object is asked for, its keys

    /** Returns the complete path of every object. */
    [[nodiscard]] CMPIStatus enumerateNames() const;

    /** Returns every object, with complete paths. `properties` as CMPI has it: null, or names ended by a null. */
    [[nodiscard]] CMPIStatus enumerate(const char** properties) const;

    /** Returns the object whose keys the reference has; CMPI_RC_ERR_NOT_FOUND when there is none. */
    [[nodiscard]] CMPIStatus get(const char** properties) const;
};

} // namespace Orv::Platform
