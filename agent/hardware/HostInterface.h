/**
 * @file
 * The network interfaces that lead from this host to its management controller, as the firmware lists them: SMBIOS
 * structures of type 42 (DSP0134), interface type "network host interface" with the descriptors of DSP0270.
 */
#pragma once

#include "agent/hardware/Attributes.h"

#include <array>
#include <cstdint>
#include <optional>
#include <string>
#include <vector>

namespace Orv::Agent::Hardware {

enum class DeviceBus { Usb, Pci };

/** What the firmware says of such an interface; what a descriptor leaves open is empty. */
struct HostInterface {
    DeviceBus bus = DeviceBus::Usb;
    std::uint16_t vendor = 0;
    std::uint16_t product = 0;
    std::optional<std::uint16_t> subsystemVendor;
    std::optional<std::uint16_t> subsystemProduct;
    std::string serial;     ///< USB serial number
    std::string pciAddress; ///< "0000:03:00.1", as Linux names PCI functions
    std::string macAddress; ///< "02:00:00:00:00:01", as sysfs shows addresses

    bool operator==(const HostInterface&) const = default;
};

/** What sysfs says of a device that may be one. */
struct DeviceIdentity {
    DeviceBus bus = DeviceBus::Usb;
    std::uint16_t vendor = 0;
    std::uint16_t product = 0;
    std::optional<std::uint16_t> subsystemVendor;
    std::optional<std::uint16_t> subsystemProduct;
    std::string serial;
    std::string pciAddress;
    std::vector<std::string> macAddresses; ///< of its interfaces, as far as they can be seen
};

/** The interfaces that a row of SMBIOS structures lists. Ends at the first structure that does not fit the bytes. */
std::vector<HostInterface> parseHostInterfaces(Bytes structures);

/** Reads the firmware's list below `sysRoot`/sys. Only root can; for all others it is empty. */
std::vector<HostInterface> readHostInterfaces(const std::string& sysRoot);

/** Whether the device is this interface: everything that both sides tell must agree. */
bool matches(const HostInterface& interface, const DeviceIdentity& device);

} // namespace Orv::Agent::Hardware
