/**
 * @file
 * Cards and ports as CIM objects: which properties they have, of which type, and which of them are keys.
 */
#pragma once

#include "agent/hardware/Inventory.h"

#include <cstddef>
#include <cstdint>
#include <functional>
#include <memory>
#include <optional>
#include <string>
#include <variant>
#include <vector>

namespace Orv::Platform {

/** A property's value; the alternative tells its CIM type (string, uint16, uint64, boolean), none is NULL of it. */
using PropertyValue = std::variant<std::optional<std::string>, std::optional<std::uint16_t>,
                                   std::optional<std::uint64_t>, std::optional<bool>>;

struct Property {
    const char* name;
    PropertyValue value;
};

/** One object: its keys come first. Texts are valid UTF-8 without control characters. */
struct Object {
    std::size_t keys; ///< how many of the properties are keys; all of them are strings that are not NULL
    std::vector<Property> properties;
};

/** Takes one object at a time; returns false when it wants no more. */
using ObjectSink = std::function<bool(const Object&)>;

/** A class of objects: its name, and how the inventory shows them. */
struct ObjectClass {
    const char* name;
    void (*forEach)(const Agent::HardwareInventory& inventory, const ObjectSink& sink);
};

/** TAVIS_NetworkCard: CIM_PhysicalPackage of each card. Its Tag is the interface name of the card's first port. */
extern const ObjectClass networkCard;

/** TAVIS_NetworkPort: CIM_NetworkPort of each interface. Its DeviceID is the interface name. */
extern const ObjectClass networkPort;

/**
 * The hardware of this host, or, when the agent's configuration names a description of a simulated host, what that
 * describes: whoever tries things on a simulated host sees it whole. Throws std::exception with the reason.
 */
std::shared_ptr<const Agent::HardwareInventory> currentInventory();

} // namespace Orv::Platform
