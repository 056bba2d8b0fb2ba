#include "agent/change/ChangeError.h"
#include "agent/change/Rules.h"

#include <array>

#include <arpa/inet.h>
#include <gmock/gmock.h>
#include <gtest/gtest.h>

namespace {

using namespace Orv::Agent;
using testing::HasSubstr;
using testing::IsEmpty;
using testing::Not;

Ipv4Address ip(const std::string& text) {
    return Ipv4Address::parse(text).value();
}

Ipv4Prefixed prefixed(const std::string& text, std::uint8_t length) {
    return {ip(text), length};
}

TEST(Ipv4, ReadsAndWritesTheDottedForm) {
    for (const std::string text :
         {"0.0.0.0", "1.2.3.4", "10.0.0.1", "192.0.2.255", "255.255.255.255", "100.64.0.9"}) {
        EXPECT_EQ(ip(text).text(), text);
    }
    EXPECT_EQ(ip("192.0.2.1").number, 0xC0000201U);
}

TEST(Ipv4, RefusesEveryOtherSpelling) {
    const std::string texts[] = {"",
                                 " ",
                                 "1",
                                 "1.2",
                                 "1.2.3",
                                 "1.2.3.4.5",
                                 "1.2.3.",
                                 ".1.2.3",
                                 "1..2.3",
                                 "1.2.3.4.",
                                 ".1.2.3.4",
                                 "...",
                                 "....",
                                 "1.2.3.256",
                                 "256.2.3.4",
                                 "1.2.3.999",
                                 "1.2.3.4294967296",
                                 "1.2.3.99999999999999999999",
                                 "01.2.3.4",
                                 "1.2.3.04",
                                 "1.2.3.00",
                                 "010.0.0.1",
                                 "0x7f.0.0.1",
                                 "0x7f000001",
                                 "2130706433",
                                 "127.1",
                                 "10.1",
                                 "0",
                                 "1.2.3.-4",
                                 "1.2.3.+4",
                                 "-1.2.3.4",
                                 "1.2.3.4 ",
                                 " 1.2.3.4",
                                 "1.2. 3.4",
                                 "1.2.3.4\n",
                                 "\t1.2.3.4",
                                 "1.2.3.4/24",
                                 "1.2.3.4:80",
                                 "1.2.3.4%eth0",
                                 "1,2,3,4",
                                 "1.2.3.a",
                                 "a.b.c.d",
                                 "1.2.3.4a",
                                 "1.2.3.1e1",
                                 "one.two.three.four",
                                 "::1",
                                 "::ffff:1.2.3.4",
                                 "2001:db8::1",
                                 "1.2.3.4, 5.6.7.8",
                                 "\u0661.\u0662.\u0663.\u0664",
                                 "1\u20242.3.4",
                                 "\xFF",
                                 "$(reboot)",
                                 "1.2.3.4;reboot",
                                 "eth0",
                                 std::string("1.2.3.4\0", 8),
                                 std::string("\0001.2.3.4", 8),
                                 std::string("1.2.3\0.4", 8),
                                 std::string(100000, '1'),
                                 std::string(100000, '.')};
    for (const std::string& text : texts) {
        EXPECT_FALSE(Ipv4Address::parse(text)) << text.substr(0, 40);
    }
}

TEST(Ipv4, RefusesEverySingleForeignCharacterAnywhere) {
    const std::string good = "192.0.2.1";
    for (std::size_t place = 0; place <= good.size(); ++place) {
        for (int character = 0; character < 256; ++character) {
            std::string text = good;
            text.insert(place, 1, static_cast<char>(character));
            in_addr parsed{};
            // inet_pton(3) accepts the same form, up to what a C string can hold.
            const bool isGood = character != 0 && inet_pton(AF_INET, text.c_str(), &parsed) == 1;
            ASSERT_EQ(Ipv4Address::parse(text).has_value(), isGood) << text;
        }
    }
}

TEST(Masks, AreContiguous) {
    for (unsigned length = 0; length <= 32; ++length) {
        const Ipv4Address mask = maskOf(static_cast<std::uint8_t>(length));
        EXPECT_EQ(prefixLengthOf(mask), length) << mask.text();
    }
    EXPECT_EQ(maskOf(0).text(), "0.0.0.0");
    EXPECT_EQ(maskOf(23).text(), "255.255.254.0");
    EXPECT_EQ(maskOf(32).text(), "255.255.255.255");
}

TEST(Masks, AreNothingWithAHole) {
    for (unsigned length = 2; length <= 32; ++length) {
        const std::uint32_t mask = maskOf(static_cast<std::uint8_t>(length)).number;
        for (unsigned hole = 32 - length + 1; hole < 32; ++hole) {
            EXPECT_FALSE(prefixLengthOf({mask & ~(1U << hole)})) << Ipv4Address{mask & ~(1U << hole)}.text();
        }
    }
    for (const char* text : {"0.0.0.255", "0.0.0.1", "255.0.255.0", "255.255.0.255", "192.0.2.1", "10.0.0.0"}) {
        EXPECT_FALSE(prefixLengthOf(ip(text))) << text;
    }
}

TEST(Masks, OfClassesAreThoseOfRfc791) {
    const std::pair<const char*, unsigned> cases[] = {
        {"1.0.0.1", 8},        {"127.0.0.1", 8},  {"128.0.0.1", 16},       {"191.255.0.1", 16}, {"192.0.0.1", 24},
        {"223.255.255.1", 24}, {"224.0.0.1", 24}, {"255.255.255.255", 24}, {"0.0.0.0", 8}};
    for (const auto& [address, length] : cases) {
        EXPECT_EQ(classPrefixLength(ip(address)), length) << address;
    }
}

TEST(HostAddress, IsRefusedByItsKind) {
    const std::pair<const char*, const char*> cases[] = {
        {"0.0.0.0", "network 0"},    {"0.255.255.255", "network 0"}, {"127.0.0.1", "loopback"},
        {"127.255.0.9", "loopback"}, {"224.0.0.1", "multicast"},     {"239.255.255.255", "multicast"},
        {"240.0.0.1", "class E"},    {"255.255.255.254", "class E"}, {"255.255.255.255", "class E"},
        {"255.0.255.0", "class E"},  {"250.1.2.3", "class E"}};
    for (const auto& [address, reason] : cases) {
        EXPECT_THAT(whyNotHostAddress(ip(address)), HasSubstr(reason)) << address;
    }
    for (const char* address : {"1.0.0.0", "126.255.255.255", "128.0.0.0", "223.255.255.255", "169.254.3.2"}) {
        EXPECT_THAT(whyNotHostAddress(ip(address)), IsEmpty()) << address;
    }
}

TEST(InterfaceAddress, HasAHostPart) {
    struct Case {
        const char* address;
        std::uint8_t length;
        const char* reason;
    };

    const Case cases[] = {
        {"192.0.2.0", 24, "all zeros"}, {"192.0.2.255", 24, "all ones"}, {"192.0.2.1", 24, ""},
        {"192.0.2.255", 23, ""},        {"192.0.3.255", 23, "all ones"}, {"192.0.2.0", 23, "all zeros"},
        {"192.0.3.0", 23, ""},          {"192.0.2.1", 30, ""},           {"192.0.2.3", 30, "all ones"},
        {"192.0.2.4", 30, "all zeros"}, {"192.0.2.4", 31, ""},           {"192.0.2.5", 31, ""},
        {"192.0.2.0", 32, ""},          {"192.0.2.255", 32, ""},         {"10.255.255.255", 8, "all ones"},
        {"10.0.0.0", 8, "all zeros"},   {"128.0.0.0", 1, "all zeros"},   {"10.0.0.255", 8, ""},
        {"127.0.0.1", 8, "loopback"},   {"224.0.0.5", 31, "multicast"},  {"0.0.0.1", 8, "network 0"},
        {"191.255.255.255", 1, ""},
    };
    for (const auto& [address, length, reason] : cases) {
        const std::string found = whyNotInterfaceAddress(prefixed(address, length));
        EXPECT_THAT(found, HasSubstr(reason)) << address << '/' << unsigned{length};
        EXPECT_EQ(found.empty(), std::string(reason).empty()) << address << '/' << unsigned{length} << found;
    }
}

TEST(InterfaceAddress, HasNeitherEndOfItsNetworkAtAnyPrefixLength) {
    for (unsigned length = 3; length <= 30; ++length) {
        const auto bits = static_cast<std::uint8_t>(length);
        const std::uint32_t network = ip("85.170.85.170").number & maskOf(bits).number;
        EXPECT_THAT(whyNotInterfaceAddress({{network}, bits}), HasSubstr("all zeros")) << length;
        EXPECT_THAT(whyNotInterfaceAddress({{network + 1}, bits}), IsEmpty()) << length;
        const Ipv4Address last = Ipv4Prefixed{{network}, bits}.broadcast();
        EXPECT_THAT(whyNotInterfaceAddress({{last.number - 1}, bits}), IsEmpty()) << length;
        EXPECT_THAT(whyNotInterfaceAddress({last, bits}), HasSubstr("all ones")) << length;
    }
}

TEST(PrefixLength, OfAMaskHasABit) {
    EXPECT_THAT(whyNotPrefixLength(0), Not(IsEmpty()));
    EXPECT_THAT(whyNotPrefixLength(1), IsEmpty());
    EXPECT_THAT(whyNotPrefixLength(32), IsEmpty());
}

TEST(Gateway, IsAnotherHostOfTheNetwork) {
    const Ipv4Prefixed own = prefixed("192.0.2.10", 24);

    struct Case {
        const char* gateway;
        std::optional<Ipv4Prefixed> address;
        const char* reason;
    };

    const Case cases[] = {
        {"192.0.2.1", own, ""},
        {"192.0.2.254", own, ""},
        {"192.0.2.10", own, "own address"},
        {"192.0.2.0", own, "all zeros"},
        {"192.0.2.255", own, "all ones"},
        {"192.0.3.1", own, "not reached on the link with the address in force, 192.0.2.10/24"},
        {"192.0.1.254", own, "not reached"},
        {"10.0.0.1", own, "not reached"},
        {"192.0.2.1", std::nullopt, "no IPv4 address"},
        {"192.0.2.1", prefixed("192.0.2.10", 32), "not reached"},
        {"192.0.2.11", prefixed("192.0.2.10", 31), ""},
        {"192.0.2.12", prefixed("192.0.2.10", 31), "not reached"},
        {"192.0.3.1", prefixed("192.0.2.10", 23), ""},
        {"0.0.0.0", own, "network 0"},
        {"127.0.0.1", own, "loopback"},
        {"224.0.0.1", own, "multicast"},
        {"255.255.255.255", own, "class E"},
        {"127.0.0.1", std::nullopt, "loopback"},
    };
    for (const auto& [gateway, address, reason] : cases) {
        const std::string found = whyNotGateway(ip(gateway), address);
        EXPECT_THAT(found, HasSubstr(reason)) << gateway;
        EXPECT_EQ(found.empty(), std::string(reason).empty()) << gateway << ": " << found;
    }
}

TEST(ChangeError, NamesInterfacePropertyValueAndReasonInOneCleanLine) {
    using namespace Orv::NodeLexicon;
    EXPECT_STREQ(ChangeError("eth0", PROP_IPV4_SUBNET_MASK, std::string("255.0.255.0"), "why").what(),
                 "eth0: SubnetMask cannot be set to \"255.0.255.0\": why");
    EXPECT_STREQ(ChangeError("eth\n0", PROP_DNS_DOMAIN, std::string("a\nb\x1b[2J\xFF"), "why").what(),
                 "eth 0: DNSDomain cannot be set to \"a b [2J\uFFFD\": why");
    EXPECT_STREQ(ChangeError("eth0", PROP_DNS_SERVERS, std::vector<std::string>{"a", "b"}, "why").what(),
                 "eth0: DNSServerSearchOrder cannot be set to [\"a\", \"b\"]: why");
    EXPECT_STREQ(ChangeError("eth0", static_cast<Properties>(7), 3U, "why").what(),
                 "eth0: property 7 cannot be set to 3: why");
}

TEST(ChangeError, CutsWhatIsTooLongForALine) {
    using namespace Orv::NodeLexicon;
    const ChangeError text("eth0", PROP_DNS_DOMAIN, std::string(100000, 'a'), "why");
    EXPECT_LT(std::string(text.what()).size(), 200U);
    EXPECT_THAT(text.what(), HasSubstr("aaa...\": why"));
    const ChangeError list("eth0", PROP_DNS_SERVERS, std::vector<std::string>(1000, "a"), "why");
    EXPECT_LT(std::string(list.what()).size(), 200U);
    EXPECT_THAT(list.what(), HasSubstr(", ...]: why"));
}

} // namespace
