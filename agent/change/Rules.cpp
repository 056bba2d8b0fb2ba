#include "agent/change/Rules.h"

namespace Orv::Agent {

std::string whyNotHostAddress(Ipv4Address address) {
    const std::uint32_t first = address.number >> 24U;
    if (first == 0) {
        return address.text() + " is of network 0, which is no network of hosts";
    }
    if (first == 127) {
        return address.text() + " is a loopback address";
    }
    if (first >= 224 && first < 240) {
        return address.text() + " is a multicast address";
    }
    return first >= 240 ? address.text() + " is of class E, which is reserved" : "";
}

std::string whyNotInterfaceAddress(Ipv4Prefixed address) {
    if (std::string reason = whyNotHostAddress(address.address); !reason.empty()) {
        return reason;
    }
    const std::uint32_t hostBits = ~maskOf(address.prefixLength).number;
    const std::uint32_t host = address.address.number & hostBits;
    if (address.prefixLength >= 31 || (host != 0 && host != hostBits)) {
        return {};
    }
    return address.text() + (host == 0 ? " is the network's own address: its host part is all zeros"
                                       : " is the network's broadcast address: its host part is all ones");
}

std::string whyNotPrefixLength(std::uint8_t prefixLength) {
    return prefixLength >= 1 && prefixLength <= 32 ? "" : "a mask has at least one bit";
}

std::string whyNotGateway(Ipv4Address gateway, const std::optional<Ipv4Prefixed>& address) {
    if (std::string reason = whyNotHostAddress(gateway); !reason.empty()) {
        return reason;
    }
    if (!address) {
        return "the interface has no IPv4 address to reach a gateway with";
    }
    if (address->address == gateway) {
        return gateway.text() + " is the interface's own address";
    }
    if (!address->covers(gateway)) {
        return gateway.text() + " is not reached on the link with the address in force, " + address->text();
    }
    return whyNotInterfaceAddress({gateway, address->prefixLength});
}

} // namespace Orv::Agent
