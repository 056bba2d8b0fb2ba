/**
 * @file
 * Netlink attributes (struct nlattr) of a message or of a nest, as bytes: no socket is needed to read them.
 */
#pragma once

#include <cstddef>
#include <cstdint>
#include <cstring>
#include <functional>
#include <optional>
#include <span>
#include <string>
#include <type_traits>

namespace Orv::Agent::Hardware {

using Bytes = std::span<const std::byte>;

/**
 * A view of a row of attributes; the bytes must outlive it. The row ends at the first attribute that does not fit
 * into the bytes: what a truncated message still holds in front of the cut can be read.
 */
class Attributes {
  public:
    explicit Attributes(Bytes bytes) : _bytes(bytes) {}

    /** The payload of the first attribute of a type; flags of the type (nested, byte order) do not count. */
    [[nodiscard]] std::optional<Bytes> find(std::uint16_t type) const;

    /** A number in host byte order; none when the attribute is missing or of another size. */
    template <class Number>
    [[nodiscard]] std::optional<Number> number(std::uint16_t type) const {
        static_assert(std::is_integral_v<Number>);
        const auto payload = find(type);
        if (!payload || payload->size() != sizeof(Number)) {
            return std::nullopt;
        }
        Number value;
        std::memcpy(&value, payload->data(), sizeof value);
        return value;
    }

    /** A text up to its terminating zero, or whole when it has none; bytes as they are. */
    [[nodiscard]] std::optional<std::string> text(std::uint16_t type) const;

    /** The attributes inside a nest; an empty row when there is none. */
    [[nodiscard]] Attributes nested(std::uint16_t type) const;

    /** Gives every attribute's type, without its flags, and payload, in their order. */
    void forEach(const std::function<void(std::uint16_t type, Bytes payload)>& visit) const;

  private:
    struct Attribute;

    static std::optional<Attribute> takeFirst(Bytes& row);

    Bytes _bytes;
};

/** The structure at the start of a payload; none when the payload is shorter. */
template <class Header>
std::optional<Header> leadingHeader(Bytes payload) {
    static_assert(std::is_trivially_copyable_v<Header>);
    if (payload.size() < sizeof(Header)) {
        return std::nullopt;
    }
    Header header;
    std::memcpy(&header, payload.data(), sizeof header);
    return header;
}

/** The attributes behind the structure at the start of a payload (NLMSG_ALIGN has no gap to fill for any of ours). */
template <class Header>
Attributes attributesBehind(Bytes payload) {
    static_assert(sizeof(Header) % 4 == 0);
    return Attributes(payload.size() < sizeof(Header) ? Bytes() : payload.subspan(sizeof(Header)));
}

} // namespace Orv::Agent::Hardware
