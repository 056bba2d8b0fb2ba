/**
 * @file
 * Slots of services that this broker does not have.
 */
#pragma once

#include "host/broker/Slot.h"

#include <tuple>

namespace marlo::broker {

template <typename SlotType>
struct Unsupported;

/** Answers CMPI_RC_ERR_NOT_SUPPORTED, in the status returned or in the one that the last argument points at. */
template <typename R, typename... Arguments>
struct Unsupported<R (*)(Arguments...)> {
    static R call(Arguments... arguments) {
        if constexpr (std::is_same_v<R, CMPIStatus>) {
            return statusOf(CMPI_RC_ERR_NOT_SUPPORTED);
        } else {
            CMPIStatus* status = std::get<sizeof...(Arguments) - 1>(std::make_tuple(arguments...));
            if (status != nullptr) {
                *status = statusOf(CMPI_RC_ERR_NOT_SUPPORTED);
            }
            return emptyAnswer<R>();
        }
    }
};

template <typename SlotType>
inline constexpr SlotType unsupported = &Unsupported<SlotType>::call;

} // namespace marlo::broker
