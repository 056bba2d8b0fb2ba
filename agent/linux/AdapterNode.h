/**
 * @file
 * The properties of one adapter node. Pure function of what is known.
 */
#pragma once

#include "agent/linux/HostConfiguration.h"
#include "agent/linux/KernelState.h"
#include "agent/tree/Tree.h"

namespace Orv::Agent::Linux {

/** What the host's files recognise the interface by. */
InterfaceFacts factsOf(const Link& link, const std::vector<std::uint8_t>& permanentAddress);

/**
 * Of a property nothing is known: it is absent. The codes:
 * - PROP_STATUS as AdapterStatus.
 * - PROP_DHCP_ENABLED as AddressMode: `leased` when the IPv4 address runs out (the kernel's flag says so), else what
 * the host's files say, else `fixed` when there is an IPv4 address, else absent.
 * - PROP_IP_SUPPORT: 1 when the adapter has IPv4 addresses only, 2 IPv6 only, 3 both; absent when it has none.
 */
PropertyMap adapterProperties(const Link& link, const std::vector<std::uint8_t>& permanentAddress,
                              const KernelState& state, const HostConfiguration& configuration);

} // namespace Orv::Agent::Linux
