#include "agent/hardware/LinkModes.h"

#include <array>

#include <linux/ethtool.h>

namespace Orv::Agent::Hardware {

namespace {

constexpr std::uint32_t noSpeed = 0;
constexpr std::uint16_t noType = 0;
constexpr std::uint8_t anyPort = PORT_OTHER;

/** Modes of consecutive bits. `type` is their CIM_EthernetPort.PortType, `port` the connector that goes with it. */
struct Modes {
    unsigned first;
    unsigned last;
    std::uint32_t speed; ///< Mb/s
    std::uint16_t type = noType;
    std::uint8_t port = anyPort;
};

/**
 * The bits are numbers here because the kernel that runs may be newer than the headers. Older drivers report
 * 10000baseT for fibre as well, so a twisted-pair type goes with a twisted-pair connector only.
 */
constexpr std::array modeTable{
    Modes{0, 1, 10, 50, PORT_TP},          // 10baseT
    Modes{2, 3, 100, 52, PORT_TP},         // 100baseT
    Modes{4, 5, 1000, 53, PORT_TP},        // 1000baseT
    Modes{12, 12, 10000, 55, PORT_TP},     // 10000baseT
    Modes{15, 15, 2500},                   // 2500baseX
    Modes{17, 17, 1000},                   // 1000baseKX
    Modes{18, 20, 10000},                  // 10000baseKX4, KR, R_FEC
    Modes{21, 22, 20000},                  // 20000base
    Modes{23, 26, 40000},                  // 40000base
    Modes{27, 30, 56000},                  // 56000base
    Modes{31, 33, 25000},                  // 25000base
    Modes{34, 35, 50000},                  // 50000baseCR2, KR2
    Modes{36, 39, 100000},                 // 100000base over 4 lanes
    Modes{40, 40, 50000},                  // 50000baseSR2
    Modes{41, 41, 1000},                   // 1000baseX
    Modes{42, 42, 10000},                  // 10000baseCR
    Modes{43, 43, 10000, 105, PORT_FIBRE}, // 10000baseSR
    Modes{44, 44, 10000, 108, PORT_FIBRE}, // 10000baseLR
    Modes{45, 45, 10000},                  // 10000baseLRM
    Modes{46, 46, 10000, 110, PORT_FIBRE}, // 10000baseER
    Modes{47, 47, 2500, 54, PORT_TP},      // 2500baseT
    Modes{48, 48, 5000},                   // 5000baseT
    Modes{52, 56, 50000},                  // 50000base over one lane
    Modes{57, 61, 100000},                 // 100000base over 2 lanes
    Modes{62, 66, 200000},                 // 200000base over 4 lanes
    Modes{67, 67, 100},                    // 100baseT1
    Modes{68, 68, 1000},                   // 1000baseT1
    Modes{69, 73, 400000},                 // 400000base over 8 lanes
    Modes{75, 79, 100000},                 // 100000base over one lane
    Modes{80, 84, 200000},                 // 200000base over 2 lanes
    Modes{85, 89, 400000},                 // 400000base over 4 lanes
    Modes{90, 91, 100, 100, PORT_FIBRE},   // 100baseFX
    Modes{92, 92, 10},                     // 10baseT1L
    Modes{93, 98, 800000},                 // 800000base over 8 lanes
    Modes{99, 102, 10},                    // 10baseT1S, 10baseT1BRR
    Modes{103, 108, 200000},               // 200000base over one lane
    Modes{109, 114, 400000},               // 400000base over 2 lanes
    Modes{115, 120, 800000},               // 800000base over 4 lanes
    Modes{121, 124, 1600000},              // 1600000base over 8 lanes
};

constexpr unsigned wordBits = 32;

bool hasBit(std::span<const std::uint32_t> words, unsigned bit) {
    const unsigned word = bit / wordBits;
    return word < words.size() && (words[word] >> (bit % wordBits) & 1U) != 0;
}

bool hasAny(std::span<const std::uint32_t> words, const Modes& modes) {
    for (unsigned bit = modes.first; bit <= modes.last; ++bit) {
        if (hasBit(words, bit)) {
            return true;
        }
    }
    return false;
}

bool isEmpty(std::span<const std::uint32_t> words) {
    for (const auto word : words) {
        if (word != 0) {
            return false;
        }
    }
    return true;
}

} // namespace

std::optional<std::uint32_t> knownSpeed(std::uint32_t speed) {
    const bool unknown = speed == noSpeed || speed == static_cast<std::uint32_t>(SPEED_UNKNOWN);
    return unknown ? std::nullopt : std::optional(speed);
}

std::optional<bool> knownDuplex(std::uint8_t duplex) {
    if (duplex != DUPLEX_FULL && duplex != DUPLEX_HALF) {
        return std::nullopt;
    }
    return duplex == DUPLEX_FULL;
}

std::optional<std::uint32_t> fastestMode(std::span<const std::uint32_t> supported) {
    std::uint32_t fastest = noSpeed;
    for (const auto& modes : modeTable) {
        if (modes.speed > fastest && hasAny(supported, modes)) {
            fastest = modes.speed;
        }
    }
    return knownSpeed(fastest);
}

std::optional<bool> canNegotiate(const LinkSettings& settings) {
    if (settings.autonegotiation.value_or(false)) {
        return true;
    }
    if (isEmpty(settings.supported)) {
        return std::nullopt;
    }
    return hasBit(settings.supported, ETHTOOL_LINK_MODE_Autoneg_BIT);
}

std::optional<std::uint16_t> cimPortType(const LinkSettings& settings) {
    std::optional<std::uint16_t> type;
    for (const auto& modes : modeTable) {
        if (settings.speed != modes.speed || !hasAny(settings.supported, modes)) {
            continue;
        }
        if (modes.type == noType || settings.port != modes.port || (type && type != modes.type)) {
            return std::nullopt;
        }
        type = modes.type;
    }
    return type;
}

} // namespace Orv::Agent::Hardware
