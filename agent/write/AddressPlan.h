/**
 * @file
 * In which steps the address of an interface is exchanged.
 */
#pragma once

#include "agent/change/Ipv4.h"
#include "agent/write/ChangeSocket.h"
#include "agent/write/KernelObject.h"

#include <optional>

namespace Orv::Agent::Linux {

/** Steps, and what they lead to. */
struct AddressPlan {
    ChangeBatch steps;
    std::vector<AddressObject> result; ///< in the kernel's order
    bool isGapless = true;             ///< the interface is never without an address on the way
};

/**
 * Plans to have `wanted`, or nothing, in the place of the address that stands for the interface; with `endLeases`
 * also to remove the others that run out. Pure.
 *
 * The kernel reports addresses in the order in which they came, makes the later of two in one network a secondary,
 * and on removal of a primary address either removes its secondaries or promotes the first (promote_secondaries). So
 * all that would come before the new address leaves and comes back behind it, whatever that setting is.
 */
AddressPlan planAddress(const InterfaceTables& before, const std::optional<Ipv4Prefixed>& wanted, bool endLeases);

/** Plans to have the first address that runs out stand for the interface; no steps when it does, or there is none. */
AddressPlan planLeaseFirst(const InterfaceTables& before);

} // namespace Orv::Agent::Linux
