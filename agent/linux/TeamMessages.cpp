#include "agent/linux/TeamMessages.h"

#include <linux/genetlink.h>
#include <linux/if_team.h>

namespace Orv::Agent::Linux {

namespace {

using Hardware::Attributes;
using Hardware::Bytes;

/** The options' names, which the kernel has in no header. */
constexpr const char* activePortName = "activeport";
constexpr const char* priorityName = "priority";

void readPriority(const Attributes& option, TeamOptions& options) {
    const auto port = option.number<std::uint32_t>(TEAM_ATTR_OPTION_PORT_IFINDEX);
    const auto priority = option.number<std::int32_t>(TEAM_ATTR_OPTION_DATA);
    const bool isRemoved = option.find(TEAM_ATTR_OPTION_REMOVED).has_value();
    if (port && (priority || isRemoved)) {
        options.priorities[static_cast<int>(*port)] = isRemoved ? std::nullopt : priority;
    }
}

void readActivePort(const Attributes& option, TeamOptions& options) {
    const auto port = option.number<std::uint32_t>(TEAM_ATTR_OPTION_DATA);
    if (option.find(TEAM_ATTR_OPTION_REMOVED)) {
        options.activePort = 0; // the team has left the mode that has one
    } else if (port) {
        options.activePort = static_cast<int>(*port);
    }
}

} // namespace

Hardware::NetlinkRequest teamOptionsRequest(std::uint16_t family, int team) {
    Hardware::NetlinkRequest request(family, 0);
    auto& header = request.put<genlmsghdr>();
    header.cmd = TEAM_CMD_OPTIONS_GET;
    header.version = TEAM_GENL_VERSION;
    mnl_attr_put_u32(&request.message(), TEAM_ATTR_TEAM_IFINDEX, static_cast<std::uint32_t>(team));
    return request;
}

Message parseTeamMessage(Bytes payload) {
    const auto header = Hardware::leadingHeader<genlmsghdr>(payload);
    const auto attributes = Hardware::attributesBehind<genlmsghdr>(payload);
    const auto team = attributes.number<std::uint32_t>(TEAM_ATTR_TEAM_IFINDEX);
    if (!header || header->cmd != TEAM_CMD_OPTIONS_GET || !team) {
        return {};
    }
    TeamOptions options;
    options.index = static_cast<int>(*team);
    attributes.nested(TEAM_ATTR_LIST_OPTION).forEach([&](std::uint16_t type, Bytes inside) {
        const Attributes option(inside);
        const auto name = option.text(TEAM_ATTR_OPTION_NAME);
        if (type != TEAM_ATTR_ITEM_OPTION || !name) {
            return;
        }
        if (*name == activePortName) {
            readActivePort(option, options);
        } else if (*name == priorityName) {
            readPriority(option, options);
        }
    });
    if (options.index <= 0 || (!options.activePort && options.priorities.empty())) {
        return {};
    }
    return options;
}

} // namespace Orv::Agent::Linux
