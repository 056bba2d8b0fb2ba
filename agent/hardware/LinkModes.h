/**
 * @file
 * Link modes (enum ethtool_link_mode_bit_indices) and what they tell of a port.
 */
#pragma once

#include <cstdint>
#include <optional>
#include <span>
#include <vector>

namespace Orv::Agent::Hardware {

/** Settings of a link as ethtool reports them; what the driver does not know is none. */
struct LinkSettings {
    std::optional<std::uint32_t> speed; ///< Mb/s
    std::optional<bool> fullDuplex;
    std::optional<bool> autonegotiation;  ///< whether it is on
    std::vector<std::uint32_t> supported; ///< link mode bits, 32 to a word; empty or zero: the driver tells nothing
    std::optional<std::uint8_t> port;     ///< PORT_*

    bool operator==(const LinkSettings&) const = default;
};

/** The kernel's speed, for which 0 and 0xffffffff mean that it is unknown. */
std::optional<std::uint32_t> knownSpeed(std::uint32_t speed);

/** The kernel's DUPLEX_*. */
std::optional<bool> knownDuplex(std::uint8_t duplex);

/** Mb/s of the fastest of these modes; none when none of them is a speed. Modes newer than this table do not count.
 */
std::optional<std::uint32_t> fastestMode(std::span<const std::uint32_t> supported);

/** Whether the port can negotiate; none when the driver lists no modes and negotiation is not on. */
std::optional<bool> canNegotiate(const LinkSettings& settings);

/**
 * CIM_EthernetPort.PortType of the mode in use, where it is certain: the speed and the connector leave only modes of
 * one type.
 */
std::optional<std::uint16_t> cimPortType(const LinkSettings& settings);

} // namespace Orv::Agent::Hardware
