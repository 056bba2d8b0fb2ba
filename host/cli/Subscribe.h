/**
 * @file
 * The commands about subscriptions, each some CIM operations at the running server.
 */
#pragma once

#include "host/cli/Commands.h"

namespace marlo::cli {

bool isAboutSubscriptions(Command command);

/**
 * `subscribe`, `subscriptions` and `unsubscribe`. What went wrong goes to standard error; what `subscribe` made
 * before something was refused is removed again. Throws OutputError, UsageError.
 */
ExitCode runSubscriptions(const Options& options, Output& output);

} // namespace marlo::cli
