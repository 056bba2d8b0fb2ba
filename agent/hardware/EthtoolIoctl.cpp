#include "agent/hardware/EthtoolIoctl.h"

#include <algorithm>
#include <array>
#include <cerrno>
#include <cstddef>
#include <cstring>
#include <system_error>

#include <linux/ethtool.h>
#include <linux/sockios.h>
#include <net/if.h>
#include <sys/ioctl.h>
#include <sys/socket.h>
#include <unistd.h>

namespace Orv::Agent::Hardware {

namespace {

/** Three bitmaps (supported, advertised, the peer's) of as many words as the kernel counts in a signed octet. */
constexpr std::size_t mostWords = 127;

struct LinkSettingsRequest {
    alignas(ethtool_link_settings) std::array<std::byte, sizeof(ethtool_link_settings)> head{};
    std::array<std::uint32_t, 3 * mostWords> bitmaps{};
};

static_assert(offsetof(LinkSettingsRequest, bitmaps) == offsetof(ethtool_link_settings, link_mode_masks));

constexpr std::size_t longestAddress = 32; ///< MAX_ADDR_LEN of the kernel

struct AddressRequest {
    std::uint32_t command = ETHTOOL_GPERMADDR;
    std::uint32_t size = longestAddress; ///< room on the way in, octets of the address on the way out
    std::array<std::uint8_t, longestAddress> address{};
};

ethtool_link_settings& headOf(LinkSettingsRequest& request) {
    return *static_cast<ethtool_link_settings*>(static_cast<void*>(request.head.data()));
}

} // namespace

LinkSettings settingsFrom(const ethtool_link_settings& settings, std::span<const std::uint32_t> supported) {
    LinkSettings result;
    result.speed = knownSpeed(settings.speed);
    result.fullDuplex = knownDuplex(settings.duplex);
    result.autonegotiation = settings.autoneg != AUTONEG_DISABLE;
    result.supported.assign(supported.begin(), supported.end());
    result.port = settings.port;
    return result;
}

EthtoolIoctl::EthtoolIoctl() : _socket(socket(AF_INET, SOCK_DGRAM | SOCK_CLOEXEC, 0)) {
    if (_socket < 0) {
        throw std::system_error(errno, std::generic_category(), "socket for ethtool");
    }
}

EthtoolIoctl::~EthtoolIoctl() {
    close(_socket);
}

std::optional<LinkSettings> EthtoolIoctl::linkSettings(const std::string& interface) const {
    LinkSettingsRequest request;
    auto& head = headOf(request);
    head.cmd = ETHTOOL_GLINKSETTINGS;
    // Asked with no words, the kernel answers with the number that it wants, negated.
    if (!this->request(interface, &request) || head.link_mode_masks_nwords >= 0) {
        return std::nullopt;
    }
    head.link_mode_masks_nwords = static_cast<std::int8_t>(-head.link_mode_masks_nwords);
    head.cmd = ETHTOOL_GLINKSETTINGS;
    if (!this->request(interface, &request) || head.link_mode_masks_nwords <= 0) {
        return std::nullopt;
    }
    const std::size_t words = static_cast<std::uint8_t>(head.link_mode_masks_nwords);
    return settingsFrom(head, std::span<const std::uint32_t>(request.bitmaps).first(words));
}

std::vector<std::uint8_t> EthtoolIoctl::permanentAddress(const std::string& interface) const {
    AddressRequest request;
    if (!this->request(interface, &request)) {
        return {};
    }
    const auto size = std::min<std::size_t>(request.size, longestAddress);
    std::vector<std::uint8_t> address(request.address.begin(), request.address.begin() + static_cast<long>(size));
    const bool none = std::all_of(address.begin(), address.end(), [](std::uint8_t octet) { return octet == 0; });
    return none ? std::vector<std::uint8_t>() : address;
}

bool EthtoolIoctl::request(const std::string& interface, void* command) const {
    ifreq question{};
    if (interface.size() >= sizeof question.ifr_name) {
        return false;
    }
    std::memcpy(question.ifr_name, interface.data(), interface.size());
    question.ifr_data = static_cast<char*>(command);
    return ioctl(_socket, SIOCETHTOOL, &question) == 0;
}

} // namespace Orv::Agent::Hardware
