#include "agent/linux/AddressMode.h"
#include "agent/linux/Words.h"

#include <algorithm>
#include <array>

#include <fnmatch.h>

namespace Orv::Agent::Linux {

namespace {

/** Where units are looked for; a file hides those of its name in later directories. */
constexpr std::array<const char*, 4> unitDirectories{"/etc/systemd/network", "/run/systemd/network",
                                                     "/usr/local/lib/systemd/network", "/usr/lib/systemd/network"};
constexpr const char* linkStates = "/run/systemd/netif/links";
constexpr const char* leaseFiles = "/run/systemd/netif/leases";

std::string lowerCase(std::string_view text) {
    std::string lower(text);
    std::transform(lower.begin(), lower.end(), lower.begin(), [](char letter) {
        return letter >= 'A' && letter <= 'Z' ? static_cast<char>(letter + 32) : letter;
    });
    return lower;
}

/** Whether one of the shell patterns matches; a list that begins with "!" matches when none does. */
bool matchesGlobs(const std::string& patterns, const std::string& text) {
    const bool inverted = patterns.starts_with('!');
    const std::string list = patterns.substr(inverted ? 1 : 0);
    const std::vector<std::string_view> words = wordsOf(list);
    const bool found = std::any_of(words.begin(), words.end(), [&](std::string_view word) {
        return fnmatch(std::string(word).c_str(), text.c_str(), 0) == 0;
    });
    return found != inverted;
}

/** Addresses are written with colons, hyphens or dots between octets. */
bool matchesAddress(const std::string& list, const std::string& address) {
    for (const std::string_view word : wordsOf(list)) {
        std::string written = lowerCase(word);
        std::replace(written.begin(), written.end(), '-', ':');
        if (written == address) {
            return true;
        }
    }
    return false;
}

/** What systemd calls the type of the interface: its kind where the kernel has a device type for that. */
std::string typeOf(const InterfaceFacts& interface) {
    constexpr std::array<std::string_view, 6> typed{"bridge", "bond", "vlan", "vxlan", "wireguard", "geneve"};
    if (std::find(typed.begin(), typed.end(), interface.kind) != typed.end()) {
        return interface.kind;
    }
    return interface.ethernet ? "ether" : "";
}

bool conditionMet(const std::string& key, const std::string& value, const InterfaceFacts& interface) {
    if (key == "Name") {
        return matchesGlobs(value, interface.name);
    }
    if (key == "MACAddress") {
        return matchesAddress(value, interface.address);
    }
    if (key == "PermanentMACAddress") {
        return matchesAddress(value, interface.permanentAddress);
    }
    if (key == "Type") {
        return matchesGlobs(value, typeOf(interface));
    }
    return key == "Kind" && matchesGlobs(value, interface.kind);
}

/** Whether this value of DHCP= in [Network] asks for an IPv4 lease; older spellings included. */
bool leasesIpv4(const std::string& value) {
    constexpr std::array<std::string_view, 9> yes{"yes", "true", "on", "1", "y", "t", "ipv4", "v4", "both"};
    return std::find(yes.begin(), yes.end(), lowerCase(value)) != yes.end();
}

struct Assignment {
    std::string key;
    std::string value;
};

std::optional<Assignment> assignmentOf(std::string_view line) {
    const std::size_t equals = line.find('=');
    if (equals == std::string_view::npos) {
        return std::nullopt;
    }
    return Assignment{std::string(trimmed(line.substr(0, equals))), std::string(trimmed(line.substr(equals + 1)))};
}

void take(std::string_view section, const Assignment& assignment, NetworkUnit& unit) {
    const auto& [key, value] = assignment;
    if (section == "[Match]") {
        std::string& list = unit.match[key];
        list = value.empty() || list.empty() ? value : list + " " + value;
    } else if (section == "[Network]" && key == "DHCP") {
        unit.leases = leasesIpv4(value);
    } else if ((section == "[Network]" || section == "[Address]") && key == "Address") {
        unit.hasAddress = unit.hasAddress || (!value.empty() && value.find(':') == std::string::npos);
    }
}

/** The directories that there are, each with the names in it, in order of priority. */
using Directories = std::vector<std::pair<std::string, std::vector<std::string>>>;

/** Names with this ending and the path at which each is to be read: in the first directory that has it. */
std::map<std::string, std::string> firstOfEach(const Directories& directories, std::string_view ending) {
    std::map<std::string, std::string> paths;
    for (const auto& [directory, names] : directories) {
        for (const std::string& name : names) {
            if (name.ends_with(ending)) {
                paths.try_emplace(name, pathIn(directory, name));
            }
        }
    }
    return paths;
}

/** The drop-in directories of a unit. One that is not there is not looked for again: its parent tells when it comes.
 */
Directories dropInsOf(HostFiles& files, const Directories& directories, const std::string& unit) {
    Directories found;
    for (const auto& [directory, names] : directories) {
        if (std::binary_search(names.begin(), names.end(), unit + ".d")) {
            const std::string path = pathIn(directory, unit + ".d");
            found.emplace_back(path, files.list(path));
        }
    }
    return found;
}

/** The unit that networkd says it has applied, by path; empty when it leaves the interface alone. */
std::optional<std::string> appliedUnit(const std::string& state) {
    bool known = false;
    for (const std::string_view line : linesOf(state)) {
        constexpr std::string_view file = "NETWORK_FILE=";
        if (line.starts_with(file)) {
            return std::string(line.substr(file.size()));
        }
        known = known || line.starts_with("ADMIN_STATE=");
    }
    return known ? std::optional<std::string>("") : std::nullopt;
}

std::map<int, std::optional<std::size_t>> readAssigned(HostFiles& files,
                                                       const std::map<std::string, std::size_t>& unitByPath) {
    std::map<int, std::optional<std::size_t>> assigned;
    for (const std::string& name : files.list(linkStates)) {
        const std::optional<int> index = positiveNumber(name);
        const auto path = index ? appliedUnit(files.peek(pathIn(linkStates, name))) : std::nullopt;
        if (path) {
            const auto unit = unitByPath.find(*path);
            assigned[*index] = unit == unitByPath.end() ? std::nullopt : std::optional(unit->second);
        }
    }
    return assigned;
}

} // namespace

bool NetworkUnit::matches(const InterfaceFacts& interface) const {
    return !match.empty() && std::all_of(match.begin(), match.end(), [&](const auto& condition) {
        return conditionMet(condition.first, condition.second, interface);
    });
}

std::optional<AddressMode> NetworkUnit::mode() const {
    if (leases) {
        return AddressMode::leased;
    }
    return hasAddress ? std::optional(AddressMode::fixed) : std::nullopt;
}

void parseNetworkUnit(std::string_view text, NetworkUnit& unit) {
    std::string section;
    for (const std::string_view untrimmed : linesOf(text)) {
        const std::string_view line = trimmed(untrimmed);
        if (line.starts_with('#') || line.starts_with(';')) {
            continue;
        }
        if (line.starts_with('[')) {
            section = line;
        } else if (const auto assignment = assignmentOf(line)) {
            take(section, *assignment, unit);
        }
    }
}

std::optional<AddressMode> Networkd::modeOf(const InterfaceFacts& interface) const {
    if (std::binary_search(leases.begin(), leases.end(), interface.index)) {
        return AddressMode::leased;
    }
    const NetworkUnit* unit = unitOf(interface);
    return unit == nullptr ? std::nullopt : unit->mode();
}

const NetworkUnit* Networkd::unitOf(const InterfaceFacts& interface) const {
    if (const auto applied = assigned.find(interface.index); applied != assigned.end()) {
        return applied->second ? &units.at(*applied->second) : nullptr;
    }
    const auto unit = std::find_if(units.begin(), units.end(),
                                   [&](const NetworkUnit& candidate) { return candidate.matches(interface); });
    return unit == units.end() ? nullptr : &*unit;
}

Networkd readNetworkd(HostFiles& files) {
    Networkd networkd;
    std::map<std::string, std::size_t> unitByPath;
    Directories directories;
    for (const char* directory : unitDirectories) {
        directories.emplace_back(directory, files.list(directory));
    }
    for (const auto& [name, path] : firstOfEach(directories, ".network")) {
        if (files.isMask(path)) {
            continue;
        }
        NetworkUnit unit;
        unit.path = path;
        parseNetworkUnit(files.read(path).value_or(""), unit);
        for (const auto& [dropIn, dropInPath] : firstOfEach(dropInsOf(files, directories, name), ".conf")) {
            parseNetworkUnit(files.read(dropInPath).value_or(""), unit);
            unit.dropIns.push_back(dropInPath);
        }
        unitByPath[path] = networkd.units.size();
        networkd.units.push_back(std::move(unit));
    }
    networkd.assigned = readAssigned(files, unitByPath);
    for (const std::string& name : files.list(leaseFiles)) {
        if (const std::optional<int> index = positiveNumber(name)) {
            networkd.leases.push_back(*index);
        }
    }
    std::sort(networkd.leases.begin(), networkd.leases.end());
    return networkd;
}

} // namespace Orv::Agent::Linux
