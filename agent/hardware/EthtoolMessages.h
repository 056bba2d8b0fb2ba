/**
 * @file
 * Messages of the generic netlink family "ethtool" (kernel: Documentation/networking/ethtool-netlink.rst). Payloads
 * begin with struct genlmsghdr.
 */
#pragma once

#include "agent/hardware/Attributes.h"
#include "agent/hardware/LinkModes.h"
#include "agent/hardware/Netlink.h"

#include <cstdint>
#include <optional>

namespace Orv::Agent::Hardware {

/** What one message tells of one interface; a field that the message does not have is none. */
struct InterfaceSettings {
    int index = 0;
    LinkSettings settings;

    bool operator==(const InterfaceSettings&) const = default;
};

/** A dump of ETHTOOL_MSG_LINKMODES_GET over all interfaces, with compact bit sets. */
NetlinkRequest linkModesRequest(std::uint16_t family);

/** ETHTOOL_MSG_LINKMODES_GET_REPLY: everything but the connector; none for other messages and without an index. */
std::optional<InterfaceSettings> parseLinkModes(Bytes payload);

/** A dump of ETHTOOL_MSG_LINKINFO_GET over all interfaces. */
NetlinkRequest linkInfoRequest(std::uint16_t family);

/** ETHTOOL_MSG_LINKINFO_GET_REPLY: the connector; none for other messages and without an index. */
std::optional<InterfaceSettings> parseLinkInfo(Bytes payload);

} // namespace Orv::Agent::Hardware
