/**
 * @file
 * Parts of the command line's description that several commands share, and the groups of commands.
 *
 * For source files only: it brings the library of the command line with it.
 */
#pragma once

#include "host/cli/Options.h"

#include <CLI/App.hpp>
#include <string>

namespace marlo::cli {

/** A command that sets `options.command` when it is the one that is called. */
CLI::App& addCommand(CLI::App& app, Options& options, Command command, const std::string& name,
                     const std::string& description, const std::string& footer);

/** An argument that is required, shown by its name alone. */
void addPositional(CLI::App& app, const std::string& name, std::string& value, const std::string& text);

void addAgentOptions(CLI::App& app, AgentOptions& agent);
void addDirectoryOptions(CLI::App& app, DirectoryOptions& directories);
void addNameSpace(CLI::App& app, Options& options);

/** The server to be asked: its configuration, or the socket itself. */
void addConfiguration(CLI::App& app, ServerOptions& server);
void addSocket(CLI::App& app, ServerOptions& server, const std::string& text);

/** The commands that change an adapter or the host. */
void addChangeCommands(CLI::App& app, Options& options);

/** `subscribe`, `subscriptions` and `unsubscribe`. */
void addSubscriptionCommands(CLI::App& app, Options& options);

/** `serve` and `status`. */
void addServerCommands(CLI::App& app, Options& options);

} // namespace marlo::cli
