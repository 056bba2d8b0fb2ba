#include "agent/persistence/Networkd.h"

#include "agent/linux/Words.h"
#include "agent/persistence/DhcpClient.h"
#include "agent/persistence/NetworkdFile.h"
#include "agent/persistence/SystemBus.h"

#include <cstring>
#include <filesystem>
#include <memory>
#include <stdexcept>
#include <thread>

#include <arpa/inet.h>
#include <ifaddrs.h>
#include <netinet/in.h>

namespace Orv::Agent::Persistence {

namespace {

using Linux::NetworkUnit;
using std::chrono::milliseconds;

constexpr const char* unitDirectory = "/etc/systemd/network/";
constexpr const char* dropInName = "/50-marlo.conf";
constexpr const char* service = "org.freedesktop.network1";
constexpr BusObject manager{service, "/org/freedesktop/network1", "org.freedesktop.network1.Manager"};

constexpr milliseconds patienceWithNetworkd{5000};
constexpr milliseconds patienceWithLease{15000};
constexpr milliseconds step{20};

/** networkd answers before it has begun; that it has shows in its file, unless it finds nothing to do after all. */
constexpr milliseconds patienceWithNothing{2000};

std::string unitPath(const std::string& interface) {
    return unitDirectory + ("05-marlo-" + interface + ".network");
}

std::string dropInPath(const NetworkUnit& unit) {
    return unitDirectory + std::filesystem::path(unit.path).filename().string() + ".d" + dropInName;
}

/** Whether the unit is for this interface and cannot be for another. */
bool isExclusive(const NetworkUnit& unit, const InterfaceFacts& interface) {
    const auto isOne = [&](const char* condition, const std::string& value) {
        const auto found = unit.match.find(condition);
        return found != unit.match.end() && !value.empty() && found->second == value;
    };
    return isOne("Name", interface.name) || isOne("MACAddress", interface.address) ||
           isOne("PermanentMACAddress", interface.permanentAddress);
}

/** What stands in the way of a change. */
class Plan {
  public:
    Plan(const Environment& environment, const InterfaceFacts& interface)
        : _root(environment.root), _interface(interface), _ownUnit(contentOf(_root + unitPath(interface.name))) {
        if (interface.name.find_first_of("*?[]! \t\\") != std::string::npos) {
            throw std::runtime_error("no unit of systemd-networkd can name it");
        }
        Linux::HostFiles files(_root);
        const Linux::Networkd networkd = Linux::readNetworkd(files);
        if (const NetworkUnit* unit = networkd.unitOf(interface); unit != nullptr && !_ownUnit) {
            _unit = *unit;
            readUnit();
        }
    }

    FileEdits edits(const AdapterSettings& wanted) {
        if (_ownUnit) {
            const NetworkdSettings own = changed(readOwnSettings(*_ownUnit), readOwnSettings(*_ownUnit), wanted);
            return edit(unitPath(_interface.name), _ownUnit, unitText(_interface.name, own, restOfOwn(*_ownUnit)));
        }
        const NetworkdSettings inForce = readNetworkdSettings(_others + _ownDropIn.value_or(""));
        NetworkdSettings own = changed(readOwnSettings(_ownDropIn.value_or("")), inForce, wanted);
        if (!_unit) {
            return edit(unitPath(_interface.name), std::nullopt, unitText(_interface.name, own, ""));
        }
        const NetworkdSettings others = readNetworkdSettings(_others);
        if (isExclusive(*_unit, _interface) && !contradicts(own, others)) {
            own.address = own.address == others.address ? std::nullopt : own.address;
            own.gateway = own.gateway == others.gateway ? std::nullopt : own.gateway;
            return edit(dropInPath(*_unit), _ownDropIn, dropInText(own));
        }
        return replaceUnit(own, inForce);
    }

  private:
    void readUnit() {
        _others = contentOf(_root + _unit->path).value_or("") + "\n";
        for (const std::string& path : _unit->dropIns) {
            const std::optional<std::string> text = contentOf(_root + path);
            if (path == dropInPath(*_unit)) {
                _ownDropIn = text;
            } else {
                _others += text.value_or("") + "\n";
            }
        }
    }

    /** Whether others set an address or gateway beside ours: a drop-in can only add to them. */
    static bool contradicts(const NetworkdSettings& own, const NetworkdSettings& others) {
        const bool decidesIpv4 = own.dhcp.has_value();
        return decidesIpv4 && ((others.address && others.address != own.address) ||
                               (others.gateway && others.gateway != own.gateway));
    }

    FileEdits replaceUnit(NetworkdSettings own, const NetworkdSettings& inForce) {
        if (!own.dhcp) {
            own.dhcp = inForce.dhcp;
            own.address = inForce.address;
            own.gateway = inForce.gateway;
        }
        own.servers = own.servers ? own.servers : inForce.servers;
        own.domains = own.domains ? own.domains : inForce.domains;
        FileEdits edits =
            edit(unitPath(_interface.name), std::nullopt, unitText(_interface.name, own, restOf(_others)));
        if (_ownDropIn && isExclusive(*_unit, _interface)) {
            edits.push_back({_root + dropInPath(*_unit), _ownDropIn, std::nullopt});
        }
        return edits;
    }

    [[nodiscard]] FileEdits edit(const std::string& path, const std::optional<std::string>& before,
                                 const std::string& after) const {
        return before == after ? FileEdits{} : FileEdits{{_root + path, before, after}};
    }

    const std::string& _root;
    const InterfaceFacts& _interface;
    std::optional<std::string> _ownUnit;
    std::optional<NetworkUnit> _unit;
    std::optional<std::string> _ownDropIn;
    std::string _others; ///< the unit and its drop-ins but ours, one behind the other
};

/** What networkd says of an interface, file and all: it is replaced whole with every step. */
struct LinkState {
    std::optional<FileStamp> stamp;
    bool isConfigured = false;
    bool isConfiguring = false;
    bool hasUnit = false;
};

LinkState stateOf(const InterfaceFacts& interface, const Environment& environment) {
    const std::string path = environment.root + "/run/systemd/netif/links/" + std::to_string(interface.index);
    LinkState state;
    try {
        const TextFile file = readTextFile(path);
        state.stamp = file.stamp;
        for (const std::string_view line : Linux::linesOf(file.text)) {
            state.isConfigured = state.isConfigured || line == "ADMIN_STATE=configured";
            state.isConfiguring = state.isConfiguring || line == "ADMIN_STATE=configuring";
            state.hasUnit = state.hasUnit || line.starts_with("NETWORK_FILE=/");
        }
    } catch (const std::system_error&) {
        return {}; // not known to networkd, or just being replaced
    }
    return state;
}

/** Whether the kernel has the address on the interface. */
bool hasAddress(const InterfaceFacts& interface, const Ipv4Settings& wanted) {
    ifaddrs* first = nullptr;
    if (::getifaddrs(&first) != 0) {
        return false;
    }
    const std::unique_ptr<ifaddrs, void (*)(ifaddrs*)> all(first, ::freeifaddrs);
    for (const ifaddrs* entry = first; entry != nullptr; entry = entry->ifa_next) {
        if (entry->ifa_addr == nullptr || entry->ifa_addr->sa_family != AF_INET ||
            interface.name != entry->ifa_name) {
            continue;
        }
        sockaddr_in address{};
        std::memcpy(&address, entry->ifa_addr, sizeof address);
        if (!wanted.address || ntohl(address.sin_addr.s_addr) == wanted.address->address.number) {
            return wanted.address.has_value();
        }
    }
    return !wanted.address;
}

/**
 * True when IPv4 of the interface is configured; the rest may take as long as routers of IPv6 are looked for.
 * `before` is the state before networkd was told to look.
 */
bool awaitConfigured(const InterfaceFacts& interface, const Environment& environment, const LinkState& before,
                     const Ipv4Settings& wanted) {
    for (milliseconds waited{0}; waited < patienceWithNetworkd; waited += step) {
        const LinkState now = stateOf(interface, environment);
        const bool hasMoved = now.stamp != before.stamp || waited >= patienceWithNothing;
        if (hasMoved && (now.isConfigured || (now.isConfiguring && hasAddress(interface, wanted)))) {
            return true;
        }
        std::this_thread::sleep_for(step);
    }
    return false;
}

} // namespace

FileEdits Networkd::plan(const InterfaceFacts& interface, const AdapterSettings& wanted) const {
    FileEdits edits = Plan(_environment, interface).edits(wanted);
    _hasEdits = !edits.empty();
    return edits;
}

bool Networkd::stopDhcp(const InterfaceFacts& interface) {
    return DhcpClient(_environment).stop(interface.name);
}

void Networkd::activate(const InterfaceFacts& interface, const AdapterSettings& wanted) {
    SystemBus bus(_environment.systemBus);
    if (!bus.hasService(service)) {
        if (_environment.report) {
            _environment.report(interface.name +
                                ": systemd-networkd does not run; it will find the change when it does");
        }
        return;
    }
    const LinkState before = stateOf(interface, _environment);
    bus.call(manager, "Reload", [](sd_bus_message*) { return 0; });
    if (!_hasEdits || !wanted.ipv4 || wanted.ipv4->mode == AddressMode::leased) {
        return;
    }
    if (!awaitConfigured(interface, _environment, before, *wanted.ipv4) && _environment.report) {
        _environment.report(interface.name + ": systemd-networkd is still at work on it");
    }
}

void Networkd::startDhcp(const InterfaceFacts& interface) {
    if (!SystemBus(_environment.systemBus).hasService(service)) {
        throw std::runtime_error("systemd-networkd does not run");
    }
    const std::string lease = _environment.root + "/run/systemd/netif/leases/" + std::to_string(interface.index);
    for (milliseconds waited{0}; waited < patienceWithLease && !std::filesystem::exists(lease); waited += step) {
        std::this_thread::sleep_for(step);
    }
}

bool Networkd::knows(const InterfaceFacts& interface, const Environment& environment) {
    return stateOf(interface, environment).hasUnit;
}

bool Networkd::runs(const Environment& environment) {
    return std::filesystem::exists(environment.root + "/run/systemd/netif/state");
}

} // namespace Orv::Agent::Persistence
