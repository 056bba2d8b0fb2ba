/**
 * @file
 * Completion of marlo's command line in shells.
 */
#pragma once

#include <string>

namespace CLI {
class App;
}

namespace marlo::cli {

/**
 * A bash script that completes commands and options of a command line description, files and directories behind the
 * options that take them, and names of classes, for which it asks marlo itself.
 */
std::string makeBashCompletion(const CLI::App& app);

} // namespace marlo::cli
