/**
 * @file
 * The families of generic netlink (linux/genetlink.h): modules of the kernel that get their numbers when they are
 * loaded.
 */
#pragma once

#include "agent/hardware/Attributes.h"
#include "agent/hardware/Netlink.h"

#include <cstdint>
#include <map>
#include <optional>
#include <string>

namespace Orv::Agent::Hardware {

/** A family under its present numbers. */
struct GenericFamily {
    std::uint16_t type = 0;            ///< nlmsg_type of its messages
    std::map<std::string, int> groups; ///< the multicast groups that it announces things to, by name

    bool operator==(const GenericFamily&) const = default;
};

/** CTRL_CMD_GETFAMILY for the family of this name; the kernel loads its module where it can, and answers ENOENT else.
 */
NetlinkRequest familyRequest(const char* name);

/** The family in the payload of the answer; none without a number. */
std::optional<GenericFamily> parseFamily(Bytes payload);

} // namespace Orv::Agent::Hardware
