/**
 * @file
 * Texts of .network files (systemd.network(5)) and their drop-ins: what others wrote, and what is written here. Pure.
 */
#pragma once

#include "agent/change/AdapterSettings.h"

#include <optional>
#include <string>
#include <string_view>
#include <vector>

namespace Orv::Agent::Persistence {

/**
 * The settings of one interface that can be changed, as networkd has them. Where a value is absent, another file says
 * it, or nobody.
 */
struct NetworkdSettings {
    std::optional<std::string> dhcp; ///< of DHCP=: "yes", "ipv4", "ipv6", "no"
    std::optional<Ipv4Prefixed> address;
    std::optional<Ipv4Address> gateway;
    std::optional<std::vector<std::string>> servers; ///< of DNS=
    std::optional<std::vector<std::string>> domains; ///< of Domains=, those that only route ("~") included

    bool operator==(const NetworkdSettings&) const = default;
};

/**
 * What the texts of a unit and its drop-ins, one behind the other, say: of addresses and default gateways the first
 * of IPv4 each, in whatever section it stands.
 */
NetworkdSettings readNetworkdSettings(std::string_view texts);

/**
 * `own` as it is to be written for the change; `inForce` is all that holds for the interface now. DHCPv6 stays as it
 * is. A `domain` comes first among the domains, where resolved takes it from; new suffixes take the place of all
 * domains but those that only route.
 */
NetworkdSettings changed(NetworkdSettings own, const NetworkdSettings& inForce, const AdapterSettings& wanted);

/** The text of a drop-in with these settings. Lists of servers and domains take the place of those before. */
std::string dropInText(const NetworkdSettings& settings);

/**
 * The text of a .network file for one interface: these settings in front, then `rest`. Lists of addresses cannot be
 * emptied by a drop-in (systemd 252 adds to them whatever is assigned), so a unit that sets another address has to be
 * replaced by one of our own.
 */
std::string unitText(const std::string& interface, const NetworkdSettings& settings, std::string_view rest);

/**
 * What a unit says beside these settings: its text and that of its drop-ins without [Match] and without what
 * readNetworkdSettings found. For the `rest` of unitText.
 */
std::string restOf(std::string_view texts);

/** The `rest` in a text that unitText made. */
std::string restOfOwn(std::string_view unit);

/** The settings in a text that unitText or dropInText made. */
NetworkdSettings readOwnSettings(std::string_view text);

} // namespace Orv::Agent::Persistence
