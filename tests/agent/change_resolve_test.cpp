#include "agent/change/Resolve.h"
#include "tests/agent/TemporaryFile.h"

#include <gmock/gmock.h>
#include <gtest/gtest.h>

namespace {

using namespace Orv::Agent;
using namespace Orv::NodeLexicon;
using Orv::Test::messageOf;
using testing::HasSubstr;
using testing::StartsWith;

using Texts = std::vector<std::string>;

Ipv4Address ip(const std::string& text) {
    return Ipv4Address::parse(text).value();
}

/** An interface to which one property is written after the other, as a back end does it. */
struct ResolveTest : testing::Test {
    /** "192.0.2.10/24" and a gateway or none. */
    void have(const std::string& address, const std::string& gateway = "") { inForce.ipv4 = ipv4(address, gateway); }

    static Ipv4Settings ipv4(const std::string& address, const std::string& gateway = "") {
        Ipv4Settings settings;
        if (const std::size_t slash = address.find('/'); slash != std::string::npos) {
            settings.address = Ipv4Prefixed{ip(address.substr(0, slash)),
                                            static_cast<std::uint8_t>(std::stoi(address.substr(slash + 1)))};
        }
        if (!gateway.empty()) {
            settings.gateway = ip(gateway);
        }
        return settings;
    }

    /** Writes, and takes what is wanted into force. */
    AdapterSettings write(Properties property, const PropertyValue& value) {
        const Resolution resolution = resolve("eth0", property, value, inForce, pending);
        pending = resolution.pending;
        if (resolution.wanted.ipv4) {
            inForce.ipv4 = resolution.wanted.ipv4;
        }
        inForce.names = resolution.wanted.names.over(inForce.names);
        return resolution.wanted;
    }

    AdapterSettings address(const std::string& value) { return write(PROP_IPV4_ADDRESS, value); }

    AdapterSettings mask(const std::string& value) { return write(PROP_IPV4_SUBNET_MASK, value); }

    std::string refusal(Properties property, const PropertyValue& value) {
        const AdapterSettings before = inForce;
        const PendingPair pendingBefore = pending;
        std::string message = messageOf([&] { write(property, value); });
        EXPECT_EQ(inForce, before);
        EXPECT_EQ(pending, pendingBefore);
        return message;
    }

    AdapterSettings inForce{Ipv4Settings{}, {}};
    PendingPair pending;
};

TEST_F(ResolveTest, AddressAloneKeepsThePrefixLengthInForce) {
    have("192.0.2.10/25");
    EXPECT_EQ(address("192.0.2.20"), (AdapterSettings{ipv4("192.0.2.20/25"), {}}));
}

TEST_F(ResolveTest, AddressAloneTakesTheMaskOfItsClassWhereThereIsNone) {
    EXPECT_EQ(address("10.1.2.3").ipv4, ipv4("10.1.2.3/8"));
    have("");
    EXPECT_EQ(address("172.16.2.3").ipv4, ipv4("172.16.2.3/16"));
    have("");
    EXPECT_EQ(address("192.168.2.3").ipv4, ipv4("192.168.2.3/24"));
}

TEST_F(ResolveTest, MaskAloneGoesWithTheAddressInForce) {
    have("192.0.2.10/24");
    EXPECT_EQ(mask("255.255.0.0").ipv4, ipv4("192.0.2.10/16"));
}

TEST_F(ResolveTest, ValueDecidesWhichOfTheTwoItIs) {
    for (const bool isSwapped : {false, true}) {
        for (const bool isMaskFirst : {false, true}) {
            have("");
            pending = {};
            write(PROP_DHCP_ENABLED, 3U);
            const Properties forAddress = isSwapped ? PROP_IPV4_SUBNET_MASK : PROP_IPV4_ADDRESS;
            const Properties forMask = isSwapped ? PROP_IPV4_ADDRESS : PROP_IPV4_SUBNET_MASK;
            if (isMaskFirst) {
                EXPECT_EQ(write(forMask, std::string("255.255.254.0")), AdapterSettings{});
                EXPECT_EQ(write(forAddress, std::string("10.0.0.5")).ipv4, ipv4("10.0.0.5/23"));
            } else {
                EXPECT_EQ(write(forAddress, std::string("10.0.0.5")).ipv4, ipv4("10.0.0.5/8"));
                EXPECT_EQ(write(forMask, std::string("255.255.254.0")).ipv4, ipv4("10.0.0.5/23"));
            }
        }
    }
}

TEST_F(ResolveTest, MaskWaitsForItsAddressAndIsUsedOnce) {
    mask("255.255.255.192");
    EXPECT_EQ(pending.prefixLength, 26);
    EXPECT_EQ(address("10.0.0.5").ipv4, ipv4("10.0.0.5/26"));
    have("");
    EXPECT_EQ(address("10.0.0.5").ipv4, ipv4("10.0.0.5/8"));
}

TEST_F(ResolveTest, MaskUnfitForTheAddressInForceWaitsWhileANewAddressIsExpected) {
    have("10.0.0.3/8");
    write(PROP_DHCP_ENABLED, 3U);
    EXPECT_EQ(mask("255.255.255.252"), AdapterSettings{});
    EXPECT_EQ(address("10.0.0.5").ipv4, ipv4("10.0.0.5/30"));
}

TEST_F(ResolveTest, MaskUnfitForTheAddressInForceIsRefusedOtherwise) {
    have("10.0.0.3/8");
    EXPECT_THAT(refusal(PROP_IPV4_SUBNET_MASK, std::string("255.255.255.252")),
                HasSubstr("10.0.0.3/30 is the network's broadcast address"));
    write(PROP_DHCP_ENABLED, 3U);
    address("10.0.0.7");
    EXPECT_THAT(refusal(PROP_IPV4_SUBNET_MASK, std::string("255.255.255.252")), HasSubstr("all ones"));
}

TEST_F(ResolveTest, AddressUnfitForThePrefixLengthIsRefused) {
    have("10.0.0.1/24");
    EXPECT_EQ(
        refusal(PROP_IPV4_ADDRESS, std::string("10.0.1.255")),
        "eth0: IPv4Address cannot be set to \"10.0.1.255\": 10.0.1.255/24 is the network's broadcast address: its "
        "host part is all ones");
}

TEST_F(ResolveTest, AChangeOfModeForgetsAMaskThatWaits) {
    write(PROP_DHCP_ENABLED, 3U);
    mask("255.255.255.192");
    write(PROP_DHCP_ENABLED, 3U);
    EXPECT_EQ(address("10.0.0.5").ipv4, ipv4("10.0.0.5/8"));
}

TEST_F(ResolveTest, KeepsAGatewayThatTheNewNetworkReaches) {
    have("192.0.2.10/24", "192.0.2.1");
    EXPECT_EQ(address("192.0.2.20").ipv4, ipv4("192.0.2.20/24", "192.0.2.1"));
}

TEST_F(ResolveTest, GivesUpAGatewayThatTheNewNetworkDoesNotReach) {
    have("192.0.2.10/24", "192.0.2.1");
    EXPECT_EQ(address("198.51.100.20").ipv4, ipv4("198.51.100.20/24"));
    have("192.0.2.10/24", "192.0.2.10");
    EXPECT_EQ(mask("255.255.0.0").ipv4, ipv4("192.0.2.10/16")) << "no gateway is the interface itself";
}

TEST_F(ResolveTest, GivesBackAGatewayThatOnlyTheFirstOfTwoWritesDidNotReach) {
    have("10.0.0.5/24", "10.0.0.1");
    EXPECT_EQ(address("10.0.7.5").ipv4, ipv4("10.0.7.5/24"));
    EXPECT_EQ(mask("255.255.0.0").ipv4, ipv4("10.0.7.5/16", "10.0.0.1"));
    have("10.0.7.5/16", "10.0.0.1");
    write(PROP_DHCP_ENABLED, 3U);
    EXPECT_EQ(mask("255.255.255.0").ipv4, ipv4("10.0.7.5/24"));
    EXPECT_EQ(address("10.0.0.9").ipv4, ipv4("10.0.0.9/24", "10.0.0.1"));
}

TEST_F(ResolveTest, ForgetsAGatewayThatTheSecondWriteDidNotReachEither) {
    have("10.0.0.5/24", "10.0.0.1");
    address("192.0.2.5");
    mask("255.255.255.128");
    address("10.0.0.5");
    EXPECT_EQ(inForce.ipv4, ipv4("10.0.0.5/25"));
}

TEST_F(ResolveTest, AGatewayOfItsOwnReplacesOneThatWasGivenUp) {
    have("10.0.0.5/24", "10.0.0.1");
    address("10.0.7.5");
    write(PROP_DEFAULT_GATEWAY, std::string("10.0.7.1"));
    EXPECT_EQ(mask("255.255.0.0").ipv4, ipv4("10.0.7.5/16", "10.0.7.1"));
}

TEST_F(ResolveTest, DhcpWantsNeitherAddressNorGateway) {
    have("192.0.2.10/24", "192.0.2.1");
    EXPECT_EQ(write(PROP_DHCP_ENABLED, 1U), (AdapterSettings{Ipv4Settings{AddressMode::leased, {}, {}}, {}}));
}

TEST_F(ResolveTest, StaticWantsWhatIsInForceALeaseToo) {
    have("192.0.2.10/24", "192.0.2.1");
    inForce.ipv4->mode = AddressMode::leased;
    EXPECT_EQ(write(PROP_DHCP_ENABLED, 3U).ipv4, ipv4("192.0.2.10/24", "192.0.2.1"));
    EXPECT_TRUE(pending.isExpected);
}

TEST_F(ResolveTest, RefusesAddressMaskAndGatewayWhileTheModeIsDhcp) {
    have("192.0.2.10/24", "192.0.2.1");
    inForce.ipv4->mode = AddressMode::leased;
    for (const auto& [property, value] :
         std::vector<std::pair<Properties, std::string>>{{PROP_IPV4_ADDRESS, "192.0.2.11"},
                                                         {PROP_IPV4_SUBNET_MASK, "255.255.0.0"},
                                                         {PROP_DEFAULT_GATEWAY, "192.0.2.2"}}) {
        EXPECT_THAT(refusal(property, value), HasSubstr("gets its address by DHCP")) << value;
    }
    EXPECT_EQ(write(PROP_DNS_DOMAIN, std::string("example.org")).names.domain, "example.org");
}

TEST_F(ResolveTest, GatewayMustBeReached) {
    have("192.0.2.10/24");
    EXPECT_EQ(write(PROP_DEFAULT_GATEWAY, std::string("192.0.2.1")).ipv4, ipv4("192.0.2.10/24", "192.0.2.1"));
    EXPECT_THAT(refusal(PROP_DEFAULT_GATEWAY, std::string("198.51.100.1")), HasSubstr("not reached"));
    have("");
    EXPECT_THAT(refusal(PROP_DEFAULT_GATEWAY, std::string("192.0.2.1")), HasSubstr("no IPv4 address"));
}

TEST_F(ResolveTest, NameServiceLeavesIpv4AndEachOtherAlone) {
    have("192.0.2.10/24");
    EXPECT_EQ(write(PROP_DNS_SERVERS, Texts{"192.0.2.53"}),
              (AdapterSettings{std::nullopt, {{}, Texts{"192.0.2.53"}, {}}}));
    EXPECT_EQ(write(PROP_DNS_SUFFIXES, Texts{"a.org", "b.org"}),
              (AdapterSettings{std::nullopt, {{}, {}, Texts{"a.org", "b.org"}}}));
    EXPECT_EQ(write(PROP_DNS_SERVERS, Texts{}), (AdapterSettings{std::nullopt, {{}, Texts{}, {}}}));
    EXPECT_EQ(write(PROP_DNS_DOMAIN, std::string("c.org")), (AdapterSettings{std::nullopt, {"c.org", {}, {}}}));
    EXPECT_EQ(inForce.names, (NameSettings{"c.org", Texts{}, Texts{"a.org", "b.org"}}));
}

TEST_F(ResolveTest, RefusesValuesOfAnotherTypeAndPropertiesThatAreOnlyRead) {
    const PropertyValue number = 3U;
    const PropertyValue text = std::string("192.0.2.1");
    const PropertyValue list = Texts{"192.0.2.1"};
    const std::tuple<Properties, PropertyValue, const char*> cases[] = {
        {PROP_DHCP_ENABLED, text, "DHCPEnabled"},
        {PROP_DHCP_ENABLED, list, "DHCPEnabled"},
        {PROP_IPV4_ADDRESS, number, "IPv4Address"},
        {PROP_IPV4_ADDRESS, list, "IPv4Address"},
        {PROP_IPV4_SUBNET_MASK, number, "SubnetMask"},
        {PROP_DEFAULT_GATEWAY, list, "DefaultIPGateway"},
        {PROP_DEFAULT_GATEWAY, number, "DefaultIPGateway"},
        {PROP_DNS_DOMAIN, list, "DNSDomain"},
        {PROP_DNS_SERVERS, text, "DNSServerSearchOrder"},
        {PROP_DNS_SUFFIXES, text, "DNSDomainSuffixSearchOrder"},
        {PROP_DNS_SUFFIXES, number, "DNSDomainSuffixSearchOrder"},
        {PROP_IPV6_ADDRESS, std::string("2001:db8::1"), "IPv6Address"},
        {PROP_MAC_ADDRESS, std::string("02:00:00:00:00:01"), "MACAddress"},
        {PROP_DNS_HOSTNAME, std::string("host"), "DNSHostName"},
        {PROP_NODE_STRING, std::string("eth1"), "property 108"},
        {PROP_STATUS, number, "Status"},
        {PROP_IP_SUPPORT, number, "property 96"},
        {static_cast<Properties>(1234), number, "property 1234"},
    };
    for (const auto& [property, value, name] : cases) {
        EXPECT_THAT(refusal(property, value), StartsWith("eth0: " + std::string(name) + " cannot be set to "));
    }
}

TEST_F(ResolveTest, RefusesEveryModeButTwo) {
    for (const unsigned int mode : {0U, 2U, 4U, 7U, 65537U, 4294967295U}) {
        EXPECT_THAT(refusal(PROP_DHCP_ENABLED, mode), HasSubstr("the mode is 1 for DHCP or 3 for static")) << mode;
    }
}

TEST_F(ResolveTest, RefusesHostileTextsInEveryRole) {
    have("192.0.2.10/24", "192.0.2.1");
    const std::string texts[] = {
        "",          " ",           "0.0.0.0",    "127.0.0.1",     "224.0.0.1",   "240.0.0.1",   "0.0.0.1",
        "192.0.2",   "192.0.2.01",  "0xC0000201", "192.0.2.10/24", "192.0.2.256", "255.0.255.0", "255.255.255.253",
        "192.0.2.0", "192.0.2.255", "a",          "192.0.2.1\n",   "eth0",        "2001:db8::1", "-1",
        "24",        "/24",         "1e3"};
    for (const std::string& text : texts) {
        for (const Properties property : {PROP_IPV4_ADDRESS, PROP_IPV4_SUBNET_MASK, PROP_DEFAULT_GATEWAY}) {
            EXPECT_THAT(refusal(property, text), HasSubstr("cannot be set to")) << text;
        }
    }
}

TEST(SettingsOf, ReadsANode) {
    const PropertyMap properties{{PROP_DHCP_ENABLED, 1U},
                                 {PROP_IPV4_ADDRESS, std::string("192.0.2.10")},
                                 {PROP_IPV4_SUBNET_MASK, std::string("255.255.254.0")},
                                 {PROP_DEFAULT_GATEWAY, std::string("192.0.2.1")},
                                 {PROP_DNS_DOMAIN, std::string("example.org")},
                                 {PROP_DNS_SERVERS, Texts{"192.0.2.53"}},
                                 {PROP_DNS_SUFFIXES, Texts{"a.org"}}};
    const AdapterSettings expected{
        Ipv4Settings{AddressMode::leased, Ipv4Prefixed{ip("192.0.2.10"), 23}, ip("192.0.2.1")},
        {"example.org", Texts{"192.0.2.53"}, Texts{"a.org"}}};
    EXPECT_EQ(settingsOf(properties), expected);
}

TEST(SettingsOf, LeavesOutWhatIsNoIpv4) {
    EXPECT_EQ(settingsOf({}), (AdapterSettings{Ipv4Settings{}, {}}));
    EXPECT_EQ(settingsOf({{PROP_IPV4_ADDRESS, std::string("172.16.0.9")}}).ipv4->address,
              (Ipv4Prefixed{ip("172.16.0.9"), 16}));
    EXPECT_EQ(
        settingsOf({{PROP_IPV4_ADDRESS, std::string("172.16.0.9")}, {PROP_IPV4_SUBNET_MASK, std::string("odd")}})
            .ipv4->address,
        std::nullopt);
    EXPECT_EQ(settingsOf({{PROP_DEFAULT_GATEWAY, std::string("fe80::1")}}).ipv4->gateway, std::nullopt);
    EXPECT_EQ(settingsOf({{PROP_DHCP_ENABLED, 7U}}).ipv4->mode, AddressMode::fixed);
}

} // namespace
