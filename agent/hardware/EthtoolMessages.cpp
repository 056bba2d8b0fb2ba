#include "agent/hardware/EthtoolMessages.h"

#include <linux/ethtool_netlink.h>
#include <linux/genetlink.h>

namespace Orv::Agent::Hardware {

namespace {

NetlinkRequest dumpRequest(std::uint16_t family, std::uint8_t command, std::uint16_t headerAttribute) {
    NetlinkRequest request(family, NLM_F_DUMP);
    auto& header = request.put<genlmsghdr>();
    header.cmd = command;
    header.version = ETHTOOL_GENL_VERSION;
    nlattr* nest = mnl_attr_nest_start(&request.message(), headerAttribute);
    mnl_attr_put_u32(&request.message(), ETHTOOL_A_HEADER_FLAGS, ETHTOOL_FLAG_COMPACT_BITSETS);
    mnl_attr_nest_end(&request.message(), nest);
    return request;
}

/** The attributes of a message of this command, and the interface that its header names. */
struct Reply {
    Attributes attributes;
    int index;
};

std::optional<Reply> parseReply(Bytes payload, std::uint8_t command, std::uint16_t headerAttribute) {
    const auto header = leadingHeader<genlmsghdr>(payload);
    if (!header || header->cmd != command) {
        return std::nullopt;
    }
    const auto attributes = attributesBehind<genlmsghdr>(payload);
    const auto index = attributes.nested(headerAttribute).number<std::uint32_t>(ETHTOOL_A_HEADER_DEV_INDEX);
    if (!index || *index == 0) {
        return std::nullopt;
    }
    return Reply{attributes, static_cast<int>(*index)};
}

/** The mask of a compact bit set; of "our" link modes it is what the port supports, the value what it advertises. */
std::vector<std::uint32_t> bitSetMask(const Attributes& bitSet) {
    const auto mask = bitSet.find(ETHTOOL_A_BITSET_MASK).value_or(Bytes());
    std::vector<std::uint32_t> words(mask.size() / sizeof(std::uint32_t));
    if (!words.empty()) {
        std::memcpy(words.data(), mask.data(), words.size() * sizeof(std::uint32_t));
    }
    return words;
}

} // namespace

NetlinkRequest linkModesRequest(std::uint16_t family) {
    return dumpRequest(family, ETHTOOL_MSG_LINKMODES_GET, ETHTOOL_A_LINKMODES_HEADER);
}

std::optional<InterfaceSettings> parseLinkModes(Bytes payload) {
    const auto reply = parseReply(payload, ETHTOOL_MSG_LINKMODES_GET_REPLY, ETHTOOL_A_LINKMODES_HEADER);
    if (!reply) {
        return std::nullopt;
    }
    InterfaceSettings result;
    result.index = reply->index;
    if (const auto speed = reply->attributes.number<std::uint32_t>(ETHTOOL_A_LINKMODES_SPEED)) {
        result.settings.speed = knownSpeed(*speed);
    }
    if (const auto duplex = reply->attributes.number<std::uint8_t>(ETHTOOL_A_LINKMODES_DUPLEX)) {
        result.settings.fullDuplex = knownDuplex(*duplex);
    }
    if (const auto on = reply->attributes.number<std::uint8_t>(ETHTOOL_A_LINKMODES_AUTONEG)) {
        result.settings.autonegotiation = *on != AUTONEG_DISABLE;
    }
    result.settings.supported = bitSetMask(reply->attributes.nested(ETHTOOL_A_LINKMODES_OURS));
    return result;
}

NetlinkRequest linkInfoRequest(std::uint16_t family) {
    return dumpRequest(family, ETHTOOL_MSG_LINKINFO_GET, ETHTOOL_A_LINKINFO_HEADER);
}

std::optional<InterfaceSettings> parseLinkInfo(Bytes payload) {
    const auto reply = parseReply(payload, ETHTOOL_MSG_LINKINFO_GET_REPLY, ETHTOOL_A_LINKINFO_HEADER);
    if (!reply) {
        return std::nullopt;
    }
    InterfaceSettings result;
    result.index = reply->index;
    result.settings.port = reply->attributes.number<std::uint8_t>(ETHTOOL_A_LINKINFO_PORT);
    return result;
}

} // namespace Orv::Agent::Hardware
