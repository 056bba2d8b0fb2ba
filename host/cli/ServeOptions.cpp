#include "host/cli/OptionParts.h"
#include "host/server/Endpoints.h"

namespace marlo::cli {

namespace {

constexpr const char* ServeExamples =
    R"(Serves until it is interrupted or terminated; a hang-up has it read its configuration and certificates
anew. What it logs goes to standard error unless the configuration says otherwise.

Without --trial, accounts of this host get in that the configuration names, and only if this is root;
over the Unix domain socket root and the user that serves. With it, one more user named marlo does,
with a password that is made at start and printed.

Examples:
  marlo serve --trial
  marlo serve --http 127.0.0.1:5988 --https 192.0.2.2:5989
  marlo serve --config server.toml
  marlo serve --trial --schema site/schema --providers site/providers)";

constexpr const char* StatusExamples =
    R"(Asks the server of this host over its Unix domain socket. Exit status: 0 it runs and is
well, 1 it is degraded or does not run (the reason is on standard error), 2 the command line is wrong.

Examples:
  marlo status
  marlo status --json)";

constexpr const char* ListeningGroup = "Where it listens";

void addListeners(CLI::App& app, const std::string& name, std::optional<std::vector<std::string>>& addresses,
                  const std::string& text) {
    app.add_option(name, addresses, text)
        ->type_name("ADDRESS:PORT")
        ->delimiter(',')
        ->allow_extra_args(false)
        ->group(ListeningGroup);
}

void addSite(CLI::App& app, const std::string& name, std::vector<std::string>& directories, const std::string& text) {
    app.add_option(name, directories, text + ", besides what is shipped; may be repeated")
        ->type_name("DIR")
        ->check(CLI::ExistingDirectory.description(""))
        ->allow_extra_args(false)
        ->group("What is served");
}

} // namespace

void addConfiguration(CLI::App& app, ServerOptions& server) {
    app.add_option("--config", server.configurationFile, "The server's configuration, for /etc/marlo/server.toml")
        ->type_name("FILE");
}

void addSocket(CLI::App& app, ServerOptions& server, const std::string& text) {
    app.add_option("--socket", server.socket, text)->type_name("PATH")->group(ListeningGroup);
}

void addServerCommands(CLI::App& app, Options& options) {
    ServerOptions& server = options.server;
    CLI::App& serve = addCommand(app, options, Command::Serve, "serve",
                                 "Serve this host to WBEM clients over the network", ServeExamples);
    addConfiguration(serve, server);
    serve.add_flag("--trial", server.trial, "Let in a user marlo, with a password that is made now and printed");
    addListeners(serve, "--http", server.http, "Listen there for HTTP, loopback only; \"none\" for nowhere");
    addListeners(serve, "--https", server.https, "Listen there for HTTPS; \"none\" for nowhere");
    addSocket(serve, server, "Listen there for local tools; \"none\" for nowhere");
    addSite(serve, "--schema", server.schema, "Directory of class definitions (*.mof)");
    addSite(serve, "--providers", server.providers, "Directory of registrations (*.toml) and libraries");
    addAgentOptions(serve, options.agent);

    CLI::App& status =
        addCommand(app, options, Command::Status, "status", "Show how the server on this host is", StatusExamples);
    status.add_flag("--json", options.json, "Print JSON: the server's own answer");
    addConfiguration(status, server);
    addSocket(status, server, "Ask there");
}

} // namespace marlo::cli
