/**
 * @file
 * What `ip` says of the addresses and routes of one interface, a line of text each.
 */
#pragma once

#include "tests/support/Namespace.h"

#include <string>
#include <vector>

namespace Orv::Test {

using Lines = std::vector<std::string>;

/**
 * The IPv4 addresses in the kernel's order: "192.0.2.10/24 brd 192.0.2.255", with " peer ...", " secondary", " link"
 * (the scope), " dynamic" and " label ..." where that is so.
 */
Lines addressLines(const Namespace& space, const std::string& interface);

/** Adds an IPv6 address of a /64 and waits until the kernel has nothing more to do for those of the interface. */
void addIpv6(const Namespace& space, const std::string& interface, const std::string& address);

/** All IPv6 addresses of the interface, as `ip -j` has them. */
std::string ipv6Addresses(const Namespace& space, const std::string& interface);

/**
 * The IPv4 routes through the interface of all tables but the local one, without those that the kernel makes:
 * "default via 192.0.2.1 metric 100", with " table ...", " src ...", " mtu ...", " proto ..." where there is more to
 * say.
 */
Lines routeLines(const Namespace& space, const std::string& interface);

} // namespace Orv::Test
