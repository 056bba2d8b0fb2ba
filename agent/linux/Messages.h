/**
 * @file
 * What the kernel says about interfaces, addresses, routes and neighbours, as plain values, and the one function that
 * reads them out of rtnetlink messages (rtnetlink(7), linux/if_link.h, linux/if_addr.h, linux/rtnetlink.h). What it
 * says about teams comes another way (TeamMessages.h).
 */
#pragma once

#include "agent/linux/IpAddress.h"

#include <cstdint>
#include <map>
#include <optional>
#include <string>
#include <variant>
#include <vector>

struct nlmsghdr;

namespace Orv::Agent::Linux {

/** An interface of the namespace. Texts are the kernel's bytes, not yet cleaned. */
struct Link {
    int index = 0;                              ///< positive
    std::string name;                           ///< never empty in a link that exists; at most 15 bytes
    std::uint16_t hardwareType = 0;             ///< ARPHRD_*
    std::uint32_t flags = 0;                    ///< IFF_*
    std::uint8_t operationalState = 0;          ///< IF_OPER_* of RFC 2863
    std::vector<std::uint8_t> address;          ///< the address in use; may be empty
    std::vector<std::uint8_t> permanentAddress; ///< the address burned in; empty when the kernel does not say
    std::string kind;                           ///< "veth", "bridge", ...; empty for hardware
    std::string parentName;                     ///< the device that carries it, by its name on its bus
    std::string parentBus;                      ///< "pci", "virtio", ...
    int activeMember = 0;  ///< of a bond: the member that carries it; 0 when none does, or all do
    int primaryMember = 0; ///< of a bond: the member that is to carry it where it can; 0 when none is named

    bool operator==(const Link&) const = default;
};

/** One address of an interface. */
struct Address {
    int index = 0;
    std::uint8_t prefixLength = 0; ///< at most 32 or 128
    std::uint8_t scope = 0;        ///< RT_SCOPE_*
    std::uint32_t flags = 0;       ///< IFA_F_*
    IpAddress local;               ///< the host's own
    IpAddress peer;                ///< the other end of a point-to-point address, else equal to `local`

    bool operator==(const Address&) const = default;
};

/** One way out of a route. */
struct NextHop {
    int index = 0;
    std::uint8_t flags = 0; ///< RTNH_F_*
    IpAddress gateway;      ///< of family 0 when the destination is on the link

    bool operator==(const NextHop&) const = default;
};

/** A default route: one whose destination is everything. */
struct Route {
    std::uint8_t family = 0;
    std::uint8_t type = 0;       ///< RTN_*
    std::uint8_t preference = 0; ///< ICMPV6_ROUTER_PREF_* of RFC 4191
    std::uint32_t table = 0;     ///< RT_TABLE_*
    std::uint32_t metric = 0;
    std::vector<NextHop> hops;
    IpAddress source{}; ///< the own address that it prefers; of family 0 when it prefers none

    bool operator==(const Route&) const = default;
};

/** What is known of a host on the link. */
struct Neighbour {
    int index = 0;
    std::uint16_t state = 0; ///< NUD_*
    IpAddress address;

    bool operator==(const Neighbour&) const = default;
};

/** Options of a team that were set, came or went; those that are not in it stay as they are. */
struct TeamOptions {
    int index = 0;                                         ///< the team; positive
    std::optional<int> activePort;                         ///< the port that carries it; 0: none does, or all do
    std::map<int, std::optional<std::int32_t>> priorities; ///< of ports, by index; none: it is no port any more

    bool operator==(const TeamOptions&) const = default;
};

/** An object that is there now, or one that is gone. */
template <typename Object>
struct Change {
    Object object;
    bool gone = false;

    bool operator==(const Change&) const = default;
};

/**
 * One message; nothing when it is of another kind, malformed, or says nothing that counts here, as a route to
 * anywhere in particular.
 */
using Message =
    std::variant<std::monostate, Change<Link>, Change<Address>, Change<Route>, Change<Neighbour>, TeamOptions>;

/**
 * Reads one message of `message.nlmsg_len` bytes, all of which must be readable and aligned to four. Believes nothing
 * in it: attributes that do not fit are left out, and without those that identify the object there is no message.
 */
Message parseMessage(const nlmsghdr& message);

} // namespace Orv::Agent::Linux
