#include "agent/hardware/Hardware.h"

#include "agent/hardware/Devices.h"
#include "agent/hardware/EthtoolIoctl.h"
#include "agent/hardware/InventoryBuilder.h"
#include "agent/hardware/Links.h"

#include <linux/netlink.h>

namespace Orv::Agent::Linux {

std::optional<ParentDevice> describeDevice(const DeviceName& device, const std::string& sysRoot) {
    return Hardware::DeviceReader(sysRoot).describe(device);
}

std::optional<ParentDevice> findParentDevice(const std::string& interface, const std::string& sysRoot) {
    const Hardware::DeviceReader reader(sysRoot);
    if (!sysRoot.empty()) {
        return reader.describeOfInterface(interface);
    }
    Hardware::NetlinkSocket socket(NETLINK_ROUTE);
    const auto link = Hardware::readLink(socket, interface);
    return link ? Hardware::deviceOf(*link, reader) : std::nullopt;
}

std::optional<std::vector<std::uint8_t>> readPermanentAddress(const std::string& interface) {
    Hardware::NetlinkSocket socket(NETLINK_ROUTE);
    const auto link = Hardware::readLink(socket, interface);
    return link ? Hardware::permanentAddressOf(*link, Hardware::EthtoolIoctl()) : std::nullopt;
}

HardwareInventory readHardwareInventory() {
    return Hardware::buildInventory(Hardware::readInterfaces());
}

} // namespace Orv::Agent::Linux
