/**
 * @file
 * rtnetlink messages made by hand, well-formed or not.
 */
#pragma once

#include "agent/linux/Messages.h"

#include <algorithm>
#include <cstdint>
#include <cstring>
#include <memory>
#include <string_view>
#include <vector>

#include <linux/netlink.h>

namespace Orv::Test {

using Octets = std::vector<std::uint8_t>;

/** Bytes of attributes, one behind the other, each padded to four. */
class Attributes {
  public:
    Attributes& add(std::uint16_t type, const Octets& payload) {
        const nlattr header{static_cast<std::uint16_t>(sizeof(nlattr) + payload.size()), type};
        append(&header, sizeof header);
        append(payload.data(), payload.size());
        _bytes.resize((_bytes.size() + 3) / 4 * 4);
        return *this;
    }

    /** A text with its terminating null. */
    Attributes& add(std::uint16_t type, std::string_view text) {
        Octets payload(text.begin(), text.end());
        payload.push_back(0);
        return add(type, payload);
    }

    Attributes& add(std::uint16_t type, std::uint32_t number) {
        Octets payload(sizeof number);
        std::memcpy(payload.data(), &number, sizeof number);
        return add(type, payload);
    }

    Attributes& add(std::uint16_t type, const Attributes& nested) { return add(type, nested.bytes()); }

    /** Bytes that are no attribute. */
    Attributes& addRaw(const Octets& bytes) {
        append(bytes.data(), bytes.size());
        return *this;
    }

    [[nodiscard]] const Octets& bytes() const { return _bytes; }

  private:
    void append(const void* data, std::size_t size) {
        const auto* begin = static_cast<const std::uint8_t*>(data);
        _bytes.insert(_bytes.end(), begin, begin + size);
    }

    Octets _bytes;
};

/** A message in memory of exactly its length, so that a sanitizer sees every read beyond it. */
class MessageBytes {
  public:
    template <typename Header>
    MessageBytes(std::uint16_t type, const Header& header, const Attributes& attributes = {}) {
        Octets payload(sizeof header);
        std::memcpy(payload.data(), &header, sizeof header);
        payload.resize((payload.size() + 3) / 4 * 4);
        payload.insert(payload.end(), attributes.bytes().begin(), attributes.bytes().end());
        assign(type, payload);
    }

    MessageBytes(std::uint16_t type, const Octets& payload) { assign(type, payload); }

    /** The same message cut to this many bytes, with a length that says so. */
    [[nodiscard]] MessageBytes cut(std::size_t length) const {
        Octets payload(bytes() + sizeof(nlmsghdr), bytes() + std::max(length, sizeof(nlmsghdr)));
        return MessageBytes(message().nlmsg_type, payload);
    }

    [[nodiscard]] std::size_t length() const { return message().nlmsg_len; }

    [[nodiscard]] Agent::Linux::Message parse() const { return Agent::Linux::parseMessage(message()); }

    [[nodiscard]] const nlmsghdr& message() const { return *reinterpret_cast<const nlmsghdr*>(_memory.get()); }

  private:
    void assign(std::uint16_t type, const Octets& payload) {
        const nlmsghdr header{static_cast<std::uint32_t>(sizeof(nlmsghdr) + payload.size()), type, 0, 0, 0};
        _memory = std::make_unique<std::uint8_t[]>(header.nlmsg_len);
        std::memcpy(_memory.get(), &header, sizeof header);
        if (!payload.empty()) {
            std::memcpy(_memory.get() + sizeof header, payload.data(), payload.size());
        }
    }

    [[nodiscard]] const std::uint8_t* bytes() const { return _memory.get(); }

    std::unique_ptr<std::uint8_t[]> _memory;
};

} // namespace Orv::Test
