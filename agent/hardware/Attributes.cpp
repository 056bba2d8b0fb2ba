#include "agent/hardware/Attributes.h"

#include <algorithm>

#include <linux/netlink.h>

namespace Orv::Agent::Hardware {

struct Attributes::Attribute {
    std::uint16_t type;
    Bytes payload;
};

/** Takes the first attribute off the row; none when what is left of it holds no whole one. */
std::optional<Attributes::Attribute> Attributes::takeFirst(Bytes& row) {
    const auto header = leadingHeader<nlattr>(row);
    if (!header || header->nla_len < sizeof(nlattr) || header->nla_len > row.size()) {
        return std::nullopt;
    }
    const Bytes payload = row.subspan(sizeof(nlattr), header->nla_len - sizeof(nlattr));
    const std::size_t step = NLA_ALIGN(std::size_t{header->nla_len});
    row = row.subspan(std::min(step, row.size()));
    return Attribute{static_cast<std::uint16_t>(header->nla_type & NLA_TYPE_MASK), payload};
}

std::optional<Bytes> Attributes::find(std::uint16_t type) const {
    Bytes rest = _bytes;
    while (const auto attribute = takeFirst(rest)) {
        if (attribute->type == type) {
            return attribute->payload;
        }
    }
    return std::nullopt;
}

void Attributes::forEach(const std::function<void(std::uint16_t type, Bytes payload)>& visit) const {
    Bytes rest = _bytes;
    while (const auto attribute = takeFirst(rest)) {
        visit(attribute->type, attribute->payload);
    }
}

std::optional<std::string> Attributes::text(std::uint16_t type) const {
    const auto payload = find(type);
    if (!payload) {
        return std::nullopt;
    }
    const auto end = std::find(payload->begin(), payload->end(), std::byte{0});
    std::string text(static_cast<std::size_t>(end - payload->begin()), '\0');
    std::memcpy(text.data(), payload->data(), text.size());
    return text;
}

Attributes Attributes::nested(std::uint16_t type) const {
    return Attributes(find(type).value_or(Bytes()));
}

} // namespace Orv::Agent::Hardware
