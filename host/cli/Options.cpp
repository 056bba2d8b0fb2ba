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
    "Shows and changes the network adapters of this host, and shows any object that its CIM providers serve.";

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

constexpr const char* InvokeExamples = R"(METHOD is one of MARLO_NetworkAdapterConfiguration:
  EnableDHCP
  EnableStatic IPAddress=A SubnetMask=M
  SetGateways DefaultIPGateway=A
  SetDNSDomain DNSDomain=D
  SetDNSServerSearchOrder DNSServerSearchOrder=A,...          the host's first adapter's
  SetDNSSuffixSearchOrder DNSDomainSuffixSearchOrder=D,...    the host's first adapter's
  RestartNetwork                                              the whole host's

Examples:
  marlo invoke eth0 EnableDHCP
  marlo invoke eth0 EnableStatic IPAddress=192.0.2.10 SubnetMask=255.255.255.0
  marlo invoke eth0 SetDNSServerSearchOrder DNSServerSearchOrder=192.0.2.53,192.0.2.54 --json)";

constexpr const char* SetExamples = R"(What can be set is IPv4Address and SubnetMask (read as IPAddress and IPSubnet),
DefaultIPGateway and DNSDomain. Whether the address comes from DHCP stays as it is; while it does, no other can be set.

Examples:
  marlo set eth0 IPv4Address=198.51.100.24 SubnetMask=255.255.254.0
  marlo set eth0 DNSDomain=example.org)";

constexpr const char* StaticExamples = R"(Without a prefix length or a mask, the one in force stays.

Examples:
  marlo static eth0 192.0.2.10/24
  marlo static eth0 192.0.2.10/24 --gateway 192.0.2.1
  marlo static eth0 192.0.2.11 --mask 255.255.255.128)";

constexpr const char* DhcpExamples = R"(Examples:
  marlo dhcp bond0)";

constexpr const char* DnsExamples =
    R"(Name servers and search suffixes are the host's: they are set on its first adapter that is not the management
controller's, whichever adapter is named. The domain is set on ADAPTER.

Examples:
  marlo dns eth0 --server 192.0.2.54,192.0.2.55
  marlo dns eth0 --search example.org --search example.net --domain example.org)";

constexpr const char* GatewayExamples = R"(Examples:
  marlo gateway eth0 192.0.2.2)";

constexpr const char* RestartExamples =
    R"(Runs "/etc/init.d/network restart" and waits for it. Nobody is told how that
ends: the exit status is 0 unless it could not be started at all.

Examples:
  marlo restart)";

/** A check whose description is not put behind the name of the value in the help. */
CLI::Validator existingDirectory() {
    return CLI::ExistingDirectory.description("");
}

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

/** An argument that is required, shown by its name alone. */
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

/** A command that changes the adapter which is its first argument. */
CLI::App& addChange(CLI::App& app, Options& options, Command command, const std::string& name,
                    const std::string& description, const std::string& footer) {
    CLI::App& added = addCommand(app, options, command, name, description, footer);
    addPositional(added, "ADAPTER", options.argument, "The adapter's name, as marlo adapters shows it");
    return added;
}

void addChangeOptions(CLI::App& app, Options& options) {
    app.add_flag("--json", options.json, "Print JSON: an object with what was called and what has changed");
    addNameSpace(app, options);
    addAgentOptions(app, options.agent);
    addDirectoryOptions(app, options.directories);
}

void addGenericChanges(CLI::App& app, Options& options) {
    CLI::App& invoke = addChange(app, options, Command::Invoke, "invoke",
                                 "Call a method of an adapter's configuration", InvokeExamples);
    addPositional(invoke, "METHOD", options.method, "The method");
    invoke
        .add_option("NAME=VALUE", options.values, "Arguments; an array is a list with commas, or its name repeated")
        ->type_name("");
    addChangeOptions(invoke, options);

    CLI::App& set =
        addChange(app, options, Command::Set, "set", "Set properties of an adapter's configuration", SetExamples);
    set.add_option("NAME=VALUE", options.values, "Properties; an array is a list with commas, or its name repeated")
        ->type_name("")
        ->required();
    addChangeOptions(set, options);
}

void addAddressChanges(CLI::App& app, Options& options) {
    CLI::App& fixed =
        addChange(app, options, Command::Static, "static", "Give an adapter a fixed IPv4 address", StaticExamples);
    addPositional(fixed, "ADDRESS", options.address, "The address, with its prefix length: 192.0.2.10/24");
    fixed.add_option("--mask", options.mask, "The network mask, in the place of a prefix length")->type_name("MASK");
    fixed.add_option("--gateway", options.gateway, "The default gateway, set after the address")
        ->type_name("ADDRESS");
    addChangeOptions(fixed, options);

    CLI::App& dhcp = addChange(app, options, Command::Dhcp, "dhcp",
                               "Have an adapter take its address from a DHCP server", DhcpExamples);
    addChangeOptions(dhcp, options);

    CLI::App& gateway =
        addChange(app, options, Command::Gateway, "gateway", "Set an adapter's default gateway", GatewayExamples);
    addPositional(gateway, "ADDRESS", options.gateway, "The gateway's address");
    addChangeOptions(gateway, options);
}

void addHostChanges(CLI::App& app, Options& options) {
    const auto addList = [](CLI::App& command, const std::string& name, std::vector<std::string>& list,
                            const std::string& type, const std::string& text) {
        command.add_option(name, list, text)->type_name(type)->delimiter(',')->allow_extra_args(false);
    };
    CLI::App& dns =
        addChange(app, options, Command::Dns, "dns", "Set name servers, search suffixes or a domain", DnsExamples);
    addList(dns, "--server", options.servers, "ADDRESS,...", "Name servers in order; may be repeated");
    addList(dns, "--search", options.suffixes, "SUFFIX,...", "Search suffixes in order; may be repeated");
    dns.add_option("--domain", options.domain, "The DNS domain")->type_name("DOMAIN");
    addChangeOptions(dns, options);

    CLI::App& restart =
        addCommand(app, options, Command::Restart, "restart", "Restart the host's networking", RestartExamples);
    addChangeOptions(restart, options);
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

/** Puts the indications of adapters where nothing is named. */
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
    addGenericChanges(app, line.options);
    addAddressChanges(app, line.options);
    addHostChanges(app, line.options);
    addWatchCommand(app, line.options);
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
    if (line.options.command == Command::Watch) {
        completeWatch(line.options.watch);
    }
    if (line.options.command == Command::Completion) {
        line.answer = makeBashCompletion(app);
    }
    return line;
}

} // namespace marlo::cli
