#include "agent/linux/TeamMessages.h"
#include "tests/hardware/MessageBytes.h"

#include <cstring>
#include <random>
#include <vector>

#include <gtest/gtest.h>
#include <linux/genetlink.h>
#include <linux/if_team.h>

namespace Orv::Agent::Linux {
namespace {

using Test::MessageBytes;

/** An option of the team, or of one of its ports. */
MessageBytes option(const char* name, std::uint32_t value) {
    return MessageBytes().text(TEAM_ATTR_OPTION_NAME, name).number(TEAM_ATTR_OPTION_DATA, value);
}

MessageBytes portOption(const char* name, std::uint32_t port, std::int32_t value) {
    return MessageBytes()
        .text(TEAM_ATTR_OPTION_NAME, name)
        .attribute(TEAM_ATTR_OPTION_CHANGED, nullptr, 0)
        .number(TEAM_ATTR_OPTION_PORT_IFINDEX, port)
        .number(TEAM_ATTR_OPTION_DATA, value);
}

MessageBytes removed(MessageBytes option) {
    return option.attribute(TEAM_ATTR_OPTION_REMOVED, nullptr, 0);
}

MessageBytes payload(std::uint32_t team, const std::vector<MessageBytes>& options,
                     std::uint8_t command = TEAM_CMD_OPTIONS_GET) {
    MessageBytes list;
    for (const MessageBytes& each : options) {
        list.nest(TEAM_ATTR_ITEM_OPTION, each);
    }
    return MessageBytes(genlmsghdr{command, TEAM_GENL_VERSION, 0})
        .number(TEAM_ATTR_TEAM_IFINDEX, team)
        .nest(TEAM_ATTR_LIST_OPTION, list);
}

Message parsed(const MessageBytes& message) {
    return parseTeamMessage(message.bytes());
}

bool saysNothing(const Message& message) {
    return std::holds_alternative<std::monostate>(message);
}

TEST(TeamMessage, givesTheActivePort) {
    EXPECT_EQ(parsed(payload(4, {option("mcast_rejoin_count", 1), option("activeport", 3)})),
              Message((TeamOptions{4, 3, {}})));
    EXPECT_EQ(parsed(payload(4, {option("activeport", 0)})), Message((TeamOptions{4, 0, {}})));
}

TEST(TeamMessage, givesThePrioritiesOfPorts) {
    EXPECT_EQ(parsed(payload(
                  4, {portOption("priority", 2, 100), portOption("queue_id", 2, 7), portOption("priority", 3, -5)})),
              Message((TeamOptions{4, std::nullopt, {{2, std::int32_t{100}}, {3, std::int32_t{-5}}}})));
}

TEST(TeamMessage, tellsOfOptionsThatAreGone) {
    EXPECT_EQ(parsed(payload(4, {removed(option("activeport", 3)), removed(portOption("priority", 3, 10))})),
              Message((TeamOptions{4, 0, {{3, std::nullopt}}})));
}

TEST(TeamMessage, saysNothingOfOtherOptionsAndOtherCommands) {
    EXPECT_TRUE(saysNothing(parsed(payload(4, {option("mode", 1), portOption("enabled", 2, 1)}))));
    EXPECT_TRUE(saysNothing(parsed(payload(4, {}))));
    EXPECT_TRUE(saysNothing(parsed(payload(4, {option("activeport", 3)}, TEAM_CMD_PORT_LIST_GET))));
}

TEST(TeamMessage, withoutATeamSaysNothing) {
    EXPECT_TRUE(saysNothing(parsed(payload(0, {option("activeport", 3)}))));
    EXPECT_TRUE(saysNothing(parsed(payload(0x80000000U, {option("activeport", 3)}))));
    EXPECT_TRUE(saysNothing(parsed(
        MessageBytes(genlmsghdr{TEAM_CMD_OPTIONS_GET, 1, 0})
            .nest(TEAM_ATTR_LIST_OPTION, MessageBytes().nest(TEAM_ATTR_ITEM_OPTION, option("activeport", 3))))));
    EXPECT_TRUE(saysNothing(parseTeamMessage({})));
}

TEST(TeamMessage, leavesOutWhatIsNotWhole) {
    const MessageBytes shortNumber =
        MessageBytes().text(TEAM_ATTR_OPTION_NAME, "activeport").number(TEAM_ATTR_OPTION_DATA, std::uint16_t{3});
    EXPECT_TRUE(saysNothing(parsed(payload(4, {shortNumber}))));
    EXPECT_TRUE(saysNothing(parsed(payload(4, {option("priority", 3)})))) << "of which port";
    const MessageBytes nameless = MessageBytes().number(TEAM_ATTR_OPTION_DATA, std::uint32_t{3});
    EXPECT_EQ(parsed(payload(4, {nameless, option("activeport", 3)})), Message((TeamOptions{4, 3, {}})));
}

/** A copy of exactly the bytes' size, so that a sanitizer sees every read beyond it. */
Message parsedAlone(const std::vector<std::byte>& bytes) {
    return parseTeamMessage(std::vector<std::byte>(bytes));
}

TEST(TeamMessage, thatIsCutOrChangedAnywhereIsReadWithinItsBounds) {
    const MessageBytes message = payload(4, {option("activeport", 3), portOption("priority", 2, 100)});
    const std::vector<std::byte> whole(message.bytes().begin(), message.bytes().end());
    for (std::size_t size = 0; size < whole.size(); ++size) {
        const auto end = whole.begin() + static_cast<std::ptrdiff_t>(size);
        (void)parsedAlone(std::vector<std::byte>(whole.begin(), end));
    }
    std::mt19937 random(4711);
    for (int round = 0; round < 100'000; ++round) {
        std::vector<std::byte> changed = whole;
        for (int change = 0; change < 3; ++change) {
            changed[random() % changed.size()] = static_cast<std::byte>(random() % 2 == 0 ? random() % 24 : random());
        }
        (void)parsedAlone(changed);
    }
}

TEST(TeamMessage, isAskedForByTheTeamsIndex) {
    auto request = teamOptionsRequest(32, 4);
    const nlmsghdr& message = request.message();
    EXPECT_EQ(message.nlmsg_type, 32);
    const auto* begin = reinterpret_cast<const std::byte*>(&message);
    const Hardware::Bytes inside(begin + sizeof(nlmsghdr), message.nlmsg_len - sizeof(nlmsghdr));
    EXPECT_EQ(Hardware::leadingHeader<genlmsghdr>(inside)->cmd, TEAM_CMD_OPTIONS_GET);
    EXPECT_EQ(Hardware::attributesBehind<genlmsghdr>(inside).number<std::uint32_t>(TEAM_ATTR_TEAM_IFINDEX), 4U);
}

} // namespace
} // namespace Orv::Agent::Linux
