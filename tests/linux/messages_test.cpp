#include "tests/linux/MessageBuilder.h"

#include <random>

#include <gtest/gtest.h>
#include <linux/if.h>
#include <linux/if_arp.h>
#include <linux/neighbour.h>
#include <linux/rtnetlink.h>

namespace Orv::Agent::Linux {
namespace {

using Test::Attributes;
using Test::MessageBytes;
using Test::Octets;

ifinfomsg linkHeader(int index, unsigned flags = IFF_UP, unsigned char family = AF_UNSPEC) {
    return {family, 0, ARPHRD_ETHER, index, flags, 0};
}

IpAddress ipv4(std::uint8_t a, std::uint8_t b, std::uint8_t c, std::uint8_t d) {
    const Octets octets{a, b, c, d};
    return IpAddress::fromBytes(AF_INET, octets);
}

template <typename Object>
Object objectOf(const Message& message) {
    const auto* change = std::get_if<Change<Object>>(&message);
    EXPECT_NE(change, nullptr) << "the message says nothing";
    return change == nullptr ? Object() : change->object;
}

bool saysNothing(const Message& message) {
    return std::holds_alternative<std::monostate>(message);
}

Attributes usualLink() {
    return Attributes()
        .add(IFLA_IFNAME, "enp3s0")
        .add(IFLA_ADDRESS, Octets{2, 0, 0, 0, 0, 1})
        .add(IFLA_PERM_ADDRESS, Octets{2, 0, 0, 0, 0, 2})
        .add(IFLA_OPERSTATE, Octets{6})
        .add(IFLA_LINKINFO, Attributes().add(IFLA_INFO_KIND, "veth"))
        .add(IFLA_PARENT_DEV_NAME, "0000:03:00.0")
        .add(IFLA_PARENT_DEV_BUS_NAME, "pci");
}

/** A bond as the kernel announces it, with its mode in front and what follows behind. */
Message bondMessage(const Attributes& info) {
    return MessageBytes(RTM_NEWLINK, linkHeader(9, IFF_UP),
                        Attributes().add(IFLA_IFNAME, "bond0").add(IFLA_LINKINFO, info))
        .parse();
}

Link bondOf(const Message& message) {
    return std::get<Change<Link>>(message).object;
}

TEST(LinkMessage, givesTheMembersOfABond) {
    const Attributes data = Attributes()
                                .add(IFLA_BOND_MODE, Octets{1})
                                .add(IFLA_BOND_ACTIVE_SLAVE, std::uint32_t{3})
                                .add(IFLA_BOND_MIIMON, std::uint32_t{100})
                                .add(IFLA_BOND_PRIMARY, std::uint32_t{2});
    const Link bond = bondOf(bondMessage(
        Attributes().add(IFLA_INFO_KIND, "bond").add(IFLA_INFO_DATA | NLA_F_NESTED, data).add(IFLA_INFO_XSTATS, "")));
    EXPECT_EQ(bond.kind, "bond");
    EXPECT_EQ(bond.activeMember, 3);
    EXPECT_EQ(bond.primaryMember, 2);
    EXPECT_EQ(bondOf(bondMessage(Attributes().add(IFLA_INFO_DATA, data).add(IFLA_INFO_KIND, "bond"))), bond)
        << "in any order";
}

TEST(LinkMessage, knowsNoMembersOfOtherKindsAndOfBondsWithoutAny) {
    const Attributes data = Attributes().add(IFLA_BOND_ACTIVE_SLAVE, std::uint32_t{3});
    EXPECT_EQ(bondOf(bondMessage(Attributes().add(IFLA_INFO_KIND, "vxlan").add(IFLA_INFO_DATA, data))).activeMember,
              0);
    EXPECT_EQ(bondOf(bondMessage(Attributes().add(IFLA_INFO_KIND, "bond"))).activeMember, 0);
    const Attributes cut = Attributes().add(IFLA_BOND_ACTIVE_SLAVE, Octets{3, 0});
    EXPECT_EQ(bondOf(bondMessage(Attributes().add(IFLA_INFO_KIND, "bond").add(IFLA_INFO_DATA, cut))).activeMember, 0);
}

TEST(LinkMessage, givesEveryField) {
    const Message message = MessageBytes(RTM_NEWLINK, linkHeader(7, IFF_UP | IFF_RUNNING), usualLink()).parse();
    const Link expected{
        7,      "enp3s0",       ARPHRD_ETHER, IFF_UP | IFF_RUNNING, 6, {2, 0, 0, 0, 0, 1}, {2, 0, 0, 0, 0, 2},
        "veth", "0000:03:00.0", "pci"};
    EXPECT_EQ(message, Message((Change<Link>{expected, false})));
}

TEST(LinkMessage, ofARemovalNeedsNoName) {
    const Message message = MessageBytes(RTM_DELLINK, linkHeader(7)).parse();
    ASSERT_TRUE(std::holds_alternative<Change<Link>>(message));
    EXPECT_TRUE(std::get<Change<Link>>(message).gone);
    EXPECT_EQ(std::get<Change<Link>>(message).object.index, 7);
}

TEST(LinkMessage, withoutANameSaysNothing) {
    EXPECT_TRUE(saysNothing(MessageBytes(RTM_NEWLINK, linkHeader(7)).parse()));
    EXPECT_TRUE(saysNothing(MessageBytes(RTM_NEWLINK, linkHeader(7), Attributes().add(IFLA_IFNAME, "")).parse()));
}

TEST(LinkMessage, takesANameOfFifteenCharactersAndNoLonger) {
    const auto named = [](std::string_view name) {
        return MessageBytes(RTM_NEWLINK, linkHeader(7), Attributes().add(IFLA_IFNAME, name)).parse();
    };
    EXPECT_EQ(objectOf<Link>(named("fifteen-letters")).name, "fifteen-letters");
    EXPECT_TRUE(saysNothing(named("sixteen-letters-")));
}

TEST(LinkMessage, takesANameWithoutItsTerminatingNull) {
    const Attributes attributes = Attributes().add(IFLA_IFNAME, Octets{'e', 't', 'h', '0'});
    EXPECT_EQ(objectOf<Link>(MessageBytes(RTM_NEWLINK, linkHeader(7), attributes).parse()).name, "eth0");
}

TEST(LinkMessage, ofABridgeAboutItsPortSaysNothing) {
    EXPECT_TRUE(saysNothing(MessageBytes(RTM_NEWLINK, linkHeader(7, IFF_UP, AF_BRIDGE), usualLink()).parse()));
    EXPECT_TRUE(saysNothing(MessageBytes(RTM_DELLINK, linkHeader(7, IFF_UP, AF_BRIDGE), usualLink()).parse()));
}

TEST(LinkMessage, ofAWirelessScanSaysNothing) {
    Attributes attributes = usualLink();
    attributes.add(IFLA_WIRELESS, Octets{1, 2, 3, 4});
    EXPECT_TRUE(saysNothing(MessageBytes(RTM_NEWLINK, linkHeader(7), attributes).parse()));
}

TEST(LinkMessage, leavesOutAHardwareAddressThatIsTooLong) {
    const auto addressed = [](std::size_t length) {
        const Attributes attributes = Attributes().add(IFLA_IFNAME, "x").add(IFLA_ADDRESS, Octets(length, 1));
        return objectOf<Link>(MessageBytes(RTM_NEWLINK, linkHeader(7), attributes).parse()).address.size();
    };
    EXPECT_EQ(addressed(32), 32U);
    EXPECT_EQ(addressed(33), 0U);
}

TEST(LinkMessage, withAnImpossibleIndexSaysNothing) {
    EXPECT_TRUE(saysNothing(MessageBytes(RTM_NEWLINK, linkHeader(0), usualLink()).parse()));
    EXPECT_TRUE(saysNothing(MessageBytes(RTM_NEWLINK, linkHeader(-1), usualLink()).parse()));
}

TEST(AddressMessage, ofIpv4NamesItsOwnEndAndThePeers) {
    const Attributes attributes =
        Attributes().add(IFA_LOCAL, Octets{10, 0, 0, 1}).add(IFA_ADDRESS, Octets{10, 0, 0, 2});
    const ifaddrmsg header{AF_INET, 32, 0, RT_SCOPE_UNIVERSE, 3};
    const auto address = objectOf<Address>(MessageBytes(RTM_NEWADDR, header, attributes).parse());
    EXPECT_EQ(address.local, ipv4(10, 0, 0, 1));
    EXPECT_EQ(address.peer, ipv4(10, 0, 0, 2));
    EXPECT_EQ(address.prefixLength, 32);
}

TEST(AddressMessage, ofIpv6WithoutAPeerHasOneAddress) {
    Octets octets(16, 0);
    octets[0] = 0xfd;
    octets[15] = 1;
    const ifaddrmsg header{AF_INET6, 64, 0, RT_SCOPE_UNIVERSE, 3};
    const auto address =
        objectOf<Address>(MessageBytes(RTM_NEWADDR, header, Attributes().add(IFA_ADDRESS, octets)).parse());
    EXPECT_EQ(address.local.text(), "fd00::1");
    EXPECT_EQ(address.peer, address.local);
}

TEST(AddressMessage, takesAll32BitsOfTheFlags) {
    const Attributes attributes =
        Attributes().add(IFA_LOCAL, Octets{10, 0, 0, 1}).add(IFA_FLAGS, std::uint32_t{IFA_F_NOPREFIXROUTE});
    const ifaddrmsg header{AF_INET, 24, IFA_F_PERMANENT, 0, 3};
    EXPECT_EQ(objectOf<Address>(MessageBytes(RTM_NEWADDR, header, attributes).parse()).flags, IFA_F_NOPREFIXROUTE);
}

TEST(AddressMessage, thatContradictsItsFamilySaysNothing) {
    const Attributes four = Attributes().add(IFA_LOCAL, Octets{10, 0, 0, 1});
    EXPECT_TRUE(saysNothing(MessageBytes(RTM_NEWADDR, ifaddrmsg{AF_INET6, 64, 0, 0, 3}, four).parse()));
    EXPECT_TRUE(saysNothing(MessageBytes(RTM_NEWADDR, ifaddrmsg{AF_INET, 33, 0, 0, 3}, four).parse()));
    EXPECT_TRUE(saysNothing(MessageBytes(RTM_NEWADDR, ifaddrmsg{AF_DECnet, 0, 0, 0, 3}, four).parse()));
    EXPECT_TRUE(saysNothing(MessageBytes(RTM_NEWADDR, ifaddrmsg{AF_INET, 24, 0, 0, 0}, four).parse()));
    EXPECT_TRUE(saysNothing(MessageBytes(RTM_NEWADDR, ifaddrmsg{AF_INET, 24, 0, 0, 3}).parse()));
}

rtmsg routeHeader(std::uint8_t family = AF_INET) {
    rtmsg header{};
    header.rtm_family = family;
    header.rtm_table = RT_TABLE_MAIN;
    header.rtm_type = RTN_UNICAST;
    return header;
}

TEST(RouteMessage, givesTheOneWayOut) {
    const Attributes attributes = Attributes()
                                      .add(RTA_GATEWAY, Octets{10, 0, 0, 254})
                                      .add(RTA_OIF, std::uint32_t{4})
                                      .add(RTA_PRIORITY, std::uint32_t{100});
    const auto route = objectOf<Route>(MessageBytes(RTM_NEWROUTE, routeHeader(), attributes).parse());
    EXPECT_EQ(route, (Route{AF_INET, RTN_UNICAST, 0, RT_TABLE_MAIN, 100, {{4, 0, ipv4(10, 0, 0, 254)}}}));
}

TEST(RouteMessage, givesTheSourceThatIsPreferred) {
    const Attributes attributes = Attributes().add(RTA_OIF, std::uint32_t{4}).add(RTA_PREFSRC, Octets{10, 0, 0, 1});
    EXPECT_EQ(objectOf<Route>(MessageBytes(RTM_NEWROUTE, routeHeader(), attributes).parse()).source,
              ipv4(10, 0, 0, 1));
}

TEST(RouteMessage, takesTheWholeNumberOfTheTable) {
    const Attributes attributes = Attributes().add(RTA_TABLE, std::uint32_t{1000}).add(RTA_OIF, std::uint32_t{4});
    EXPECT_EQ(objectOf<Route>(MessageBytes(RTM_NEWROUTE, routeHeader(), attributes).parse()).table, 1000U);
}

Octets hop(int index, const Octets& gateway, std::uint16_t length = 0) {
    const Attributes attributes = Attributes().add(RTA_GATEWAY, gateway);
    rtnexthop header{};
    header.rtnh_ifindex = index;
    header.rtnh_len = length != 0 ? length : static_cast<std::uint16_t>(sizeof header + attributes.bytes().size());
    Octets bytes(sizeof header);
    std::memcpy(bytes.data(), &header, sizeof header);
    bytes.insert(bytes.end(), attributes.bytes().begin(), attributes.bytes().end());
    return bytes;
}

TEST(RouteMessage, givesEveryHopOfSeveral) {
    const Octets first = hop(4, {10, 0, 0, 1});
    Octets both = first;
    const Octets second = hop(5, {10, 0, 1, 1});
    both.insert(both.end(), second.begin(), second.end());
    const auto route =
        objectOf<Route>(MessageBytes(RTM_NEWROUTE, routeHeader(), Attributes().add(RTA_MULTIPATH, both)).parse());
    EXPECT_EQ(route.hops, (std::vector<NextHop>{{4, 0, ipv4(10, 0, 0, 1)}, {5, 0, ipv4(10, 0, 1, 1)}}));
}

TEST(RouteMessage, stopsAtAHopOfImpossibleLength) {
    for (const std::uint16_t length :
         {std::uint16_t{1}, std::uint16_t{7}, std::uint16_t{200}, std::uint16_t{65535}}) {
        const Attributes attributes = Attributes().add(RTA_MULTIPATH, hop(4, {10, 0, 0, 1}, length));
        const auto route = objectOf<Route>(MessageBytes(RTM_NEWROUTE, routeHeader(), attributes).parse());
        EXPECT_TRUE(route.hops.empty()) << length;
    }
}

TEST(RouteMessage, takesAGatewayOfTheOtherFamily) {
    Octets via{AF_INET6, 0};
    via.resize(18, 0);
    via[2] = 0xfe;
    via[3] = 0x80;
    via[17] = 9;
    const Attributes attributes = Attributes().add(RTA_VIA, via).add(RTA_OIF, std::uint32_t{4});
    const auto route = objectOf<Route>(MessageBytes(RTM_NEWROUTE, routeHeader(), attributes).parse());
    ASSERT_EQ(route.hops.size(), 1U);
    EXPECT_EQ(route.hops[0].gateway.text(), "fe80::9");
}

TEST(RouteMessage, toSomewhereInParticularOrFromTheCacheSaysNothing) {
    rtmsg narrow = routeHeader();
    narrow.rtm_dst_len = 24;
    EXPECT_TRUE(saysNothing(MessageBytes(RTM_NEWROUTE, narrow).parse()));
    rtmsg cached = routeHeader();
    cached.rtm_flags = RTM_F_CLONED;
    EXPECT_TRUE(saysNothing(MessageBytes(RTM_NEWROUTE, cached).parse()));
    EXPECT_TRUE(saysNothing(MessageBytes(RTM_NEWROUTE, routeHeader(AF_MPLS)).parse()));
}

TEST(NeighbourMessage, givesAddressAndState) {
    ndmsg header{};
    header.ndm_family = AF_INET;
    header.ndm_ifindex = 4;
    header.ndm_state = NUD_FAILED;
    const Attributes attributes = Attributes().add(NDA_DST, Octets{10, 0, 0, 254});
    EXPECT_EQ(objectOf<Neighbour>(MessageBytes(RTM_NEWNEIGH, header, attributes).parse()),
              (Neighbour{4, NUD_FAILED, ipv4(10, 0, 0, 254)}));
    EXPECT_TRUE(saysNothing(MessageBytes(RTM_NEWNEIGH, header).parse()));
}

TEST(Message, ofAnotherKindSaysNothing) {
    EXPECT_TRUE(saysNothing(MessageBytes(RTM_NEWRULE, linkHeader(7), usualLink()).parse()));
    EXPECT_TRUE(saysNothing(MessageBytes(NLMSG_DONE, Octets(4, 0)).parse()));
}

TEST(Message, cutAnywhereIsReadWithinItsBounds) {
    const MessageBytes whole(RTM_NEWLINK, linkHeader(7), usualLink());
    for (std::size_t length = sizeof(nlmsghdr); length < whole.length(); ++length) {
        const Message message = whole.cut(length).parse();
        if (const auto* link = std::get_if<Change<Link>>(&message)) {
            EXPECT_EQ(link->object.name, "enp3s0") << length;
        }
    }
}

TEST(Message, shorterThanItsHeaderSaysNothing) {
    for (std::uint32_t length = 0; length < sizeof(nlmsghdr) + 4; ++length) {
        const nlmsghdr header{length, RTM_NEWLINK, 0, 0, 0};

        struct {
            nlmsghdr message;
            std::uint32_t rest = 0;
        } memory{header};

        EXPECT_TRUE(saysNothing(parseMessage(memory.message))) << length;
    }
}

/** Random bytes behind real headers, and real messages with random bytes changed: nothing may be read beyond them. */
TEST(Message, ofRandomBytesIsReadWithinItsBounds) {
    std::mt19937 random(4711);
    const auto below = [&](std::size_t limit) { return static_cast<std::size_t>(random()) % limit; };
    for (int round = 0; round < 200'000; ++round) {
        const auto type = static_cast<std::uint16_t>(RTM_NEWLINK + below(RTM_DELNEIGH - RTM_NEWLINK + 1));
        Octets payload(below(120));
        for (std::uint8_t& octet : payload) {
            // Small numbers make attributes that fit more often than they would by chance.
            octet = static_cast<std::uint8_t>(below(4) == 0 ? below(256) : below(24));
        }
        (void)MessageBytes(type, payload).parse();
    }
}

} // namespace
} // namespace Orv::Agent::Linux
