/**
 * @file
 * From one written property to the change that it asks for.
 */
#pragma once

#include "agent/change/AdapterSettings.h"
#include "agent/change/ChangeError.h"

#include <optional>
#include <string>

namespace Orv::Agent {

/**
 * What earlier writes to one interface leave to be completed. Address and mask of a static configuration arrive as
 * two writes, behind one that makes the mode static. A back end keeps one of these per interface, and forgets it with
 * the interface.
 */
struct PendingPair {
    bool isExpected = false;                  ///< the mode was made static: address and mask may follow
    std::optional<std::uint8_t> prefixLength; ///< a mask that waits for its address
    std::optional<Ipv4Address> gateway; ///< put out of reach by the first of the two writes, back with the other

    bool operator==(const PendingPair&) const = default;
};

/** What one write comes to. */
struct Resolution {
    AdapterSettings wanted; ///< what is to change; nothing at all when the write waits for its other half
    PendingPair pending;    ///< to be kept once the change is applied, and not when it fails

    bool operator==(const Resolution&) const = default;
};

/**
 * Decides what the write of `value` to `property` of `interface` asks for, with `inForce` in force and `pending` left
 * by the writes before. Nothing is touched.
 *
 * - PROP_DHCP_ENABLED: 1 (DHCP) wants no address and no gateway; 3 (static) wants those in force, leased ones too, to
 *   stay for good until an address is written.
 * - PROP_IPV4_ADDRESS and PROP_IPV4_SUBNET_MASK: the value decides which of the two it is, whichever of the
 * properties it arrives in: a contiguous mask is a mask, anything else is an address. An address takes the mask that
 * waits for one, else the prefix length in force, else that of its class. A mask goes with the address in force; it
 * waits for an address where there is none, and also where it does not suit the one in force while a new one is
 * expected. A gateway in force that the new network does not reach is given up.
 * - PROP_DEFAULT_GATEWAY: must be reached with the address in force.
 * - PROP_DNS_DOMAIN, PROP_DNS_SERVERS, PROP_DNS_SUFFIXES: replace what was there. An empty list removes it.
 *
 * Address, mask and gateway are refused while the mode is DHCP: the client would undo them with the next lease.
 *
 * Throws ChangeError when the rules (Rules.h) are broken, the value is of another type than the property's, or the
 * property is one that cannot be written.
 */
Resolution resolve(const std::string& interface, NodeLexicon::Properties property, const PropertyValue& value,
                   const AdapterSettings& inForce, const PendingPair& pending);

} // namespace Orv::Agent
