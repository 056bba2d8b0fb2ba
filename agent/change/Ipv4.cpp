#include "agent/change/Ipv4.h"

#include <bit>
#include <charconv>
#include <system_error>

namespace Orv::Agent {

namespace {

constexpr unsigned octets = 4;
constexpr std::uint32_t allOnes = ~std::uint32_t{0};

bool isDigit(char character) {
    return character >= '0' && character <= '9';
}

/** Takes one number from 0 to 255 without leading zeros off the front. */
std::optional<std::uint32_t> takeOctet(std::string_view& text) {
    if (text.empty() || !isDigit(text.front())) {
        return std::nullopt;
    }
    std::uint32_t octet = 0;
    const auto [rest, error] = std::from_chars(text.data(), text.data() + text.size(), octet);
    const auto digits = static_cast<std::size_t>(rest - text.data());
    if (error != std::errc() || octet > 255 || (text.front() == '0' && digits > 1)) {
        return std::nullopt;
    }
    text.remove_prefix(digits);
    return octet;
}

} // namespace

std::optional<Ipv4Address> Ipv4Address::parse(std::string_view text) {
    Ipv4Address address;
    for (unsigned count = 0; count < octets; ++count) {
        if (count > 0) {
            if (!text.starts_with('.')) {
                return std::nullopt;
            }
            text.remove_prefix(1);
        }
        const auto octet = takeOctet(text);
        if (!octet) {
            return std::nullopt;
        }
        address.number = address.number << 8U | *octet;
    }
    return text.empty() ? std::optional(address) : std::nullopt;
}

std::string Ipv4Address::text() const {
    std::string text;
    for (unsigned shift = 32; shift > 0; shift -= 8) {
        text += (text.empty() ? "" : ".") + std::to_string(number >> (shift - 8) & 0xFFU);
    }
    return text;
}

bool Ipv4Prefixed::covers(Ipv4Address other) const {
    return ((address.number ^ other.number) & maskOf(prefixLength).number) == 0;
}

Ipv4Address Ipv4Prefixed::broadcast() const {
    return {address.number | ~maskOf(prefixLength).number};
}

std::string Ipv4Prefixed::text() const {
    return address.text() + "/" + std::to_string(prefixLength);
}

Ipv4Address maskOf(std::uint8_t prefixLength) {
    return {prefixLength == 0 ? 0 : allOnes << (32U - prefixLength)};
}

std::optional<std::uint8_t> prefixLengthOf(Ipv4Address mask) {
    const auto ones = static_cast<std::uint8_t>(std::countl_one(mask.number));
    return maskOf(ones) == mask ? std::optional(ones) : std::nullopt;
}

std::uint8_t classPrefixLength(Ipv4Address address) {
    const int ones = std::countl_one(address.number);
    return ones == 0 ? 8 : ones == 1 ? 16 : 24;
}

} // namespace Orv::Agent
