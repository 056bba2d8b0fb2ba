#include "agent/change/Rules.h"

#include <gmock/gmock.h>
#include <gtest/gtest.h>

namespace {

using namespace Orv::Agent;
using testing::HasSubstr;
using testing::IsEmpty;
using testing::Not;

const std::string label63(63, 'a');

TEST(NameRules, AcceptNamesByRfc1123) {
    const std::string names[] = {
        "example.org", "a",     "lan",     "x.y", "3com.com",  "a-b.c",  "A.B.C",          "xn--p1",
        "host-1.net",  label63, "0x1.org", "1.a", "127.0.0.x", "a--b.c", label63 + ".org", "a.b.c.d.e.f.g"};
    for (const std::string& name : names) {
        EXPECT_THAT(whyNotDomain(name), IsEmpty()) << name;
    }
    const std::string longest = label63 + "." + label63 + "." + label63 + "." + std::string(61, 'b');
    ASSERT_EQ(longest.size(), 253U);
    EXPECT_THAT(whyNotDomain(longest), IsEmpty());
    EXPECT_THAT(whyNotDomain(longest + "b"), HasSubstr("longer than 253"));
}

TEST(NameRules, RefuseWhatIsNoName) {
    const std::string names[] = {"",
                                 ".",
                                 "..",
                                 ".example.org",
                                 "example.org.",
                                 "example..org",
                                 "-a",
                                 "a-",
                                 "a.-b",
                                 "a-.b",
                                 "-",
                                 "a_b.org",
                                 "_dmarc.example.org",
                                 "exa mple.org",
                                 " example.org",
                                 "example.org ",
                                 "example.org\n",
                                 "example.org\nnameserver 192.0.2.66",
                                 "example\torg",
                                 std::string("example\0.org", 12),
                                 std::string("\0", 1),
                                 "ex\u00e4mple.org",
                                 "example.org#",
                                 "example.org;reboot",
                                 "$(reboot)",
                                 "`reboot`",
                                 "../../etc/passwd",
                                 "a/b",
                                 "a\\b",
                                 "\"a\"",
                                 "'a'",
                                 "*",
                                 "*.example.org",
                                 "~example.org",
                                 "192.0.2.1",
                                 "1",
                                 "example.1",
                                 "example.123",
                                 "2001:db8::1",
                                 "[::1]",
                                 "a@b.c",
                                 "a:53",
                                 "a%b",
                                 "a,b",
                                 "a=b",
                                 "\x7F",
                                 "\xFF\xFE",
                                 label63 + "a",
                                 "x." + label63 + "a.org",
                                 std::string(254, 'a'),
                                 std::string(100000, '.'),
                                 std::string(100000, 'a')};
    for (const std::string& name : names) {
        EXPECT_THAT(whyNotDomain(name), Not(IsEmpty())) << name.substr(0, 60);
    }
}

TEST(NameRules, RefuseEveryOtherCharacterInALabel) {
    int accepted = 0;
    for (int character = 0; character < 256; ++character) {
        const std::string name = std::string("a") + static_cast<char>(character) + "b";
        accepted += whyNotDomain(name).empty() ? 1 : 0;
    }
    EXPECT_EQ(accepted, 26 + 26 + 10 + 1 + 1) << "letters, digits, the hyphen, and the dot between two labels";
}

TEST(ServerRules, AcceptAddressesOfBothFamilies) {
    const std::vector<std::vector<std::string>> lists{{},
                                                      {"192.0.2.53"},
                                                      {"127.0.0.1"},
                                                      {"127.0.0.53", "::1"},
                                                      {"2001:db8::53", "192.0.2.53", "fe80::1%eth0"},
                                                      {"fe80::1%eth0", "fe80::1%eth1"},
                                                      {"2001:DB8:0:0:0:0:0:53"},
                                                      {"fd00::1"},
                                                      {"64:ff9b::192.0.2.1"}};
    for (const auto& list : lists) {
        EXPECT_THAT(whyNotNameServers(list), IsEmpty()) << testing::PrintToString(list);
    }
}

TEST(ServerRules, RefuseWhatIsNoServer) {
    const std::string servers[] = {"",
                                   " ",
                                   "localhost",
                                   "192.0.2",
                                   "192.0.2.053",
                                   "192.0.2.53 ",
                                   " 192.0.2.53",
                                   "192.0.2.53\n",
                                   "192.0.2.53:53",
                                   "192.0.2.53#53",
                                   "192.0.2.53/24",
                                   "192.0.2.53%eth0",
                                   "0.0.0.0",
                                   "224.0.0.251",
                                   "255.255.255.255",
                                   "240.0.0.1",
                                   "0x7f000001",
                                   "3221225985",
                                   "::",
                                   "ff02::fb",
                                   "fe80::1",
                                   "fe80::1%",
                                   "fe80::1%eth0%eth1",
                                   "fe80::1%eth 0",
                                   "fe80::1%e\nh0",
                                   "fe80::1%sixteen-octets-x",
                                   "2001:db8::1%eth0",
                                   "2001:db8:::1",
                                   "2001:db8::1::2",
                                   "2001:db8::12345",
                                   "[2001:db8::1]",
                                   "2001:db8::1/64",
                                   "2001:db8::g",
                                   "1:2:3:4:5:6:7",
                                   "1:2:3:4:5:6:7:8:9",
                                   "::ffff:192.0.2.256",
                                   std::string("2001:db8::1\0x", 13),
                                   std::string("192.0.2.1\0", 10),
                                   std::string(100000, ':'),
                                   "nameserver 192.0.2.1"};
    for (const std::string& server : servers) {
        EXPECT_THAT(whyNotNameServers({server}), Not(IsEmpty())) << server.substr(0, 60);
        EXPECT_THAT(whyNotNameServers({"192.0.2.1", server}), HasSubstr("number 2")) << server.substr(0, 60);
    }
}

TEST(ServerRules, RefuseMoreThanTheResolverReads) {
    std::vector<std::string> servers{"192.0.2.1", "192.0.2.2", "192.0.2.3"};
    EXPECT_THAT(whyNotNameServers(servers), IsEmpty());
    servers.emplace_back("192.0.2.4");
    EXPECT_EQ(whyNotNameServers(servers), "the resolver reads 3 name servers, not 4");
}

TEST(ServerRules, RefuseOneServerTwiceHoweverItIsWritten) {
    EXPECT_EQ(whyNotNameServers({"192.0.2.1", "192.0.2.1"}), "number 2 is there twice");
    EXPECT_EQ(whyNotNameServers({"192.0.2.9", "2001:db8::1", "2001:DB8:0::0:1"}), "number 3 is there twice");
    EXPECT_EQ(whyNotNameServers({"192.0.2.1", "::ffff:192.0.2.1"}), "number 2 is there twice");
}

TEST(SuffixRules, AcceptUpToSixAndRefuseTheSeventhAndDuplicates) {
    std::vector<std::string> suffixes{"a.org", "b.org", "c.org", "d.org", "e.org", "f.org"};
    EXPECT_THAT(whyNotSuffixes({}), IsEmpty());
    EXPECT_THAT(whyNotSuffixes(suffixes), IsEmpty());
    suffixes.emplace_back("g.org");
    EXPECT_EQ(whyNotSuffixes(suffixes), "the resolver reads 6 suffixes, not 7");
    EXPECT_EQ(whyNotSuffixes({"a.org", "b.org", "A.ORG"}), "number 3 is there twice");
    EXPECT_THAT(whyNotSuffixes({"a.org", "b org"}), HasSubstr("number 2: "));
}

} // namespace
