#include "agent/hardware/EthtoolIoctl.h"
#include "agent/hardware/EthtoolMessages.h"
#include "agent/hardware/GenericFamily.h"
#include "tests/hardware/MessageBytes.h"

#include <array>

#include <gtest/gtest.h>
#include <linux/ethtool_netlink.h>
#include <linux/genetlink.h>

namespace Orv::Agent::Hardware {
namespace {

using Test::MessageBytes;

constexpr std::uint8_t linkModesReply = ETHTOOL_MSG_LINKMODES_GET_REPLY;
constexpr std::uint8_t linkInfoReply = ETHTOOL_MSG_LINKINFO_GET_REPLY;

MessageBytes reply(std::uint8_t command, std::uint32_t index) {
    return MessageBytes(genlmsghdr{command, 1, 0})
        .nest(ETHTOOL_A_LINKMODES_HEADER,
              MessageBytes().number(ETHTOOL_A_HEADER_DEV_INDEX, index).text(ETHTOOL_A_HEADER_DEV_NAME, "eth0"));
}

MessageBytes bitSet(std::uint32_t advertised, std::array<std::uint32_t, 2> supported) {
    const std::array<std::uint32_t, 2> value{advertised, 0};
    return MessageBytes()
        .number(ETHTOOL_A_BITSET_SIZE, std::uint32_t{64})
        .attribute(ETHTOOL_A_BITSET_VALUE, value.data(), sizeof value)
        .attribute(ETHTOOL_A_BITSET_MASK, supported.data(), sizeof supported);
}

TEST(LinkModesReply, TellsSpeedDuplexNegotiationAndSupportedModes) {
    const auto message = reply(linkModesReply, 4)
                             .number(ETHTOOL_A_LINKMODES_AUTONEG, std::uint8_t{AUTONEG_ENABLE})
                             .nest(ETHTOOL_A_LINKMODES_OURS, bitSet(0x20, {0x2f, 0x1}))
                             .number(ETHTOOL_A_LINKMODES_SPEED, std::uint32_t{1000})
                             .number(ETHTOOL_A_LINKMODES_DUPLEX, std::uint8_t{DUPLEX_FULL});
    const InterfaceSettings expected{4, {1000, true, true, {0x2f, 0x1}, std::nullopt}};
    EXPECT_EQ(parseLinkModes(message.bytes()), expected);
}

TEST(LinkModesReply, LeavesOpenWhatTheDriverDoesNotKnow) {
    const auto message = reply(linkModesReply, 4)
                             .number(ETHTOOL_A_LINKMODES_SPEED, std::uint32_t{0xffffffff})
                             .number(ETHTOOL_A_LINKMODES_DUPLEX, std::uint8_t{DUPLEX_UNKNOWN});
    EXPECT_EQ(parseLinkModes(message.bytes()), (InterfaceSettings{4, {}}));
}

TEST(LinkModesReply, WithoutAnInterfaceIsNone) {
    EXPECT_FALSE(parseLinkModes(reply(linkModesReply, 0).bytes()));
    EXPECT_FALSE(parseLinkModes(MessageBytes(genlmsghdr{linkModesReply, 1, 0}).bytes()));
}

TEST(LinkModesReply, IsNotReadFromAnotherMessage) {
    EXPECT_FALSE(parseLinkModes(reply(linkInfoReply, 4).bytes()));
    EXPECT_FALSE(parseLinkInfo(reply(linkModesReply, 4).bytes()));
}

TEST(LinkModesReply, CutShortTellsWhatIsWhole) {
    const auto message = reply(linkModesReply, 4)
                             .number(ETHTOOL_A_LINKMODES_DUPLEX, std::uint8_t{DUPLEX_HALF})
                             .number(ETHTOOL_A_LINKMODES_SPEED, std::uint32_t{100});
    for (std::size_t size = 0; size < message.bytes().size(); ++size) {
        const std::vector<std::byte> cut(message.bytes().begin(),
                                         message.bytes().begin() + static_cast<std::ptrdiff_t>(size));
        const auto read = parseLinkModes(cut);
        EXPECT_FALSE(read && read->settings.speed) << size;
    }
    EXPECT_EQ(parseLinkModes(message.bytes().first(message.bytes().size() - 1))->settings.fullDuplex, false);
}

TEST(LinkModesReply, IgnoresTheRestOfAMaskThatIsNoWholeWord) {
    const std::array<std::uint8_t, 6> mask{1, 0, 0, 0, 9, 9};
    const auto message = reply(linkModesReply, 4)
                             .nest(ETHTOOL_A_LINKMODES_OURS,
                                   MessageBytes().attribute(ETHTOOL_A_BITSET_MASK, mask.data(), mask.size()));
    EXPECT_EQ(parseLinkModes(message.bytes())->settings.supported, std::vector<std::uint32_t>{1});
}

TEST(LinkInfoReply, TellsTheConnector) {
    const auto message = reply(linkInfoReply, 4).number(ETHTOOL_A_LINKINFO_PORT, std::uint8_t{PORT_FIBRE});
    const auto read = parseLinkInfo(message.bytes());
    ASSERT_TRUE(read);
    EXPECT_EQ(read->index, 4);
    EXPECT_EQ(read->settings.port, PORT_FIBRE);
}

TEST(FamilyReply, TellsTheMessageTypeAndTheGroups) {
    const auto group = [](const char* name, std::uint32_t number) {
        return MessageBytes().number(CTRL_ATTR_MCAST_GRP_ID, number).text(CTRL_ATTR_MCAST_GRP_NAME, name);
    };
    const auto message = MessageBytes(genlmsghdr{CTRL_CMD_NEWFAMILY, 2, 0})
                             .text(CTRL_ATTR_FAMILY_NAME, "family")
                             .number(CTRL_ATTR_FAMILY_ID, std::uint16_t{20})
                             .nest(CTRL_ATTR_MCAST_GROUPS, MessageBytes()
                                                               .nest(1, group("some", 7))
                                                               .nest(2, MessageBytes().text(1, "nameless"))
                                                               .nest(3, group("others", 8)));
    EXPECT_EQ(parseFamily(message.bytes()), (GenericFamily{20, {{"some", 7}, {"others", 8}}}));
}

TEST(FamilyReply, WithoutANumberIsNone) {
    EXPECT_FALSE(parseFamily(MessageBytes(genlmsghdr{CTRL_CMD_NEWFAMILY, 2, 0}).bytes()));
    EXPECT_FALSE(parseFamily(Bytes()));
}

TEST(LinkSettingsStructure, TellsTheSameAsTheMessages) {
    ethtool_link_settings head{};
    head.speed = 2500;
    head.duplex = DUPLEX_HALF;
    head.autoneg = AUTONEG_DISABLE;
    head.port = PORT_TP;
    const std::vector<std::uint32_t> supported{7, 9};
    EXPECT_EQ(settingsFrom(head, supported), (LinkSettings{2500, false, false, supported, PORT_TP}));
    head.speed = 0;
    head.duplex = DUPLEX_UNKNOWN;
    EXPECT_EQ(settingsFrom(head, supported), (LinkSettings{std::nullopt, std::nullopt, false, supported, PORT_TP}));
}

} // namespace
} // namespace Orv::Agent::Hardware
