/**
 * @file
 * Reads the network adapters' configuration out of the instrumentation tree.
 */
#pragma once

#include "configuration/NetworkAdapterConfiguration.h"

#include <map>
#include <string>

namespace Orv::NetworkAdapterComposite {

/**
 * Records by node identity, in byte order. The key is the identity as the agent gives it, while the record's
 * SettingID is without spaces. A node without identity stands under the empty key.
 */
using NetworkAdapterConfigurationMap = std::map<std::string, NetworkAdapterConfiguration>;

/**
 * Adds a record for every adapter node to `configurations`, but for those of the management controller, whose
 * grandparent is described "BMC". A later node replaces an earlier one of the same identity; nothing is ever removed.
 *
 * Returns 0 when all nodes have been read, 1 when there is no adapter node, or when an exception derived from
 * `std::exception` ended the scan: its text goes to the standard error stream, and records of earlier nodes stay.
 */
unsigned short getNetworkAdapterConfigurationInstances(NetworkAdapterConfigurationMap& configurations);

/**
 * Stores the MAC address of the port whose identity is `portString`, byte for byte, in `macAddress`; of several such
 * ports the last one counts. Returns whether one was found. Throws nothing derived from `std::exception`.
 */
bool getMacAddressFromNetworkPort(std::string portString, std::string& macAddress);

} // namespace Orv::NetworkAdapterComposite
