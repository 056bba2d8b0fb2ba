#include "agent/hardware/Links.h"

#include <algorithm>
#include <cerrno>
#include <system_error>

#include <linux/if_link.h>
#include <linux/rtnetlink.h>

namespace Orv::Agent::Hardware {

namespace {

constexpr std::size_t longestName = 15; ///< IFNAMSIZ less the terminating zero

/** Statistics make up most of a link message and are not wanted. */
void omitStatistics(NetlinkRequest& request) {
    mnl_attr_put_u32(&request.message(), IFLA_EXT_MASK, RTEXT_FILTER_SKIP_STATS);
}

std::optional<DeviceName> parseDevice(const Attributes& attributes) {
    auto bus = attributes.text(IFLA_PARENT_DEV_BUS_NAME);
    auto name = attributes.text(IFLA_PARENT_DEV_NAME);
    if (!bus || !name) {
        return std::nullopt;
    }
    return DeviceName{std::move(*bus), std::move(*name)};
}

std::vector<std::uint8_t> octets(Bytes bytes) {
    std::vector<std::uint8_t> result(bytes.size());
    std::transform(bytes.begin(), bytes.end(), result.begin(), std::to_integer<std::uint8_t>);
    return result;
}

} // namespace

std::optional<Link> parseLink(Bytes payload) {
    const auto header = leadingHeader<ifinfomsg>(payload);
    if (!header) {
        return std::nullopt;
    }
    const auto attributes = attributesBehind<ifinfomsg>(payload);
    auto name = attributes.text(IFLA_IFNAME);
    if (!name || header->ifi_index <= 0) {
        return std::nullopt;
    }
    Link link;
    link.index = header->ifi_index;
    link.name = std::move(*name);
    link.flags = header->ifi_flags;
    link.hardwareType = header->ifi_type;
    link.kind = attributes.nested(IFLA_LINKINFO).text(IFLA_INFO_KIND).value_or("");
    link.alias = attributes.text(IFLA_IFALIAS).value_or("");
    link.permanentAddress = octets(attributes.find(IFLA_PERM_ADDRESS).value_or(Bytes()));
    link.device = parseDevice(attributes);
    return link;
}

std::vector<Link> readLinks(NetlinkSocket& socket) {
    NetlinkRequest request(RTM_GETLINK, NLM_F_DUMP);
    request.put<ifinfomsg>();
    omitStatistics(request);
    auto links = dump(socket, request, parseLink);
    std::sort(links.begin(), links.end(), [](const Link& a, const Link& b) { return a.index < b.index; });
    return links;
}

std::optional<Link> readLink(NetlinkSocket& socket, const std::string& name) {
    if (name.empty() || name.size() > longestName) {
        return std::nullopt;
    }
    NetlinkRequest request(RTM_GETLINK, 0);
    request.put<ifinfomsg>();
    mnl_attr_put_strz(&request.message(), IFLA_IFNAME, name.c_str());
    omitStatistics(request);
    std::optional<Link> link;
    try {
        socket.ask(request, [&](Bytes payload) { link = parseLink(payload); });
    } catch (const std::system_error& error) {
        if (error.code() != std::errc::no_such_device) {
            throw;
        }
    }
    return link;
}

} // namespace Orv::Agent::Hardware
