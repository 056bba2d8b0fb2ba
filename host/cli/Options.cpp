#include "host/cli/Options.h"

#include "host/cli/Completion.h"

#include <CLI/App.hpp>
#include <CLI/Config.hpp>
#include <CLI/Formatter.hpp>
#include <array>
#include <sstream>

namespace marlo::cli {

namespace {

constexpr const char* Introduction =
    "Shows the network adapters of this host, and any object that its CIM providers serve.";

constexpr const char* Conclusion = R"(Exit status: 0 answered, 1 the operation failed, 2 the command line is wrong.

Examples:
  marlo adapters
  marlo enum MARLO_NetworkAdapterConfiguration --json
  marlo --help
  marlo enum --help)";

constexpr const char* AdaptersExamples = R"(Examples:
  marlo adapters
  marlo adapters --json
  marlo adapters -p SettingID,Status,IPAddress
  marlo adapters --tree host.toml)";

constexpr const char* EnumerateExamples = R"(Examples:
  marlo enum MARLO_NetworkAdapterConfiguration
  marlo enum MARLO_NetworkAdapterConfiguration -p SettingID,IPAddress --json
  marlo enum TAVIS_NetworkPort -n root/quarn)";

constexpr const char* NamesExamples = R"(Examples:
  marlo names MARLO_LogicalNetworkAdapter
  marlo names TAVIS_NetworkCard -n root/quarn --json)";

constexpr const char* GetExamples = R"(Examples:
  marlo get 'MARLO_NetworkAdapterConfiguration.SettingID="eth0"'
  marlo get 'root/tavis:MARLO_NetworkAdapterConfiguration.SettingID="eth0"' -p IPAddress --json)";

constexpr const char* ClassesExamples = R"(Examples:
  marlo classes
  marlo classes -n root/quarn --names)";

constexpr const char* CompletionExamples = R"(Examples:
  marlo completion bash)";

void addDirectoryOptions(CLI::App& app, DirectoryOptions& directories) {
    const std::string group = "Where things are found";
    app.add_option("--schema", directories.schema, "Directory of the class definitions (*.mof)")
        ->type_name("DIR")
        ->check(CLI::ExistingDirectory)
        ->group(group);
    app.add_option("--providers", directories.providers, "Directory of the providers' registrations (*.toml)")
        ->type_name("DIR")
        ->check(CLI::ExistingDirectory)
        ->group(group);
    app.add_option("--libraries", directories.libraries, "Directory of the providers' libraries")
        ->type_name("DIR")
        ->check(CLI::ExistingDirectory)
        ->group(group);
}

void addSinks(CLI::App& app, const std::string& name, std::vector<std::string>& sinks, const std::string& text) {
    app.add_option(name, sinks, text)->type_name("SINK")->delimiter(',')->allow_extra_args(false)->group("Agent");
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

void addProperties(CLI::App& app, Options& options, const std::string& text) {
    app.add_option("-p,--property", options.properties, text)
        ->type_name("NAME,...")
        ->delimiter(',')
        ->allow_extra_args(false);
}

CLI::App& addCommand(CLI::App& app, Options& options, Command command, const std::string& name,
                     const std::string& description, const std::string& footer) {
    CLI::App& added = *app.add_subcommand(name, description);
    added.footer(footer);
    added.callback([&options, command] { options.command = command; });
    return added;
}

/** Options that every command has which asks the object manager. */
void addCommonOptions(CLI::App& app, Options& options) {
    app.add_flag("--json", options.json, "Print JSON: an array with an object for each answer");
    addNameSpace(app, options);
    addAgentOptions(app, options.agent);
    addDirectoryOptions(app, options.directories);
}

void addObjectCommands(CLI::App& app, Options& options) {
    CLI::App& adapters = addCommand(app, options, Command::Adapters, "adapters",
                                    "Show all network adapters in one table", AdaptersExamples);
    addProperties(adapters, options, "Show these properties; Status is the port's, all others the configuration's");
    addCommonOptions(adapters, options);

    CLI::App& enumerate = addCommand(app, options, Command::Enumerate, "enum",
                                     "Show all instances of a class and its subclasses", EnumerateExamples);
    enumerate.add_option("CLASS", options.argument, "The class")->required();
    addProperties(enumerate, options, "Show these properties only; may be repeated");
    addCommonOptions(enumerate, options);

    CLI::App& names = addCommand(app, options, Command::Names, "names",
                                 "Show the paths of all instances of a class and its subclasses", NamesExamples);
    names.add_option("CLASS", options.argument, "The class")->required();
    addCommonOptions(names, options);

    CLI::App& get = addCommand(app, options, Command::Get, "get", "Show the instance at a path", GetExamples);
    get.add_option("PATH", options.argument, "[namespace:]Class.Key=\"value\",...")->required();
    addProperties(get, options, "Show these properties only; may be repeated");
    addCommonOptions(get, options);
}

void addOtherCommands(CLI::App& app, Options& options) {
    CLI::App& classes =
        addCommand(app, options, Command::Classes, "classes", "Show the classes of a namespace", ClassesExamples);
    classes.add_flag("--json", options.json, "Print JSON: an array with an object for each class");
    classes.add_flag("--names", options.namesOnly, "Print the names alone, one on a line");
    addNameSpace(classes, options);
    addDirectoryOptions(classes, options.directories);

    CLI::App& completion = addCommand(app, options, Command::Completion, "completion",
                                      "Print a script that completes marlo's command line", CompletionExamples);
    completion.add_option("SHELL", options.argument, "bash")->required()->check(CLI::IsMember({"bash"}));
}

/** An option that was given, but as an empty text, would otherwise be taken for one that was not given. */
void refuseEmptyTexts(const CLI::App& app) {
    for (const CLI::Option* option : app.get_options()) {
        for (const std::string& value : option->results()) {
            if (value.empty()) {
                throw UsageError(option->get_name() + " is empty");
            }
        }
    }
}

} // namespace

CommandLine readCommandLine(int argc, const char* const* argv) {
    CommandLine line;
    CLI::App app(Introduction, "marlo");
    app.footer(Conclusion);
    app.set_version_flag("--version", "marlo " MARLO_VERSION, "Print the version and exit");
    app.require_subcommand(1);
    app.get_formatter()->column_width(32);
    addAgentOptions(app, line.options.agent); // before the command as well as behind it
    addDirectoryOptions(app, line.options.directories);
    addObjectCommands(app, line.options);
    addOtherCommands(app, line.options);
    try {
        app.parse(argc, argv);
        refuseEmptyTexts(app);
        refuseEmptyTexts(*app.get_subcommands().front());
    } catch (const CLI::Success& success) {
        std::ostringstream text;
        app.exit(success, text, text);
        line.answer = text.str();
        return line;
    } catch (const CLI::ParseError& error) {
        throw UsageError(error.what());
    }
    if (line.options.command == Command::Completion) {
        line.answer = makeBashCompletion(app);
    }
    return line;
}

} // namespace marlo::cli
