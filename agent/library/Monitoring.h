/**
 * @file
 * The one monitor of this process.
 */
#pragma once

#include "agent/events/Monitor.h"
#include "instrumentation/DateTime.h"

#include <chrono>

namespace Orv::Agent {

/**
 * The monitor over processBackEnd(), made by the first call; it lives as long as the process. Throws what that
 * throws. May be called from any thread.
 */
Monitor& processMonitor();

/** A moment by the clock on this host's wall; the offset is cut to whole hours where a zone has half ones. */
DateTime::Fields localTime(std::chrono::system_clock::time_point time);

} // namespace Orv::Agent
