#include "agent/persistence/DhcpClient.h"

#include "agent/linux/Words.h"
#include "agent/persistence/Command.h"
#include "agent/persistence/FileEdit.h"
#include "agent/persistence/ProcessHandle.h"

#include <algorithm>
#include <array>
#include <csignal>
#include <filesystem>
#include <fstream>
#include <iterator>
#include <stdexcept>
#include <system_error>

#include <sys/stat.h>

namespace Orv::Agent::Persistence {

namespace {

using Texts = std::vector<std::string>;

constexpr std::chrono::milliseconds patienceWithTerm{std::chrono::seconds(5)};

/** Options whose value is an argument of its own, which is no interface then; dhclient(8) and dhcpcd(8). */
constexpr std::array<std::string_view, 17> dhclientOptions{
    "-p", "-D", "-e", "-s", "-g", "-C", "-H", "-F", "-V", "-U", "-R", "-lf", "-pf", "-df", "-cf", "-sf", "-timeout"};
constexpr std::string_view dhcpcdOptions = "cCeEfFhiIjlmoOQrsStuvWXyYzZ";

std::string baseName(const std::string& path) {
    return path.substr(path.rfind('/') + 1);
}

/** The interfaces of "udhcpc -i NAME" and "udhcpc -iNAME". */
Texts interfacesOfUdhcpc(const Texts& arguments) {
    for (auto argument = arguments.begin(); argument != arguments.end(); ++argument) {
        if ((*argument == "-i" || *argument == "--interface") && argument + 1 != arguments.end()) {
            return {*(argument + 1)};
        }
        if (argument->starts_with("-i") && argument->size() > 2) {
            return {argument->substr(2)};
        }
    }
    return {};
}

bool takesValue(const std::string& program, const std::string& option) {
    if (program == "dhclient") {
        return std::find(dhclientOptions.begin(), dhclientOptions.end(), option) != dhclientOptions.end();
    }
    return option.size() == 2 && option[0] == '-' && dhcpcdOptions.find(option[1]) != std::string_view::npos;
}

/** What is neither an option nor the value of one. */
Texts plainArguments(const std::string& program, const Texts& arguments) {
    Texts plain;
    for (auto argument = arguments.begin(); argument != arguments.end(); ++argument) {
        if (takesValue(program, *argument) && argument + 1 != arguments.end()) {
            ++argument;
        } else if (!argument->starts_with("-")) {
            plain.push_back(*argument);
        }
    }
    return plain;
}

/** The numbers in /proc. */
std::vector<pid_t> processes() {
    std::vector<pid_t> found;
    std::error_code error;
    for (std::filesystem::directory_iterator entry("/proc", error), end; !error && entry != end;
         entry.increment(error)) {
        if (const auto number = Linux::positiveNumber(entry->path().filename().string())) {
            found.push_back(*number);
        }
    }
    if (error) {
        throw std::system_error(error, "the processes of this host cannot be listed");
    }
    return found;
}

Texts argumentsOf(pid_t process) {
    std::ifstream file("/proc/" + std::to_string(process) + "/cmdline", std::ios::binary);
    Texts arguments;
    for (std::string argument; std::getline(file, argument, '\0');) {
        arguments.push_back(argument);
    }
    return arguments;
}

/** The inode of a file in /proc that every network namespace has one of, or 0. */
ino_t namespaceOf(const std::string& process) {
    struct stat status {};

    return ::stat(("/proc/" + process + "/net/dev").c_str(), &status) == 0 ? status.st_ino : 0;
}

/**
 * The same interface name may be another interface in another container. The link /proc/PID/ns/net would tell, too,
 * but only those who may trace the process (ptrace(2)): a client that was started at boot can do more than this
 * process.
 */
bool isInThisNamespace(pid_t process) {
    const ino_t there = namespaceOf(std::to_string(process));
    return there != 0 && there == namespaceOf("thread-self");
}

void end(pid_t process, const std::string& interface) {
    const ProcessHandle handle(process);
    // The number may have gone to another process meanwhile; the handle cannot.
    if (!handle || !ClientArguments::of(argumentsOf(process), interface).isClient) {
        return;
    }
    for (const int signal : {SIGTERM, SIGKILL}) {
        handle.send(signal);
        if (handle.awaitEnd(patienceWithTerm)) {
            return;
        }
    }
    throw std::runtime_error("the DHCP client, process " + std::to_string(process) + ", does not end");
}

Texts appended(Texts command, const Texts& arguments) {
    command.insert(command.end(), arguments.begin(), arguments.end());
    return command;
}

} // namespace

ClientArguments ClientArguments::of(const Texts& arguments, const std::string& interface) {
    // Newer ones of dhcpcd show as "dhcpcd: eth0 [ip4]".
    if (constexpr std::string_view title = "dhcpcd: "; !arguments.empty() && arguments[0].starts_with(title)) {
        const auto words = Linux::wordsOf(arguments[0]);
        return {std::find(words.begin() + 1, words.end(), interface) != words.end(), false};
    }
    // Of "busybox udhcpc" and "/bin/sh /sbin/client" the second argument names the program.
    for (std::size_t place = 0; place < std::min<std::size_t>(arguments.size(), 2); ++place) {
        const std::string program = baseName(arguments[place]);
        const Texts rest(arguments.begin() + static_cast<std::ptrdiff_t>(place) + 1, arguments.end());
        if (program != "dhclient" && program != "udhcpc" && program != "dhcpcd") {
            continue;
        }
        if (std::find(rest.begin(), rest.end(), "-6") != rest.end()) {
            return {};
        }
        const Texts served = program == "udhcpc" ? interfacesOfUdhcpc(rest) : plainArguments(program, rest);
        const bool isServed = std::find(served.begin(), served.end(), interface) != served.end();
        return {isServed, isServed && served.size() > 1};
    }
    return {};
}

std::vector<pid_t> DhcpClient::find(const std::string& interface) const {
    std::vector<pid_t> found;
    for (const pid_t process : processes()) {
        const ClientArguments client = ClientArguments::of(argumentsOf(process), interface);
        if (!client.isClient || !isInThisNamespace(process)) {
            continue;
        }
        if (client.others) {
            throw std::runtime_error("the DHCP client, process " + std::to_string(process) +
                                     ", serves other interfaces, too");
        }
        found.push_back(process);
    }
    return found;
}

bool DhcpClient::isRunning(const std::string& interface) const {
    return !find(interface).empty();
}

bool DhcpClient::stop(const std::string& interface) {
    const std::vector<pid_t> clients = find(interface);
    for (const pid_t process : clients) {
        end(process, interface);
    }
    return !clients.empty();
}

bool DhcpClient::isUp(const std::string& interface) const {
    const std::string state = contentOf(_environment.root + "/run/network/ifstate").value_or("");
    const auto lines = Linux::linesOf(state);
    return std::any_of(lines.begin(), lines.end(),
                       [&](std::string_view line) { return line.starts_with(interface + "="); });
}

void DhcpClient::start(const std::string& interface) {
    const Commands& commands = _environment.commands;
    const std::string& root = _environment.root;
    const auto isInstalled = [](const Texts& command) { return std::filesystem::exists(command.front()); };
    if (isInstalled(commands.dhclient)) {
        const std::string leases = root + "/var/lib/dhcp/dhclient";
        runOrThrow(appended(commands.dhclient, {"-4", "-v", "-i", "-pf", root + "/run/dhclient." + interface + ".pid",
                                                "-lf", leases + "." + interface + ".leases", "-I", "-df",
                                                leases + "6." + interface + ".leases", interface}),
                   commands.patience);
    } else if (isInstalled(commands.udhcpc)) {
        runOrThrow(
            appended(commands.udhcpc, {"-b", "-p", root + "/run/udhcpc." + interface + ".pid", "-i", interface}),
            commands.patience);
    } else if (isInstalled(commands.dhcpcd)) {
        runOrThrow(appended(commands.dhcpcd, {"-4", interface}), commands.patience);
    } else {
        throw std::runtime_error("no DHCP client is installed");
    }
}

void DhcpClient::ifup(const std::string& interface) {
    const CommandResult result =
        runCommand(appended(_environment.commands.ifup, {interface}), _environment.commands.patience);
    if (!isRunning(interface)) {
        throw std::runtime_error(_environment.commands.ifup.front() + ": no DHCP client runs behind it: status " +
                                 std::to_string(result.status) + ", " + result.lastLine());
    }
}

} // namespace Orv::Agent::Persistence
