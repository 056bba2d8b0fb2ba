/**
 * @file
 * Writes a client's property changes to an adapter's node in the instrumentation tree.
 */
#pragma once

#include <string>

namespace Orv::NetworkAdapterComposite {

/**
 * Writes those of the four values that are not empty, in the order address, mask, gateway, domain, to the first
 * adapter whose identity is `settingId`, byte for byte. Mind the order of the arguments, which is another one.
 *
 * Returns 0 when it ran to its end, whether or not there was such an adapter, and 1 when there are no adapters at all
 * or when the agent threw; what had been written until then stays. Throws nothing derived from `std::exception`. An
 * adapter whose identity cannot be read is asked again until it answers or the agent throws.
 */
unsigned short modifyNetworkAdapterConfigurationInstances(std::string settingId, std::string ipAddress,
                                                          std::string gateway, std::string subnetMask,
                                                          std::string dnsDomain);

} // namespace Orv::NetworkAdapterComposite
