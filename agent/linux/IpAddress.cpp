#include "agent/linux/IpAddress.h"

#include <algorithm>

#include <arpa/inet.h>

namespace Orv::Agent::Linux {

std::size_t addressLength(std::uint8_t family) {
    return family == AF_INET ? sizeof(in_addr) : family == AF_INET6 ? sizeof(in6_addr) : 0;
}

IpAddress IpAddress::fromBytes(std::uint8_t family, std::span<const std::uint8_t> bytes) {
    IpAddress address;
    if (bytes.empty() || bytes.size() != addressLength(family)) {
        return address;
    }
    address.family = family;
    std::copy(bytes.begin(), bytes.end(), address.bytes.begin());
    return address;
}

std::string IpAddress::text() const {
    std::array<char, INET6_ADDRSTRLEN> buffer{};
    if (!any() || inet_ntop(family, bytes.data(), buffer.data(), buffer.size()) == nullptr) {
        return {};
    }
    return buffer.data();
}

std::string maskText(std::uint8_t prefixLength) {
    const std::uint32_t mask =
        prefixLength == 0 ? 0 : ~std::uint32_t{0} << (32U - std::min<unsigned>(prefixLength, 32));
    IpAddress address{AF_INET, {}};
    for (unsigned byte = 0; byte < sizeof mask; ++byte) {
        address.bytes[byte] = static_cast<std::uint8_t>(mask >> (24U - 8U * byte));
    }
    return address.text();
}

} // namespace Orv::Agent::Linux
