/**
 * @file
 * How the host's configuration files say that an interface gets its IPv4 address.
 */
#pragma once

#include "agent/change/AdapterSettings.h"
#include "agent/linux/HostFiles.h"

#include <cstdint>
#include <map>
#include <optional>
#include <string>
#include <string_view>
#include <vector>

namespace Orv::Agent::Linux {

using Agent::AddressMode;

/** What configuration files recognise an interface by. */
struct InterfaceFacts {
    int index = 0;
    std::string name;
    std::string address;          ///< the link-layer address in lower case with colons; may be empty
    std::string permanentAddress; ///< likewise
    std::string kind;             ///< as in Link::kind
    bool ethernet = false;        ///< of hardware type ARPHRD_ETHER
};

/**
 * interfaces(5) of ifupdown: the IPv4 method of each interface that has a stanza. The first stanza of an interface
 * counts; `dhcp` and `bootp` are leased, `static` is fixed, other methods say nothing. Follows `source` and
 * `source-directory`.
 */
std::map<std::string, AddressMode> readIfupdown(HostFiles& files);

/** One .network file of systemd-networkd with its drop-ins, as far as it concerns the IPv4 address. */
struct NetworkUnit {
    std::map<std::string, std::string> match; ///< the [Match] section; values given one after the other are joined
    bool leases = false;                      ///< DHCP= covers IPv4
    bool hasAddress = false;                  ///< it sets an IPv4 address
    std::string path;                         ///< of the .network file
    std::vector<std::string> dropIns;         ///< their paths, in the order in which they are read

    /**
     * Whether it applies to the interface. Conditions on what is not known here (driver, path, host, ...) count as
     * not met: better no statement than a wrong one.
     */
    [[nodiscard]] bool matches(const InterfaceFacts& interface) const;

    /** None when it sets neither. */
    [[nodiscard]] std::optional<AddressMode> mode() const;

    bool operator==(const NetworkUnit&) const = default;
};

/** Reads a .network file and the drop-ins behind it into `unit`; later text overrides and adds as systemd has it. */
void parseNetworkUnit(std::string_view text, NetworkUnit& unit);

/** systemd-networkd: its configuration and what it has made of it. */
struct Networkd {
    std::vector<NetworkUnit> units;                     ///< in the order in which they are tried
    std::map<int, std::optional<std::size_t>> assigned; ///< by interface index: the unit applied, or none at all
    std::vector<int> leases;                            ///< sorted indexes of interfaces that hold an IPv4 lease

    /** What is configured for the interface. */
    [[nodiscard]] std::optional<AddressMode> modeOf(const InterfaceFacts& interface) const;

    /** The unit that is applied to the interface, else the first that would be; null when there is none. */
    [[nodiscard]] const NetworkUnit* unitOf(const InterfaceFacts& interface) const;

    bool operator==(const Networkd&) const = default;
};

Networkd readNetworkd(HostFiles& files);

} // namespace Orv::Agent::Linux
