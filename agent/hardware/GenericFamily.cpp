#include "agent/hardware/GenericFamily.h"

#include <linux/genetlink.h>

namespace Orv::Agent::Hardware {

NetlinkRequest familyRequest(const char* name) {
    NetlinkRequest request(GENL_ID_CTRL, 0);
    auto& header = request.put<genlmsghdr>();
    header.cmd = CTRL_CMD_GETFAMILY;
    header.version = 1;
    mnl_attr_put_strz(&request.message(), CTRL_ATTR_FAMILY_NAME, name);
    return request;
}

std::optional<GenericFamily> parseFamily(Bytes payload) {
    const auto attributes = attributesBehind<genlmsghdr>(payload);
    const auto type = attributes.number<std::uint16_t>(CTRL_ATTR_FAMILY_ID);
    if (!type) {
        return std::nullopt;
    }
    GenericFamily family{*type, {}};
    attributes.nested(CTRL_ATTR_MCAST_GROUPS).forEach([&](std::uint16_t /*place*/, Bytes inside) {
        const Attributes group(inside);
        const auto name = group.text(CTRL_ATTR_MCAST_GRP_NAME);
        const auto number = group.number<std::uint32_t>(CTRL_ATTR_MCAST_GRP_ID);
        if (name && number) {
            family.groups[*name] = static_cast<int>(*number);
        }
    });
    return family;
}

} // namespace Orv::Agent::Hardware
