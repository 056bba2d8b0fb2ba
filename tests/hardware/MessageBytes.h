/**
 * @file
 * Netlink payloads put together byte by byte, as the kernel lays them out.
 */
#pragma once

#include "agent/hardware/Attributes.h"

#include <cstdint>
#include <string>
#include <vector>

#include <linux/netlink.h>

namespace Orv::Test {

class MessageBytes {
  public:
    MessageBytes() = default;

    /** A payload that begins with this structure. */
    template <class Header>
    explicit MessageBytes(const Header& header) {
        append(&header, sizeof header);
    }

    MessageBytes& attribute(unsigned type, const void* payload, std::size_t size) {
        const nlattr head{static_cast<std::uint16_t>(sizeof head + size), static_cast<std::uint16_t>(type)};
        append(&head, sizeof head);
        append(payload, size);
        _bytes.resize(NLA_ALIGN(_bytes.size()));
        return *this;
    }

    template <class Number>
    MessageBytes& number(unsigned type, Number value) {
        return attribute(type, &value, sizeof value);
    }

    /** With its terminating zero. */
    MessageBytes& text(unsigned type, const std::string& value) {
        return attribute(type, value.c_str(), value.size() + 1);
    }

    MessageBytes& nest(unsigned type, const MessageBytes& inner) {
        return attribute(type | NLA_F_NESTED, inner._bytes.data(), inner._bytes.size());
    }

    [[nodiscard]] Agent::Hardware::Bytes bytes() const { return _bytes; }

  private:
    void append(const void* data, std::size_t size) {
        const auto* from = static_cast<const std::byte*>(data);
        _bytes.insert(_bytes.end(), from, from + size);
    }

    std::vector<std::byte> _bytes;
};

} // namespace Orv::Test
