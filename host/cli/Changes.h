/**
 * @file
 * The commands that change adapters: each one or more CIM operations, and a report of what is different afterwards.
 */
#pragma once

#include "host/cli/Commands.h"

namespace marlo::cli {

/**
 * Runs the command. The adapters are read before and after it, and every difference is printed, whether the command
 * brought it about by itself or set it off; a command of several operations ends with the first that fails. What
 * failed goes to standard error with the reason that was logged. Throws UsageError, OutputError.
 */
ExitCode runChange(ObjectManager& manager, const Options& options, Output& output);

/**
 * "192.0.2.10/24" as address and mask in dotted form; the mask is empty where no prefix length is given. Throws
 * UsageError for a length that is not 1 to 32. The address is handed on as it is.
 */
std::pair<std::string, std::string> splitPrefix(const std::string& address);

} // namespace marlo::cli
