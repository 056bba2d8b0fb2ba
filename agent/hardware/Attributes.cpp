#include "agent/hardware/Attributes.h"

#include <algorithm>

#include <linux/netlink.h>

namespace Orv::Agent::Hardware {

std::optional<Bytes> Attributes::find(std::uint16_t type) const {
    Bytes rest = _bytes;
    while (const auto attribute = leadingHeader<nlattr>(rest)) {
        if (attribute->nla_len < sizeof(nlattr) || attribute->nla_len > rest.size()) {
            break;
        }
        if ((attribute->nla_type & NLA_TYPE_MASK) == type) {
            return rest.subspan(sizeof(nlattr), attribute->nla_len - sizeof(nlattr));
        }
        const std::size_t step = NLA_ALIGN(std::size_t{attribute->nla_len});
        rest = rest.subspan(std::min(step, rest.size()));
    }
    return std::nullopt;
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
