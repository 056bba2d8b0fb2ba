/**
 * @file
 * Which of the many things that the kernel has for an interface are the one that is reported. Pure functions.
 */
#pragma once

#include "agent/linux/KernelState.h"

#include <cstdint>
#include <optional>
#include <span>
#include <string>

namespace Orv::Agent::Linux {

/** PROP_STATUS of an adapter. */
enum class AdapterStatus : unsigned int {
    running = 1,           ///< up, and the link below works
    stopped = 5,           ///< administratively down
    lostCommunication = 12 ///< up without carrier, lower layer or authentication
};

AdapterStatus statusOf(const Link& link);

/** Whether this is the loopback interface, which is no adapter. */
bool isLoopback(const Link& link);

/**
 * The IPv4 address that stands for the interface: a primary one before a secondary, the wider scope before the
 * narrower, then the kernel's order. Null when there is none; else it points into `addresses`.
 */
const Address* reportedIpv4(const KernelState::Addresses& addresses);

/**
 * The IPv6 address that stands for the interface. One that can be used before one that cannot (tentative, or a
 * duplicate); then global before link-local; current before deprecated; lasting before temporary (RFC 8981), because
 * management wants the address under which the host is found tomorrow; then the kernel's order.
 */
const Address* reportedIpv6(const KernelState::Addresses& addresses);

/**
 * The gateway of the interface: that of its default route with the lowest metric, IPv4 before IPv6. Among routes of
 * equal metric a live one before a dead, one that the kernel has not given up reaching before one that it has, the
 * higher router preference, then the kernel's order. None when the best route needs no gateway.
 */
std::optional<IpAddress> gatewayOf(const KernelState& state, int index);

/**
 * The octets in lower-case hexadecimal with colons, when they are a link-layer address: 6 (EUI-48), 8 (EUI-64) or 20
 * (InfiniBand) of them and not all 0. Tunnels put IP addresses there, which are no such thing.
 */
std::optional<std::string> hardwareAddressText(std::span<const std::uint8_t> octets);

} // namespace Orv::Agent::Linux
