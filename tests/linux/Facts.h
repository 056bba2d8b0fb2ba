/**
 * @file
 * Short ways to write down what a kernel may say.
 */
#pragma once

#include "agent/linux/Messages.h"

#include <functional>
#include <stdexcept>
#include <string>

#include <arpa/inet.h>
#include <linux/if.h>
#include <linux/if_addr.h>
#include <linux/if_arp.h>
#include <linux/rtnetlink.h>

namespace Orv::Test {

inline Agent::Linux::IpAddress ipAddress(const std::string& text) {
    Agent::Linux::IpAddress address;
    address.family = text.find(':') == std::string::npos ? AF_INET : AF_INET6;
    if (inet_pton(address.family, text.c_str(), address.bytes.data()) != 1) {
        throw std::invalid_argument(text);
    }
    return address;
}

inline Agent::Linux::Link link(int index, const std::string& name, unsigned flags = IFF_UP | IFF_LOWER_UP,
                               std::uint8_t operationalState = IF_OPER_UP) {
    Agent::Linux::Link link;
    link.index = index;
    link.name = name;
    link.hardwareType = ARPHRD_ETHER;
    link.flags = flags;
    link.operationalState = operationalState;
    return link;
}

/** From "ADDRESS/PREFIX". */
inline Agent::Linux::Address address(int index, const std::string& text, std::uint32_t flags = IFA_F_PERMANENT,
                                     std::uint8_t scope = RT_SCOPE_UNIVERSE) {
    const std::size_t slash = text.find('/');
    const Agent::Linux::IpAddress local = ipAddress(text.substr(0, slash));
    return {index, static_cast<std::uint8_t>(std::stoi(text.substr(slash + 1))), scope, flags, local, local};
}

/** A default route of the main table; without a gateway when it is empty. */
inline Agent::Linux::Route route(int index, const std::string& gateway, std::uint32_t metric,
                                 std::uint8_t family = AF_INET) {
    const Agent::Linux::IpAddress address = gateway.empty() ? Agent::Linux::IpAddress() : ipAddress(gateway);
    const std::uint8_t of = address.any() ? address.family : family;
    return {of, RTN_UNICAST, 0, RT_TABLE_MAIN, metric, {{index, 0, address}}};
}

} // namespace Orv::Test
