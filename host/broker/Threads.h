/**
 * @file
 * The threads that providers have the broker start.
 */
#pragma once

#include <chrono>

namespace marlo::broker {

/**
 * Waits until every thread of this process that a broker started has come to the end of its function; false when some
 * still run after `longest`.
 */
bool waitForThreads(std::chrono::milliseconds longest);

} // namespace marlo::broker
