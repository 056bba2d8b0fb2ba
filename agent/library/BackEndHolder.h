/**
 * @file
 * The one back end of this process.
 */
#pragma once

#include "agent/tree/BackEnd.h"

#include <exception>

namespace Orv::Agent {

/**
 * The back end that the configuration names, made by the first call; it lives as long as the process, because threads
 * of an object manager may still read when static objects are destroyed. A forked process makes one of its own.
 *
 * Throws std::exception when the configuration is wrong or the back end cannot be made; the next call tries again.
 * May be called from any thread; costs one atomic read once the back end is there.
 */
BackEnd& processBackEnd();

/** Logs the text of a failure under the agent's own name. */
void reportFailure(const char* function, const char* text) noexcept;

/** Calls `operation`; an exception that leaves it is logged on its way. */
template <typename Operation>
decltype(auto) reported(const char* function, Operation operation) {
    try {
        return operation();
    } catch (const std::exception& failure) {
        reportFailure(function, failure.what());
        throw;
    }
}

} // namespace Orv::Agent
