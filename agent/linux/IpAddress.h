/**
 * @file
 * An address of either family as a value.
 */
#pragma once

#include <array>
#include <cstdint>
#include <span>
#include <string>
#include <tuple>

#include <sys/socket.h>

namespace Orv::Agent::Linux {

/** The families that are read, IPv4 first. */
constexpr std::array<std::uint8_t, 2> addressFamilies{AF_INET, AF_INET6};

/** An IPv4 or IPv6 address, or none. */
struct IpAddress {
    std::uint8_t family = 0;              ///< AF_INET, AF_INET6, or 0 for none
    std::array<std::uint8_t, 16> bytes{}; ///< network order; IPv4 uses the first four, the rest are 0

    /** The address in these bytes; none when their number is not that of the family. */
    static IpAddress fromBytes(std::uint8_t family, std::span<const std::uint8_t> bytes);

    [[nodiscard]] bool any() const { return family != 0; }

    /** Dotted or RFC 5952 form; empty for none. */
    [[nodiscard]] std::string text() const;

    bool operator==(const IpAddress&) const = default;

    /** Some order, for sets and maps. */
    bool operator<(const IpAddress& other) const {
        return std::tie(family, bytes) < std::tie(other.family, other.bytes);
    }
};

/** The number of bytes of an address of this family; 0 for a family that is neither IPv4 nor IPv6. */
std::size_t addressLength(std::uint8_t family);

/** The IPv4 mask of a prefix length from 0 to 32 in dotted form. */
std::string maskText(std::uint8_t prefixLength);

} // namespace Orv::Agent::Linux
