/**
 * @file
 * From what was read of interfaces to cards and ports.
 */
#pragma once

#include "agent/hardware/Devices.h"
#include "agent/hardware/EthtoolIoctl.h"
#include "agent/hardware/Inventory.h"
#include "agent/hardware/LinkModes.h"
#include "agent/hardware/Links.h"

#include <cstdint>
#include <optional>
#include <vector>

namespace Orv::Agent::Hardware {

/** Everything that was read of one interface. */
struct InterfaceFacts {
    Link link;
    LinkSettings settings;
    std::optional<ParentDevice> device;
    std::optional<std::uint16_t> portNumber; ///< sysfs dev_port
    bool wireless = false;
};

/** Cards and ports of these interfaces, in their order; loopback interfaces are left out. No I/O. */
HardwareInventory buildInventory(const std::vector<InterfaceFacts>& interfaces);

/**
 * The device of a link: the one that its message names, else, for a kernel that names none and a link that is of no
 * virtual kind, the one of /sys/class/net, if that shows this very interface and not one of another namespace.
 */
std::optional<ParentDevice> deviceOf(const Link& link, const DeviceReader& reader);

/** The permanent address of a link by its message, else by ioctl; none when it has none. */
std::optional<std::vector<std::uint8_t>> permanentAddressOf(const Link& link, const EthtoolIoctl& ioctl);

/** Reads all interfaces of this process's network namespace. Throws std::system_error when links cannot be read. */
std::vector<InterfaceFacts> readInterfaces();

} // namespace Orv::Agent::Hardware
