#include "host/cli/OptionParts.h"

namespace marlo::cli {

namespace {

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

} // namespace

void addChangeCommands(CLI::App& app, Options& options) {
    addGenericChanges(app, options);
    addAddressChanges(app, options);
    addHostChanges(app, options);
}

} // namespace marlo::cli
