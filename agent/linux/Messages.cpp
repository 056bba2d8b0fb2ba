#include "agent/linux/Messages.h"

#include <algorithm>
#include <cstring>
#include <optional>
#include <span>
#include <string_view>

#include <libmnl/libmnl.h>
#include <linux/neighbour.h>
#include <linux/rtnetlink.h>
#include <net/if.h>

namespace Orv::Agent::Linux {

namespace {

using Bytes = std::span<const std::uint8_t>;

Bytes bytesOf(const nlattr& attribute) {
    return {static_cast<const std::uint8_t*>(mnl_attr_get_payload(&attribute)), mnl_attr_get_payload_len(&attribute)};
}

/** Longest hardware address that the kernel knows (MAX_ADDR_LEN). */
constexpr std::size_t longestHardwareAddress = 32;

/** A number of the attribute's first bytes; nothing when it has fewer. */
template <typename Number>
std::optional<Number> numberOf(const nlattr& attribute) {
    const Bytes bytes = bytesOf(attribute);
    if (bytes.size() < sizeof(Number)) {
        return std::nullopt;
    }
    Number number{};
    std::memcpy(&number, bytes.data(), sizeof number);
    return number;
}

/** The text up to its terminating null, which a malformed attribute may lack. */
std::string textOf(const nlattr& attribute) {
    const Bytes bytes = bytesOf(attribute);
    return {bytes.begin(), std::find(bytes.begin(), bytes.end(), 0)};
}

std::vector<std::uint8_t> hardwareAddressOf(const nlattr& attribute) {
    const Bytes bytes = bytesOf(attribute);
    if (bytes.size() > longestHardwareAddress) {
        return {};
    }
    return {bytes.begin(), bytes.end()};
}

/** Calls `visit` with each attribute in the bytes and stops at the first that does not fit. */
template <typename Visitor>
void forEachAttribute(Bytes bytes, Visitor visit) {
    const auto* attribute = reinterpret_cast<const nlattr*>(bytes.data());
    while (mnl_attr_ok(attribute, static_cast<int>(bytes.size()))) {
        visit(*attribute);
        bytes = bytes.subspan(std::min<std::size_t>(MNL_ALIGN(attribute->nla_len), bytes.size()));
        attribute = reinterpret_cast<const nlattr*>(bytes.data());
    }
}

/** The fixed part of a message and the attributes behind it; null when the message is too short for it. */
template <typename Header>
const Header* headerOf(const nlmsghdr& message, Bytes& attributes) {
    const Bytes payload(static_cast<const std::uint8_t*>(mnl_nlmsg_get_payload(&message)),
                        message.nlmsg_len < MNL_NLMSG_HDRLEN ? 0 : mnl_nlmsg_get_payload_len(&message));
    if (payload.size() < sizeof(Header)) {
        return nullptr;
    }
    attributes = payload.subspan(std::min<std::size_t>(MNL_ALIGN(sizeof(Header)), payload.size()));
    return reinterpret_cast<const Header*>(payload.data());
}

void readBond(const nlattr& attribute, Link& link) {
    forEachAttribute(bytesOf(attribute), [&](const nlattr& inner) {
        if (mnl_attr_get_type(&inner) == IFLA_BOND_ACTIVE_SLAVE) {
            link.activeMember = numberOf<int>(inner).value_or(0);
        } else if (mnl_attr_get_type(&inner) == IFLA_BOND_PRIMARY) {
            link.primaryMember = numberOf<int>(inner).value_or(0);
        }
    });
}

/** IFLA_LINKINFO: the kind, and what is particular to it. */
void readLinkInfo(const nlattr& attribute, Link& link) {
    const nlattr* data = nullptr;
    forEachAttribute(bytesOf(attribute), [&](const nlattr& inner) {
        if (mnl_attr_get_type(&inner) == IFLA_INFO_KIND) {
            link.kind = textOf(inner);
        } else if (mnl_attr_get_type(&inner) == IFLA_INFO_DATA) {
            data = &inner;
        }
    });
    // The numbers of the attributes in it mean something else for every kind.
    if (data != nullptr && link.kind == "bond") {
        readBond(*data, link);
    }
}

void readLinkAttribute(const nlattr& attribute, Link& link) {
    switch (mnl_attr_get_type(&attribute)) {
    case IFLA_IFNAME:
        link.name = textOf(attribute);
        break;
    case IFLA_ADDRESS:
        link.address = hardwareAddressOf(attribute);
        break;
    case IFLA_PERM_ADDRESS:
        link.permanentAddress = hardwareAddressOf(attribute);
        break;
    case IFLA_OPERSTATE:
        link.operationalState = numberOf<std::uint8_t>(attribute).value_or(0);
        break;
    case IFLA_PARENT_DEV_NAME:
        link.parentName = textOf(attribute);
        break;
    case IFLA_PARENT_DEV_BUS_NAME:
        link.parentBus = textOf(attribute);
        break;
    case IFLA_LINKINFO:
        readLinkInfo(attribute, link);
        break;
    default:
        break;
    }
}

Message parseLink(const nlmsghdr& message) {
    Bytes attributes;
    const auto* header = headerOf<ifinfomsg>(message, attributes);
    // A bridge reports its ports as links of its own family: such a message speaks of the membership, and its removal
    // does not remove the link.
    if (header == nullptr || header->ifi_family != AF_UNSPEC || header->ifi_index <= 0) {
        return {};
    }
    Change<Link> change{{}, message.nlmsg_type == RTM_DELLINK};
    Link& link = change.object;
    link.index = header->ifi_index;
    link.hardwareType = header->ifi_type;
    link.flags = header->ifi_flags;
    bool partial = false;
    forEachAttribute(attributes, [&](const nlattr& attribute) {
        // Wireless drivers announce scan results in link messages that carry nothing else.
        partial = partial || mnl_attr_get_type(&attribute) == IFLA_WIRELESS;
        readLinkAttribute(attribute, link);
    });
    const bool named = !link.name.empty() && link.name.size() < IFNAMSIZ;
    if (!change.gone && (partial || !named)) {
        return {};
    }
    return change;
}

Message parseAddress(const nlmsghdr& message) {
    Bytes attributes;
    const auto* header = headerOf<ifaddrmsg>(message, attributes);
    if (header == nullptr || header->ifa_index == 0 || header->ifa_index > INT32_MAX ||
        header->ifa_prefixlen > 8 * addressLength(header->ifa_family)) {
        return {};
    }
    Change<Address> change{{}, message.nlmsg_type == RTM_DELADDR};
    Address& address = change.object;
    address.index = static_cast<int>(header->ifa_index);
    address.prefixLength = header->ifa_prefixlen;
    address.scope = header->ifa_scope;
    address.flags = header->ifa_flags;
    forEachAttribute(attributes, [&](const nlattr& attribute) {
        switch (mnl_attr_get_type(&attribute)) {
        case IFA_LOCAL:
            address.local = IpAddress::fromBytes(header->ifa_family, bytesOf(attribute));
            break;
        case IFA_ADDRESS:
            address.peer = IpAddress::fromBytes(header->ifa_family, bytesOf(attribute));
            break;
        case IFA_FLAGS:
            // All 32 bits of what the header has eight of.
            address.flags = numberOf<std::uint32_t>(attribute).value_or(address.flags);
            break;
        default:
            break;
        }
    });
    // IPv6 names the own address only when there is a peer.
    address.local = address.local.any() ? address.local : address.peer;
    address.peer = address.peer.any() ? address.peer : address.local;
    if (!address.local.any()) {
        return {};
    }
    return change;
}

/** RTA_VIA: a gateway of another family than the route's, as struct rtvia: the family in host order, the address. */
IpAddress viaOf(const nlattr& attribute) {
    const auto family = numberOf<std::uint16_t>(attribute).value_or(0);
    if (family != AF_INET && family != AF_INET6) {
        return {};
    }
    return IpAddress::fromBytes(static_cast<std::uint8_t>(family), bytesOf(attribute).subspan(sizeof family));
}

void readHopAttribute(const nlattr& attribute, std::uint8_t family, NextHop& hop) {
    switch (mnl_attr_get_type(&attribute)) {
    case RTA_GATEWAY:
        hop.gateway = IpAddress::fromBytes(family, bytesOf(attribute));
        break;
    case RTA_VIA:
        hop.gateway = viaOf(attribute);
        break;
    case RTA_OIF:
        hop.index = numberOf<int>(attribute).value_or(0);
        break;
    default:
        break;
    }
}

/** RTA_MULTIPATH: one struct rtnexthop after another, each with its own length and attributes. */
std::vector<NextHop> hopsOf(const nlattr& attribute, std::uint8_t family) {
    std::vector<NextHop> hops;
    Bytes rest = bytesOf(attribute);
    while (rest.size() >= sizeof(rtnexthop)) {
        rtnexthop header{};
        std::memcpy(&header, rest.data(), sizeof header);
        if (header.rtnh_len < sizeof header || header.rtnh_len > rest.size()) {
            break;
        }
        NextHop hop{header.rtnh_ifindex, header.rtnh_flags, {}};
        forEachAttribute(rest.first(header.rtnh_len).subspan(sizeof header),
                         [&](const nlattr& inner) { readHopAttribute(inner, family, hop); });
        hops.push_back(hop);
        rest = rest.subspan(std::min<std::size_t>(RTNH_ALIGN(header.rtnh_len), rest.size()));
    }
    return hops;
}

void readRouteAttribute(const nlattr& attribute, Route& route) {
    switch (mnl_attr_get_type(&attribute)) {
    case RTA_TABLE:
        route.table = numberOf<std::uint32_t>(attribute).value_or(route.table);
        break;
    case RTA_PRIORITY:
        route.metric = numberOf<std::uint32_t>(attribute).value_or(0);
        break;
    case RTA_PREFSRC:
        route.source = IpAddress::fromBytes(route.family, bytesOf(attribute));
        break;
    case RTA_PREF:
        route.preference = numberOf<std::uint8_t>(attribute).value_or(0);
        break;
    case RTA_MULTIPATH:
        route.hops = hopsOf(attribute, route.family);
        break;
    default:
        break;
    }
}

Message parseRoute(const nlmsghdr& message) {
    Bytes attributes;
    const auto* header = headerOf<rtmsg>(message, attributes);
    // A cloned route is an entry of the cache, not of a table.
    if (header == nullptr || header->rtm_dst_len != 0 || addressLength(header->rtm_family) == 0 ||
        (header->rtm_flags & RTM_F_CLONED) != 0) {
        return {};
    }
    Change<Route> change{{}, message.nlmsg_type == RTM_DELROUTE};
    Route& route = change.object;
    route.family = header->rtm_family;
    route.type = header->rtm_type;
    route.table = header->rtm_table;
    NextHop only{0, static_cast<std::uint8_t>(header->rtm_flags), {}};
    forEachAttribute(attributes, [&](const nlattr& attribute) {
        readRouteAttribute(attribute, route);
        readHopAttribute(attribute, route.family, only);
    });
    if (route.hops.empty() && only.index > 0) {
        route.hops.push_back(only);
    }
    return change;
}

Message parseNeighbour(const nlmsghdr& message) {
    Bytes attributes;
    const auto* header = headerOf<ndmsg>(message, attributes);
    if (header == nullptr || header->ndm_ifindex <= 0) {
        return {};
    }
    Change<Neighbour> change{{header->ndm_ifindex, header->ndm_state, {}}, message.nlmsg_type == RTM_DELNEIGH};
    forEachAttribute(attributes, [&](const nlattr& attribute) {
        if (mnl_attr_get_type(&attribute) == NDA_DST) {
            change.object.address = IpAddress::fromBytes(header->ndm_family, bytesOf(attribute));
        }
    });
    if (!change.object.address.any()) {
        return {};
    }
    return change;
}

} // namespace

Message parseMessage(const nlmsghdr& message) {
    switch (message.nlmsg_type) {
    case RTM_NEWLINK:
    case RTM_DELLINK:
        return parseLink(message);
    case RTM_NEWADDR:
    case RTM_DELADDR:
        return parseAddress(message);
    case RTM_NEWROUTE:
    case RTM_DELROUTE:
        return parseRoute(message);
    case RTM_NEWNEIGH:
    case RTM_DELNEIGH:
        return parseNeighbour(message);
    default:
        return {};
    }
}

} // namespace Orv::Agent::Linux
