/**
 * @file
 * What every slot of a function table does before and after its own work.
 */
#pragma once

#include "host/broker/Objects.h"
#include "host/broker/Scope.h"

#include <exception>
#include <memory>
#include <type_traits>

#include <cmpift.h>

namespace marlo::broker {

inline CMPIStatus statusOf(CMPIrc code) {
    return {code, nullptr};
}

/** What a slot returns when it has nothing to return. */
template <typename R>
R emptyAnswer() {
    if constexpr (std::is_same_v<R, CMPIData>) {
        CMPIData data{};
        data.state = CMPI_nullValue;
        return data;
    } else {
        return R{};
    }
}

/**
 * Makes a slot of an operation: finds the object behind the handle, or answers CMPI_RC_ERR_INVALID_HANDLE; stands in
 * for a status that the caller does not want; and lets no exception (memory is out) reach the caller, who may be C.
 *
 * `R operation(CMPIStatus&, Object&, arguments...)` becomes `R slot(const Handle*, arguments..., CMPIStatus*)`;
 * `CMPIrc operation(Object&, arguments...)` becomes `CMPIStatus slot(const Handle*, arguments...)`.
 */
template <auto Operation>
struct Slot;

template <typename O, typename R, typename... Arguments, R (*Operation)(CMPIStatus&, O&, Arguments...)>
struct Slot<Operation> {
    static R call(const typename O::Handle* handle, Arguments... arguments, CMPIStatus* status) {
        CMPIStatus own{};
        R answer = emptyAnswer<R>();
        try {
            if (O* object = objectOf<O>(handle)) {
                answer = Operation(own, *object, arguments...);
            } else {
                own.rc = CMPI_RC_ERR_INVALID_HANDLE;
            }
        } catch (const std::exception&) {
            own = statusOf(CMPI_RC_ERR_FAILED);
        }
        if (status != nullptr) {
            *status = own;
        }
        return answer;
    }
};

template <typename O, typename... Arguments, CMPIrc (*Operation)(O&, Arguments...)>

requires(!std::is_same_v<O, CMPIStatus>) struct Slot<Operation> {
    static CMPIStatus call(const typename O::Handle* handle, Arguments... arguments) {
        try {
            O* object = objectOf<O>(handle);
            return statusOf(object != nullptr ? Operation(*object, arguments...) : CMPI_RC_ERR_INVALID_HANDLE);
        } catch (const std::exception&) {
            return statusOf(CMPI_RC_ERR_FAILED);
        }
    }
};

template <auto Operation>
inline constexpr auto slot = &Slot<Operation>::call;

/** Ends a clone; what belongs to a call ends with the call and stays as it is. */
template <typename O>
CMPIStatus releaseSlot(typename O::Handle* handle) {
    const O* object = objectOf<O>(handle);
    if (object == nullptr) {
        return statusOf(CMPI_RC_ERR_INVALID_HANDLE);
    }
    if (object->isClone()) {
        delete &object->arena(); // made by makeClone()
    }
    return statusOf(CMPI_RC_OK);
}

/** Copies an object into an arena of its own, which lives until the copy is released. */
template <typename O>
O* makeClone(O& object) {
    auto arena = std::make_unique<Arena>(Arena::Use::clone);
    O* copied = object.copyTo(*arena);
    arena->setRoot(static_cast<const ObjectBase*>(copied));
    static_cast<void>(arena.release()); // ended by releaseSlot()
    return copied;
}

template <typename O>
typename O::Handle* cloneOperation(CMPIStatus&, O& object) {
    return &makeClone(object)->handle;
}

} // namespace marlo::broker
