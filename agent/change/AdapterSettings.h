/**
 * @file
 * The part of an adapter's configuration that can be changed: IPv4 and name service.
 */
#pragma once

#include "agent/change/Ipv4.h"
#include "agent/tree/PropertyMap.h"

#include <optional>
#include <string>
#include <vector>

namespace Orv::Agent {

/** PROP_DHCP_ENABLED of an adapter. */
enum class AddressMode : unsigned int { leased = 1, fixed = 3 };

/** How one interface gets its IPv4 address; always whole, never a part of it. */
struct Ipv4Settings {
    AddressMode mode = AddressMode::fixed;
    std::optional<Ipv4Prefixed> address; ///< in force: the one reported, a leased one too; wanted: only with `fixed`
    std::optional<Ipv4Address> gateway;  ///< likewise

    bool operator==(const Ipv4Settings&) const = default;
};

/** What the resolver is told; each absent: not known, or to be left as it is. An empty list says that there is none.
 */
struct NameSettings {
    std::optional<std::string> domain;
    std::optional<std::vector<std::string>> servers;  ///< IPv4 or IPv6 addresses, in search order
    std::optional<std::vector<std::string>> suffixes; ///< in search order

    /** Whether everything is absent. */
    [[nodiscard]] bool none() const { return !domain && !servers && !suffixes; }

    /** These settings, with those of `base` where these are absent. */
    [[nodiscard]] NameSettings over(const NameSettings& base) const;

    bool operator==(const NameSettings&) const = default;
};

/**
 * What is in force on an interface, or a change that is wanted. In a change, `ipv4` is absent when IPv4 is left as it
 * is, else it is all that IPv4 shall be: no address means that there shall be none.
 */
struct AdapterSettings {
    std::optional<Ipv4Settings> ipv4;
    NameSettings names;

    bool operator==(const AdapterSettings&) const = default;
};

/**
 * The settings in force as an adapter node shows them. `ipv4` is always present; `leased` only where the node says
 * so. An address without any mask has that of its class. What is no IPv4 address counts as absent, a gateway of IPv6
 * too, and so does an address whose mask is none.
 */
AdapterSettings settingsOf(const PropertyMap& properties);

} // namespace Orv::Agent
