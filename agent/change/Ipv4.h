/**
 * @file
 * IPv4 addresses, masks and prefix lengths as values.
 */
#pragma once

#include <cstdint>
#include <optional>
#include <string>
#include <string_view>

namespace Orv::Agent {

/** An IPv4 address. */
struct Ipv4Address {
    std::uint32_t number = 0; ///< in host order: 192.0.2.1 is 0xC0000201

    /**
     * Four decimal numbers from 0 to 255 with dots between them and nothing else. No leading zeros, which
     * inet_aton(3) would read as octal, and none of its shorter forms: an address that two programs read differently
     * is worse than none.
     */
    static std::optional<Ipv4Address> parse(std::string_view text);

    /** The dotted form. */
    [[nodiscard]] std::string text() const;

    bool operator==(const Ipv4Address&) const = default;
};

/** An address of an interface with the length of its network's prefix. */
struct Ipv4Prefixed {
    Ipv4Address address;
    std::uint8_t prefixLength = 0; ///< 0 to 32

    /** Whether the other address lies in this network. */
    [[nodiscard]] bool covers(Ipv4Address other) const;

    /** The last address of the network. */
    [[nodiscard]] Ipv4Address broadcast() const;

    /** "192.0.2.1/24" */
    [[nodiscard]] std::string text() const;

    bool operator==(const Ipv4Prefixed&) const = default;
};

/** The mask of a prefix length from 0 to 32. */
Ipv4Address maskOf(std::uint8_t prefixLength);

/** The prefix length of a contiguous mask, 0.0.0.0 and 255.255.255.255 included; none of anything else. */
std::optional<std::uint8_t> prefixLengthOf(Ipv4Address mask);

/** The prefix length of the class that the address is of (RFC 791): 8, 16 or 24; 24 beyond class C. */
std::uint8_t classPrefixLength(Ipv4Address address);

} // namespace Orv::Agent
