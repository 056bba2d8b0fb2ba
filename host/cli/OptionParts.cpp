#include "host/cli/OptionParts.h"

namespace marlo::cli {

namespace {

/** A check whose description is not put behind the name of the value in the help. */
CLI::Validator existingDirectory() {
    return CLI::ExistingDirectory.description("");
}

void addSinks(CLI::App& app, const std::string& name, std::vector<std::string>& sinks, const std::string& text) {
    app.add_option(name, sinks, text)->type_name("SINK")->delimiter(',')->allow_extra_args(false)->group("Agent");
}

} // namespace

void addDirectoryOptions(CLI::App& app, DirectoryOptions& directories) {
    const std::string group = "Where things are found";
    app.add_option("--schema", directories.schema, "Directory of the class definitions (*.mof)")
        ->type_name("DIR")
        ->check(existingDirectory())
        ->group(group);
    app.add_option("--providers", directories.providers, "Directory of the providers' registrations (*.toml)")
        ->type_name("DIR")
        ->check(existingDirectory())
        ->group(group);
    app.add_option("--libraries", directories.libraries, "Directory of the providers' libraries")
        ->type_name("DIR")
        ->check(existingDirectory())
        ->group(group);
}

void addAgentOptions(CLI::App& app, AgentOptions& agent) {
    const std::string group = "Agent";
    app.add_option("--tree", agent.treeFile, "Show the host that FILE describes instead of this one")
        ->type_name("FILE")
        ->group(group);
    app.add_option("--agent-config", agent.configurationFile, "The agent's configuration, in place of the host's")
        ->type_name("FILE")
        ->group(group);
    app.add_option("--log-level", agent.logLevel, "Log lines of this level and above")->type_name("N")->group(group);
    addSinks(app, "--log-sink", agent.logSinks, "Log there: stderr, syslog or file:PATH; may be repeated");
    app.add_option("--trace-level", agent.traceLevel, "Trace lines of this level and above")
        ->type_name("N")
        ->group(group);
    addSinks(app, "--trace-sink", agent.traceSinks, "Trace there: stderr, syslog or file:PATH; may be repeated");
}

void addNameSpace(CLI::App& app, Options& options) {
    app.add_option("-n,--namespace", options.nameSpace, "CIM namespace")
        ->type_name("NAMESPACE")
        ->capture_default_str();
}

void addPositional(CLI::App& app, const std::string& name, std::string& value, const std::string& text) {
    app.add_option(name, value, text)->type_name("")->required();
}

CLI::App& addCommand(CLI::App& app, Options& options, Command command, const std::string& name,
                     const std::string& description, const std::string& footer) {
    CLI::App& added = *app.add_subcommand(name, description);
    added.footer(footer);
    added.callback([&options, command] { options.command = command; });
    return added;
}

} // namespace marlo::cli
