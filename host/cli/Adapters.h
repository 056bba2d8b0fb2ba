/**
 * @file
 * The table of network adapters.
 */
#pragma once

#include "host/cli/Commands.h"

namespace marlo::cli {

/** Joins the adapters' configurations with the status of their ports, and prints a table or JSON. */
ExitCode runAdapters(ObjectManager& manager, const Options& options, Output& output);

} // namespace marlo::cli
