/**
 * @file
 * What the kernel, udev and the firmware know of the hardware behind network interfaces.
 */
#pragma once

#include "agent/hardware/Inventory.h"

#include <cstdint>
#include <optional>
#include <string>
#include <vector>

namespace Orv::Agent::Linux {

/** The device that carries an interface. Texts are clean. */
struct ParentDevice {
    std::string syspath;   ///< absolute path below /sys: devices are equal when this is
    std::string subsystem; ///< "pci", "usb", "virtio", ...
    std::optional<std::string> vendor;
    std::optional<std::string> model;
    std::optional<std::string> serial;
    std::optional<std::string> driver;
    bool managementController =
        false; ///< the host's interface to its management controller (DSP0270, SMBIOS type 42)

    bool operator==(const ParentDevice&) const = default;
};

/**
 * The device behind an interface of this process's network namespace, by udev and sysfs; none for a virtual
 * interface, or when the interface vanished. `sysRoot` stands in front of /sys in tests.
 */
std::optional<ParentDevice> findParentDevice(const std::string& interface, const std::string& sysRoot = "");

/** The address burned into the interface, by rtnetlink or ethtool; none when it has none. Six or more raw octets. */
std::optional<std::vector<std::uint8_t>> readPermanentAddress(const std::string& interface);

/** All cards and ports of this process's network namespace; the loopback interface is not among them. */
HardwareInventory readHardwareInventory();

} // namespace Orv::Agent::Linux
