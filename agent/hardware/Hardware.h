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

/** What rtnetlink says of the device behind a link: IFLA_PARENT_DEV_BUS_NAME and IFLA_PARENT_DEV_NAME (Linux 5.14).
 */
struct DeviceName {
    std::string bus;
    std::string name;

    bool operator==(const DeviceName&) const = default;
};

/**
 * Describes the device of that name on that bus by udev and sysfs; none when there is none (any more). Reads files
 * only, so a reader of link messages can ask for each link that names a device. `sysRoot` stands in front of /sys in
 * tests, and the udev database is left out then.
 */
std::optional<ParentDevice> describeDevice(const DeviceName& device, const std::string& sysRoot = "");

/**
 * The device behind an interface of this process's network namespace; none for a virtual interface, or when the
 * interface vanished. Costs a request to the kernel: who has the link message at hand asks describeDevice. With a
 * `sysRoot` only its /sys/class/net is consulted. Throws std::system_error when the kernel cannot be asked.
 */
std::optional<ParentDevice> findParentDevice(const std::string& interface, const std::string& sysRoot = "");

/**
 * The address burned into the interface, by rtnetlink or ethtool; none when it has none, or when the interface
 * vanished. As many raw octets as its kind of link has, six for Ethernet. Throws std::system_error when the kernel
 * cannot be asked.
 */
std::optional<std::vector<std::uint8_t>> readPermanentAddress(const std::string& interface);

/**
 * All cards and ports of this process's network namespace, in the order of the kernel's interface indexes; the
 * loopback interface is not among them, and an interface that vanishes during the read is left out. The cards are the
 * distinct devices that carry ports. Needs no privileges, but only root can read which device belongs to the
 * management controller. Throws std::system_error when the links cannot be read.
 */
HardwareInventory readHardwareInventory();

} // namespace Orv::Agent::Linux
