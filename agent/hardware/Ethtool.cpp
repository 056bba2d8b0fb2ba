#include "agent/hardware/Ethtool.h"

#include "agent/hardware/EthtoolIoctl.h"
#include "agent/hardware/EthtoolMessages.h"
#include "agent/hardware/GenericFamily.h"

#include <system_error>

#include <linux/ethtool_netlink.h>
#include <linux/netlink.h>

namespace Orv::Agent::Hardware {

namespace {

std::optional<std::uint16_t> findFamily(NetlinkSocket& socket) {
    auto request = familyRequest(ETHTOOL_GENL_NAME);
    std::optional<std::uint16_t> type;
    socket.ask(request, [&](Bytes payload) {
        if (const auto family = parseFamily(payload)) {
            type = family->type;
        }
    });
    return type;
}

/** What the dumps tell; false when they do not tell it all. */
bool readByNetlink(SettingsByIndex& settings) {
    try {
        NetlinkSocket socket(NETLINK_GENERIC);
        const auto family = findFamily(socket);
        if (!family) {
            return false;
        }
        auto modes = linkModesRequest(*family);
        for (auto& [index, read] : dump(socket, modes, parseLinkModes)) {
            settings[index] = std::move(read);
        }
        auto info = linkInfoRequest(*family);
        for (const auto& [index, read] : dump(socket, info, parseLinkInfo)) {
            settings[index].port = read.port;
        }
        return true;
    } catch (const std::system_error&) {
        return false; // no such family, no generic netlink, or a device that fails: the ioctl asks them one by one
    }
}

} // namespace

SettingsByIndex readLinkSettings(const std::vector<Link>& links) {
    SettingsByIndex settings;
    if (readByNetlink(settings)) {
        return settings;
    }
    const EthtoolIoctl ioctl;
    for (const auto& link : links) {
        if (settings.contains(link.index) && settings[link.index].port) {
            continue;
        }
        if (auto read = ioctl.linkSettings(link.name)) {
            settings[link.index] = std::move(*read);
        }
    }
    return settings;
}

} // namespace Orv::Agent::Hardware
