/**
 * @file
 * The network hardware of a host as plain values: cards and the ports on them.
 */
#pragma once

#include <cstdint>
#include <optional>
#include <string>
#include <vector>

namespace Orv::Agent {

/** A physical card: one device with one or more ports. Texts are valid UTF-8 without control characters. */
struct NetworkCard {
    std::string name;                       ///< the interface name of its first port
    std::optional<std::string> status;      ///< CIM_ManagedSystemElement.Status: "OK", "Degraded", "Stopped", ...
    std::optional<std::string> elementName; ///< a short name for people: vendor and model
    std::optional<std::string> description; ///< what the hardware database says of the device
    std::optional<std::string> serialNumber;
    std::optional<std::uint16_t> packageType; ///< CIM_PhysicalPackage.PackageType: 9 = module or card
    bool managementController = false;        ///< belongs to the management controller of this host

    bool operator==(const NetworkCard&) const = default;
};

/** An interface as a port. Virtual interfaces have a port and no card. */
struct NetworkPort {
    std::string name;                  ///< interface name
    std::optional<std::string> card;   ///< NetworkCard::name of the card that carries it
    std::optional<std::string> status; ///< CIM_ManagedSystemElement.Status
    std::optional<std::string> elementName;
    std::optional<std::string> caption;
    std::optional<std::string> description;
    std::optional<std::uint64_t> speed;          ///< bits per second, as negotiated
    std::optional<std::uint64_t> maxSpeed;       ///< bits per second, the fastest mode that the hardware supports
    std::optional<std::uint64_t> requestedSpeed; ///< bits per second, when autonegotiation is off
    std::optional<std::uint16_t> portType;       ///< CIM_NetworkPort.PortType
    std::optional<std::uint16_t> portNumber;     ///< counted from 0 within the card
    std::optional<std::string>
        permanentAddress; ///< twelve upper-case hexadecimal digits, as CIM_NetworkPort has them
    std::optional<bool> fullDuplex;
    std::optional<bool> autoSense;
    std::optional<std::uint16_t> linkTechnology; ///< CIM_NetworkPort.LinkTechnology: 2 = Ethernet, 11 = wireless
    bool managementController = false;

    bool operator==(const NetworkPort&) const = default;
};

/** Cards and ports, each in the order in which they are reported. */
struct HardwareInventory {
    std::vector<NetworkCard> cards;
    std::vector<NetworkPort> ports;

    bool operator==(const HardwareInventory&) const = default;
};

} // namespace Orv::Agent
