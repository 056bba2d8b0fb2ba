#include "agent/hardware/Links.h"
#include "tests/hardware/MessageBytes.h"

#include <gtest/gtest.h>
#include <linux/if_arp.h>
#include <linux/rtnetlink.h>

namespace Orv::Agent::Hardware {
namespace {

using Test::MessageBytes;

MessageBytes linkMessage(int index) {
    ifinfomsg header{};
    header.ifi_type = ARPHRD_ETHER;
    header.ifi_index = index;
    header.ifi_flags = IFF_UP | IFF_RUNNING;
    return MessageBytes(header);
}

TEST(ParseLink, ReadsAHardwareLink) {
    const std::vector<std::uint8_t> address{0x02, 0, 0, 0xaa, 0xbb, 0xcc};
    const auto message = linkMessage(7)
                             .text(IFLA_IFNAME, "enp3s0")
                             .text(IFLA_IFALIAS, "to the lab")
                             .attribute(IFLA_PERM_ADDRESS, address.data(), address.size())
                             .text(IFLA_PARENT_DEV_NAME, "0000:03:00.0")
                             .text(IFLA_PARENT_DEV_BUS_NAME, "pci");
    Link expected;
    expected.index = 7;
    expected.name = "enp3s0";
    expected.flags = IFF_UP | IFF_RUNNING;
    expected.hardwareType = ARPHRD_ETHER;
    expected.alias = "to the lab";
    expected.permanentAddress = address;
    expected.device = DeviceName{"pci", "0000:03:00.0"};
    EXPECT_EQ(parseLink(message.bytes()), expected);
}

TEST(ParseLink, ReadsTheKindOfAVirtualLink) {
    const auto message =
        linkMessage(9).text(IFLA_IFNAME, "v1").nest(IFLA_LINKINFO, MessageBytes().text(IFLA_INFO_KIND, "veth"));
    const auto link = parseLink(message.bytes());
    ASSERT_TRUE(link);
    EXPECT_EQ(link->kind, "veth");
    EXPECT_FALSE(link->device);
    EXPECT_TRUE(link->permanentAddress.empty());
}

TEST(ParseLink, KnowsNoDeviceWithoutABus) {
    const auto message = linkMessage(3).text(IFLA_IFNAME, "wlan0").text(IFLA_PARENT_DEV_NAME, "hwsim0");
    EXPECT_FALSE(parseLink(message.bytes())->device);
}

TEST(ParseLink, RefusesALinkWithoutNameOrIndex) {
    EXPECT_FALSE(parseLink(linkMessage(3).bytes()));
    EXPECT_FALSE(parseLink(linkMessage(0).text(IFLA_IFNAME, "eth0").bytes()));
}

TEST(ParseLink, RefusesATruncatedHeader) {
    const auto message = linkMessage(3).text(IFLA_IFNAME, "eth0");
    for (std::size_t size = 0; size < sizeof(ifinfomsg); ++size) {
        EXPECT_FALSE(parseLink(message.bytes().first(size)));
    }
}

} // namespace
} // namespace Orv::Agent::Hardware
