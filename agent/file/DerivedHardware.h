/**
 * @file
 * The network hardware of a description that describes adapters alone.
 */
#pragma once

#include "agent/hardware/Inventory.h"
#include "agent/tree/Tree.h"

namespace Orv::Agent {

/** The description of the chassis that is the management controller. */
inline constexpr const char* managementChassis = "BMC";

/**
 * A port for every adapter that has an identity, and a card for every device that has such a port. Only what the
 * adapters say is said of them; of adapters of one identity the first counts, since ports are known by name.
 */
HardwareInventory deriveHardware(const Tree& tree);

} // namespace Orv::Agent
