/**
 * @file
 * What the inventory and the changes know alike about adapter nodes.
 */
#pragma once

#include "instrumentation/Instrumentation.h"

#include <string>

namespace Orv::NetworkAdapterComposite {

/** The description of the device that carries adapters which belong to the management controller and not to the host.
 */
inline constexpr const char* MANAGEMENT_CONTROLLER = "BMC";

// Address assignment of an adapter, as PROP_DHCP_ENABLED has it.
inline constexpr unsigned int ASSIGNMENT_DHCP = 1;
inline constexpr unsigned int ASSIGNMENT_STATIC = 3;

/** Which device the node under the cursor belongs to. Throws what the agent throws. */
inline std::string grandparentDescription(Instrumentation& node) {
    Instrumentation ancestor;
    ancestor.selectNode(node.getPathToParentNode());
    ancestor.selectNode(ancestor.getPathToParentNode());
    return ancestor.getNodeDescription();
}

} // namespace Orv::NetworkAdapterComposite
