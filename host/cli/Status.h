/**
 * @file
 * `marlo status`: how the server on this host is.
 */
#pragma once

#include "host/cli/Commands.h"
#include "host/cli/Options.h"
#include "host/cli/Output.h"
#include "host/server/StatusReport.h"

#include <string>

namespace marlo::cli {

/** Answered when the server runs and is well; Failed, with the reason on standard error, when it is not. */
ExitCode runStatus(const Options& options, Output& output);

/** The report as people read it. */
std::string showStatus(const server::StatusReport& report, std::size_t width, bool colours);

/** The socket that was named, or that the configuration says, or the usual one; throws server::NotRunning. */
std::string findSocket(const ServerOptions& options);

} // namespace marlo::cli
