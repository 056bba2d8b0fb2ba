#include "agent/linux/Selection.h"

#include <algorithm>
#include <string_view>
#include <tuple>

#include <linux/if.h>
#include <linux/if_addr.h>
#include <linux/if_arp.h>
#include <linux/rtnetlink.h>
#include <sys/socket.h>

namespace Orv::Agent::Linux {

namespace {

/** The element of a family with the least rank, the first of several; null when there is none. */
template <typename Rank>
const Address* best(const KernelState::Addresses& addresses, std::uint8_t family, Rank rank) {
    const Address* found = nullptr;
    for (const Address& address : addresses) {
        if (address.local.family == family && (found == nullptr || rank(address) < rank(*found))) {
            found = &address;
        }
    }
    return found;
}

/** RFC 4191: 1 high, 0 medium, 3 low; everything else counts as medium. The best is the least here. */
int preferenceRank(std::uint8_t preference) {
    constexpr std::uint8_t high = 1;
    constexpr std::uint8_t low = 3;
    return preference == high ? 0 : preference == low ? 2 : 1;
}

const DefaultRoute* bestRoute(const KernelState& state, int index, std::uint8_t family) {
    const auto rank = [&](const DefaultRoute& route) {
        return std::tuple(route.metric, (route.hopFlags & RTNH_F_DEAD) != 0,
                          state.isUnreachable({index, route.gateway}), preferenceRank(route.preference));
    };
    const DefaultRoute* found = nullptr;
    for (const DefaultRoute& route : state.routesOf(index)) {
        if (route.family == family && (found == nullptr || rank(route) < rank(*found))) {
            found = &route;
        }
    }
    return found;
}

} // namespace

AdapterStatus statusOf(const Link& link) {
    if ((link.flags & IFF_UP) == 0) {
        return AdapterStatus::stopped;
    }
    // Drivers without operational states, tunnels above all, stay at "unknown" and tell by their carrier alone.
    const bool carrier = (link.flags & (IFF_LOWER_UP | IFF_RUNNING)) != 0;
    const bool running = link.operationalState == IF_OPER_UP || (link.operationalState == IF_OPER_UNKNOWN && carrier);
    return running ? AdapterStatus::running : AdapterStatus::lostCommunication;
}

bool isLoopback(const Link& link) {
    return link.hardwareType == ARPHRD_LOOPBACK;
}

const Address* reportedIpv4(const KernelState::Addresses& addresses) {
    return best(addresses, AF_INET, [](const Address& address) {
        return std::tuple((address.flags & IFA_F_SECONDARY) != 0, address.scope);
    });
}

const Address* reportedIpv6(const KernelState::Addresses& addresses) {
    return best(addresses, AF_INET6, [](const Address& address) {
        const bool tentative = (address.flags & IFA_F_TENTATIVE) != 0 && (address.flags & IFA_F_OPTIMISTIC) == 0;
        return std::tuple(tentative || (address.flags & IFA_F_DADFAILED) != 0, address.scope,
                          (address.flags & IFA_F_DEPRECATED) != 0, (address.flags & IFA_F_TEMPORARY) != 0);
    });
}

std::optional<IpAddress> gatewayOf(const KernelState& state, int index) {
    for (const std::uint8_t family : addressFamilies) {
        const DefaultRoute* route = bestRoute(state, index, family);
        if (route != nullptr && route->gateway.any()) {
            return route->gateway;
        }
    }
    return std::nullopt;
}

std::optional<std::string> hardwareAddressText(std::span<const std::uint8_t> octets) {
    constexpr std::string_view digits = "0123456789abcdef";
    const bool known = octets.size() == 6 || octets.size() == 8 || octets.size() == 20;
    if (!known || std::all_of(octets.begin(), octets.end(), [](std::uint8_t octet) { return octet == 0; })) {
        return std::nullopt;
    }
    std::string text;
    for (const std::uint8_t octet : octets) {
        if (!text.empty()) {
            text += ':';
        }
        text += digits[octet >> 4U];
        text += digits[octet & 15U];
    }
    return text;
}

} // namespace Orv::Agent::Linux
