/**
 * @file
 * Indications as they come.
 */
#pragma once

#include "host/cli/Commands.h"

namespace marlo::cli {

/**
 * Subscribes to what the options say and prints a line for each indication, until as many as asked for have come, the
 * time is over, or the process gets SIGINT or SIGTERM; then unsubscribes. Failed when nothing can be watched, and
 * when it ends before as many as asked for have come. Call before any thread runs: it blocks those signals in all of
 * them.
 */
ExitCode runWatch(ObjectManager& manager, const Options& options, Output& output);

} // namespace marlo::cli
