/**
 * @file
 * Where things are, and what the agent library of this process is told.
 */
#pragma once

#include "host/cimom/ObjectManager.h"
#include "host/cli/Options.h"

namespace marlo::cli {

/**
 * The directories of the object manager: those that were named, else those beside the executable, in the build tree
 * as in the installed one. Throws std::runtime_error when the executable cannot be told.
 */
ObjectManagerOptions findDirectories(const DirectoryOptions& named);

/**
 * Puts what the command line says to the agent into the environment that the agent library reads when the first
 * provider is loaded. Call before any thread runs. Throws UsageError for a file that cannot be read.
 */
void tellAgent(const AgentOptions& agent);

} // namespace marlo::cli
