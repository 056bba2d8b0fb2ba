/**
 * @file
 * The time that this process spends in fsync(2).
 */
#pragma once

namespace marlo::bench {

/** Microseconds since the last call. */
double takeSyncTime();

} // namespace marlo::bench
