/**
 * @file
 * What may stand in a configuration. Every rule answers with the reason why not; an empty text means that it may.
 *
 * Pure functions, shared by all back ends.
 */
#pragma once

#include "agent/change/AdapterSettings.h"

#include <cstddef>
#include <string>
#include <string_view>
#include <vector>

namespace Orv::Agent {

/** Limits of the C library's resolver (MAXNS and MAXDNSRCH of resolv.h): what is beyond them it does not read. */
constexpr std::size_t mostNameServers = 3;
constexpr std::size_t mostSearchSuffixes = 6;

/** An address that one interface may have: not of network 0, loopback, multicast, class E or the broadcast address.
 */
std::string whyNotHostAddress(Ipv4Address address);

/** As above; and the part behind a prefix shorter than 31 bits is neither all zeros nor all ones (RFC 3021). */
std::string whyNotInterfaceAddress(Ipv4Prefixed address);

/** A prefix length of a subnet mask: 1 to 32. */
std::string whyNotPrefixLength(std::uint8_t prefixLength);

/** A gateway that is a host address, reached on the link of `address` and not that address itself. */
std::string whyNotGateway(Ipv4Address gateway, const std::optional<Ipv4Prefixed>& address);

/** A host or domain name by RFC 1123: labels of letters, digits and inner hyphens, 63 octets each, 253 in all. */
std::string whyNotDomain(std::string_view name);

/** IPv4 or IPv6 addresses of hosts, a loopback address too, an IPv6 link-local one with its %zone; none twice. */
std::string whyNotNameServers(const std::vector<std::string>& servers);

/** Domain names, none twice whatever the case of their letters. */
std::string whyNotSuffixes(const std::vector<std::string>& suffixes);

} // namespace Orv::Agent
