#include "host/cli/Options.h"

#include "host/cli/Completion.h"
#include "host/cli/OptionParts.h"

#include <CLI/Config.hpp>
#include <CLI/Formatter.hpp>
#include <array>
#include <sstream>

namespace marlo::cli {

namespace {

constexpr const char* Introduction =
    "Shows, changes and serves the network adapters of this host, and any other object that its CIM providers have.";

constexpr const char* Conclusion = R"(Exit status: 0 answered, 1 the operation failed, 2 the command line is wrong.

Examples:
  marlo adapters
  marlo enum MARLO_NetworkAdapterConfiguration --json
  marlo static eth0 192.0.2.10/24 --gateway 192.0.2.1
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

constexpr const char* WatchExamples =
    R"(Each indication is a line: time, adapter, event, severity and message. Exit status: 0 when it ends by
--timeout or an interrupt, or with --count when that many have come; 1 when nothing can be watched, or
when it ends before that many have come; 2 when the command line is wrong.

Examples:
  marlo watch
  marlo watch MARLO_NetworkAdapterOfflineEvent --count 1
  marlo watch --filter "SELECT * FROM CIM_AlertIndication WHERE PerceivedSeverity >= 3" --timeout 60
  marlo watch --json)";

constexpr const char* ClassesExamples = R"(Examples:
  marlo classes
  marlo classes -n root/quarn --names)";

constexpr const char* CompletionExamples = R"(Examples:
  marlo completion bash)";

void addProperties(CLI::App& app, Options& options, const std::string& text) {
    app.add_option("-p,--property", options.properties, text)
        ->type_name("NAME,...")
        ->delimiter(',')
        ->allow_extra_args(false);
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
    addPositional(enumerate, "CLASS", options.argument, "The class");
    addProperties(enumerate, options, "Show these properties only; may be repeated");
    addCommonOptions(enumerate, options);

    CLI::App& names = addCommand(app, options, Command::Names, "names",
                                 "Show the paths of all instances of a class and its subclasses", NamesExamples);
    addPositional(names, "CLASS", options.argument, "The class");
    addCommonOptions(names, options);

    CLI::App& get = addCommand(app, options, Command::Get, "get", "Show the instance at a path", GetExamples);
    addPositional(get, "PATH", options.argument, "[namespace:]Class.Key=\"value\",...");
    addProperties(get, options, "Show these properties only; may be repeated");
    addCommonOptions(get, options);
}

void addWatchCommand(CLI::App& app, Options& options) {
    WatchOptions& watch = options.watch;
    CLI::App& command = addCommand(app, options, Command::Watch, "watch",
                                   "Show what happens to the adapters, as it happens", WatchExamples);
    command
        .add_option("CLASS", watch.classes,
                    "Classes of indications, with their subclasses; where none is named, those of the adapters")
        ->type_name("");
    command.add_option("--filter", watch.filter, "Show what this SELECT statement chooses, in the place of classes")
        ->type_name("TEXT");
    command.add_option("--language", watch.language, "The filter's language: WQL or CQL")
        ->type_name("NAME")
        ->capture_default_str();
    command.add_option("--count", watch.count, "End when so many have come")
        ->type_name("N")
        ->check(CLI::Range(1U, 4'000'000'000U).description(""));
    command.add_option("--timeout", watch.timeout, "End after so many seconds")->type_name("SECONDS");
    command.add_flag("--json", options.json, "Print JSON: an object on a line for each indication");
    addNameSpace(command, options);
    addAgentOptions(command, options.agent);
    addDirectoryOptions(command, options.directories);
}

/** Puts the indications of adapters where nothing is named, to watch or to subscribe to. */
void completeWatch(WatchOptions& watch) {
    if (!watch.filter.empty() && !watch.classes.empty()) {
        throw UsageError("--filter names its class itself: it goes with no CLASS");
    }
    constexpr double longest = 1e9;
    if (watch.timeout && !(*watch.timeout > 0 && *watch.timeout <= longest)) { // so for what is no number as well
        throw UsageError("--timeout: expected seconds above 0, at most 1000000000");
    }
    if (watch.classes.empty()) {
        watch.classes = {"MARLO_NetworkAdapterOnlineEvent", "MARLO_NetworkAdapterOfflineEvent",
                         "MARLO_NetworkAdapterSwitchOverEvent", "MARLO_NetworkAdapterSwitchBackEvent"};
    }
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
    completion.add_option("SHELL", options.argument, "bash")
        ->type_name("")
        ->required()
        ->check(CLI::IsMember({"bash"}));
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
    addChangeCommands(app, line.options);
    addWatchCommand(app, line.options);
    addServerCommands(app, line.options);
    addSubscriptionCommands(app, line.options);
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
    const Command command = line.options.command;
    if (command == Command::Watch || command == Command::Subscribe) {
        completeWatch(line.options.watch);
    }
    if (line.options.command == Command::Completion) {
        line.answer = makeBashCompletion(app);
    }
    return line;
}

} // namespace marlo::cli
