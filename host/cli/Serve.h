/**
 * @file
 * `marlo serve`: this host, served over the network.
 */
#pragma once

#include "host/cli/Commands.h"
#include "host/cli/Options.h"
#include "host/cli/Output.h"

namespace marlo::cli {

/** Serves until a signal ends it; what there is to know about it goes to the output once it listens. */
ExitCode runServe(const Options& options, Output& output);

} // namespace marlo::cli
