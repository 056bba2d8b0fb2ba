#include "agent/linux/Resolver.h"
#include "tests/linux/TemporaryHost.h"

#include <gtest/gtest.h>

namespace Orv::Agent::Linux {
namespace {

using Test::TemporaryHost;
using Texts = std::vector<std::string>;

TEST(ResolvConf, isReadLineByLine) {
    const ResolverSettings settings = parseResolvConf("# made by hand\n"
                                                      "nameserver 192.0.2.53\n"
                                                      "nameserver\t2001:DB8::53  # second\n"
                                                      "nameserver fe80::53%eth0\n"
                                                      "search example.com corp.example.com\n"
                                                      "options ndots:2\n");
    EXPECT_EQ(settings.servers, (Texts{"192.0.2.53", "2001:DB8::53", "fe80::53%eth0"}));
    EXPECT_EQ(settings.suffixes, (Texts{"example.com", "corp.example.com"}));
    EXPECT_EQ(settings.domain, "");
}

TEST(ResolvConf, takesTheSuffixesFromTheLastLineThatSetsThem) {
    EXPECT_EQ(parseResolvConf("domain a.example\n").suffixes, Texts{"a.example"});
    EXPECT_EQ(parseResolvConf("search a b\nsearch c\n").suffixes, Texts{"c"});
    EXPECT_EQ(parseResolvConf("search a b\ndomain c\n").suffixes, Texts{"c"});
    const ResolverSettings both = parseResolvConf("domain a.example\nsearch b.example c.example\n");
    EXPECT_EQ(both.suffixes, (Texts{"b.example", "c.example"}));
    EXPECT_EQ(both.domain, "a.example");
}

TEST(ResolvConf, leavesOutWhatMeansNothing) {
    for (const char* text :
         {"", "\n\n", "nameserver\n", "nameserver one.two.three.four\n", "nameserver 1.2.3.4.5\n",
          "nameserver 1.2.3.4%eth0\n", " nameserver 192.0.2.1\n", ";nameserver 192.0.2.1\n",
          "#nameserver 192.0.2.1\n", "nameservers 192.0.2.1\n", "search\n", "search .\n", "\xff\xfe\x00\x01"}) {
        EXPECT_EQ(parseResolvConf(text), ResolverSettings()) << text;
    }
}

TEST(ResolvConf, needsNoEndOfItsLastLineAndNoUnixEnds) {
    EXPECT_EQ(parseResolvConf("nameserver 192.0.2.1").servers, Texts{"192.0.2.1"});
    EXPECT_EQ(parseResolvConf("nameserver 192.0.2.1\r\nnameserver 192.0.2.2\r\n").servers,
              (Texts{"192.0.2.1", "192.0.2.2"}));
}

TEST(ResolvConf, isBounded) {
    std::string text;
    for (int line = 0; line < 100; ++line) {
        text += "nameserver 192.0.2." + std::to_string(line) + "\n";
    }
    std::string search = "search";
    for (int word = 0; word < 100; ++word) {
        search += " d" + std::to_string(word);
    }
    const ResolverSettings settings = parseResolvConf(text + search);
    EXPECT_EQ(settings.servers.size(), ResolverSettings::mostServers);
    EXPECT_EQ(settings.suffixes.size(), ResolverSettings::mostSuffixes);
    EXPECT_EQ(parseResolvConf("domain " + std::string(255, 'd')).domain.size(), 255U);
    EXPECT_EQ(parseResolvConf("domain " + std::string(256, 'd')).domain, "");
    EXPECT_EQ(parseResolvConf("search " + std::string(256, 'd')).suffixes, Texts());
}

TEST(ResolvConf, comesOutClean) {
    EXPECT_EQ(parseResolvConf("domain a\x01\xff.example\n").domain, "a \xEF\xBF\xBD.example");
}

TEST(ResolvConf, givesTheServersBehindTheLocalStub) {
    const TemporaryHost host;
    host.write("/etc/resolv.conf", "nameserver 127.0.0.53\nsearch example.com\n");
    host.write("/run/systemd/resolve/resolv.conf", "nameserver 192.0.2.53\nnameserver 192.0.2.54\nsearch other\n");
    HostFiles files(host.root());
    const ResolverSettings settings = readResolvConf(files);
    EXPECT_EQ(settings.servers, (Texts{"192.0.2.53", "192.0.2.54"}));
    EXPECT_EQ(settings.suffixes, Texts{"example.com"});
}

TEST(ResolvConf, keepsTheStubWhenNothingIsKnownBehindItOrMoreIsNamed) {
    const TemporaryHost host;
    host.write("/etc/resolv.conf", "nameserver 127.0.0.53\n");
    HostFiles files(host.root());
    EXPECT_EQ(readResolvConf(files).servers, Texts{"127.0.0.53"});
    host.write("/run/systemd/resolve/resolv.conf", "nameserver 192.0.2.53\n");
    host.write("/etc/resolv.conf", "nameserver 127.0.0.53\nnameserver 192.0.2.1\n");
    EXPECT_EQ(readResolvConf(files).servers, (Texts{"127.0.0.53", "192.0.2.1"}));
}

TEST(ResolvConf, isFollowedToTheFileThatResolvconfMakes) {
    const TemporaryHost host;
    host.write("/run/resolvconf/resolv.conf", "nameserver 192.0.2.7\n");
    host.write("/etc/hosts", "");
    std::filesystem::create_symlink("../run/resolvconf/resolv.conf", host.at("/etc/resolv.conf"));
    HostFiles files(host.root());
    EXPECT_EQ(readResolvConf(files).servers, Texts{"192.0.2.7"});
    EXPECT_TRUE(files.changed()) << "the file was written a moment ago, and its times cannot be relied on yet";
}

TEST(ResolvConf, thatIsMissingOrNoFileSetsNothing) {
    const TemporaryHost host;
    HostFiles files(host.root());
    EXPECT_EQ(readResolvConf(files), ResolverSettings());
    std::filesystem::create_directories(host.at("/etc/resolv.conf"));
    EXPECT_EQ(readResolvConf(files), ResolverSettings());
}

TEST(LinkResolvers, areWhatTheServicesOfSystemdKeep) {
    const TemporaryHost host;
    host.write("/run/systemd/netif/links/3",
               "ADMIN_STATE=configured\nDNS=192.0.2.1 [2001:db8::1]:53 192.0.2.2:853#dns.example fe80::1%eth0\n"
               "DOMAINS=a.example ~. b.example\n");
    host.write("/run/systemd/netif/links/4", "ADMIN_STATE=unmanaged\n");
    host.write("/run/systemd/resolve/netif/5", "SERVERS=192.0.2.5\nDOMAINS=c.example\n");
    host.write("/run/systemd/resolve/netif/notanumber", "SERVERS=192.0.2.6\n");
    HostFiles files(host.root());
    const auto resolvers = readLinkResolvers(files);
    ASSERT_EQ(resolvers.size(), 2U);
    EXPECT_EQ(resolvers.at(3).servers, (Texts{"192.0.2.1", "2001:db8::1", "192.0.2.2", "fe80::1%eth0"}));
    EXPECT_EQ(resolvers.at(3).suffixes, (Texts{"a.example", "b.example"}));
    EXPECT_EQ(resolvers.at(5).servers, Texts{"192.0.2.5"});
    EXPECT_EQ(resolvers.at(5).domain, "c.example");
}

TEST(HostDomain, isBehindTheFirstDotOfTheName) {
    const TemporaryHost host;
    HostFiles files(host.root());
    EXPECT_EQ(readHostDomain(files, "web1.corp.example.com"), "corp.example.com");
    EXPECT_EQ(readHostDomain(files, "web1"), "");
}

TEST(HostDomain, isElseTheOneThatTheHostsFileGivesThisHost) {
    const TemporaryHost host;
    host.write("/etc/hosts", "127.0.0.1 localhost localhost.localdomain\n"
                             "# 127.0.1.1 web1.commented.example web1\n"
                             "192.0.2.9 web10.other.example web10\n"
                             "127.0.1.1\tweb1.example.com web1\n"
                             "192.0.2.8 web1.late.example web1\n");
    HostFiles files(host.root());
    EXPECT_EQ(readHostDomain(files, "web1"), "example.com");
    EXPECT_EQ(readHostDomain(files, "web2"), "");
}

} // namespace
} // namespace Orv::Agent::Linux
