/**
 * @file
 * Network interfaces as rtnetlink reports them: no more than the hardware inventory asks of a link.
 */
#pragma once

#include "agent/hardware/Attributes.h"
#include "agent/hardware/Hardware.h"
#include "agent/hardware/Netlink.h"

#include <cstdint>
#include <optional>
#include <string>
#include <vector>

namespace Orv::Agent::Hardware {

using Linux::DeviceName;

/** One interface. Texts are the kernel's bytes. */
struct Link {
    int index = 0;
    std::string name;
    unsigned flags = 0;                         ///< IFF_*
    unsigned short hardwareType = 0;            ///< ARPHRD_*
    std::string kind;                           ///< IFLA_INFO_KIND: "veth", "bond", ...; empty for hardware
    std::string alias;                          ///< what an administrator called it (IFLA_IFALIAS)
    std::vector<std::uint8_t> permanentAddress; ///< empty: none, or unknown to this kernel (before Linux 5.6)
    std::optional<DeviceName> device;           ///< none: virtual, or unknown to this kernel (before Linux 5.14)

    bool operator==(const Link&) const = default;
};

/** The link that an RTM_NEWLINK payload (struct ifinfomsg and attributes) tells of; none without index and name. */
std::optional<Link> parseLink(Bytes payload);

/** All links by index. Throws std::system_error. */
std::vector<Link> readLinks(NetlinkSocket& socket);

/** One link; none when there is no interface of this name. Throws std::system_error. */
std::optional<Link> readLink(NetlinkSocket& socket, const std::string& name);

} // namespace Orv::Agent::Hardware
