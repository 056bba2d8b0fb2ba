#include "agent/persistence/NetworkdFile.h"
#include "tests/persistence/Plans.h"

#include <gmock/gmock.h>
#include <gtest/gtest.h>

namespace {

using namespace Orv::Agent;
using namespace Orv::Agent::Persistence;
using namespace Orv::Test;

using Texts = std::vector<std::string>;

/** "dhcp address gateway [servers] [domains]", "-" for what is absent. */
std::string shown(const NetworkdSettings& settings) {
    const auto list = [](const std::optional<Texts>& texts) { return texts ? testing::PrintToString(*texts) : "-"; };
    return settings.dhcp.value_or("-") + " " + (settings.address ? settings.address->text() : "-") + " " +
           (settings.gateway ? settings.gateway->text() : "-") + " " + list(settings.servers) + " " +
           list(settings.domains);
}

TEST(NetworkdFile, ReadsTheSettingsThatCanBeChanged) {
    const std::pair<const char*, const char*> cases[] = {
        {"", "- - - - -"},
        {"[Match]\nName=eth0\n", "- - - - -"},
        {"[Network]\nDHCP=yes\n", "yes - - - -"},
        {"[Network]\nDHCP = both\nDHCP=v4\n", "ipv4 - - - -"},
        {"[Network]\nDHCP=ipv6\n[Network]\nDHCP=none\n", "no - - - -"},
        {"[Link]\nDHCP=yes\nAddress=1.0.0.1/8\n", "- - - - -"},
        {"[Network]\nAddress=2001:db8::1/64\nAddress=10.0.0.1/8\nAddress=10.0.0.2/8\n", "- 10.0.0.1/8 - - -"},
        {"[Network]\nAddress=10.0.0.1\n", "- 10.0.0.1/8 - - -"},
        {"[Network]\nAddress=10.0.0.1/33\n", "- - - - -"},
        {"[Address]\nLabel=x\nAddress=10.0.0.1/8\n", "- 10.0.0.1/8 - - -"},
        {"[Network]\nGateway=fe80::1\nGateway=10.0.0.254\n", "- - 10.0.0.254 - -"},
        {"[Route]\nGateway=10.0.0.9\nDestination=10.9.0.0/16\n[Route]\nGateway=10.0.0.254\nMetric=5\n",
         "- - 10.0.0.254 - -"},
        {"[Route]\nGateway=_dhcp4\n", "- - - - -"},
        {"[Network]\nDNS=10.0.0.1 10.0.0.2\nDNS=::1\n", "- - - { \"10.0.0.1\", \"10.0.0.2\", \"::1\" } -"},
        {"[Network]\nDNS=10.0.0.1\nDNS=\n", "- - - {} -"},
        {"[Network]\nDNS=10.0.0.1\nDNS=\nDNS=10.0.0.2\n", "- - - { \"10.0.0.2\" } -"},
        {"[Network]\nDomains=a.org ~b.org\n", "- - - - { \"a.org\", \"~b.org\" }"},
        {"# [Network]\n;DHCP=yes\n  [Network]  \n  DHCP  =  yes  \r\n", "yes - - - -"},
        {"[Network]\nDNS=10.0.0.1 \\\n# c\n  10.0.0.2\n", "- - - { \"10.0.0.1\", \"10.0.0.2\" } -"},
        {"[Network]\nDNS=10.0.0.1 \\", "- - - { \"10.0.0.1\" } -"},
        {"[Network]\nnonsense\n=x\nDHCP", "- - - - -"},
        {"DHCP=yes\n", "- - - - -"},
    };
    for (const auto& [text, settings] : cases) {
        EXPECT_EQ(shown(readNetworkdSettings(text)), settings) << text;
    }
}

TEST(NetworkdFile, KeepsTheRestAsItStands) {
    EXPECT_EQ(
        restOf("# top\n[Match]\nName=eth0\n\n[Network]\n# lan\nDHCP=yes\nLLDP=yes\nAddress=10.0.0.1/8\n"
               "Address=2001:db8::1/64\nAddress=10.0.0.2/8\nGateway=10.0.0.254\nGateway=fe80::1\nDNS=10.0.0.53\n"
               "Domains=a\n[Address]\nAddress=10.0.0.3/8\n[Route]\nGateway=10.0.0.77\nDestination=10.9.0.0/16\n"
               "[DHCPv4]\nUseMTU=yes"),
        "# top\n[Network]\n# lan\nLLDP=yes\nAddress=2001:db8::1/64\nAddress=10.0.0.2/8\nGateway=fe80::1\n"
        "[Address]\nAddress=10.0.0.3/8\n[Route]\nGateway=10.0.0.77\nDestination=10.9.0.0/16\n"
        "[DHCPv4]\nUseMTU=yes\n");
    EXPECT_EQ(restOf("[Address]\nLabel=x\nAddress=10.0.0.1/8\n[Route]\nGateway=10.0.0.254\n[Link]\nMTUBytes=1400\n"),
              "[Link]\nMTUBytes=1400\n");
    EXPECT_EQ(restOf(""), "");
}

TEST(NetworkdFile, ReadsBackWhatItWrites) {
    NetworkdSettings settings;
    settings.dhcp = "no";
    settings.address = Ipv4Prefixed{ip("192.0.2.10"), 24};
    settings.gateway = ip("192.0.2.1");
    settings.servers = Texts{"192.0.2.53", "2001:db8::53"};
    settings.domains = Texts{"a.org", "~b.org"};
    const std::string rest = "[Network]\nAddress=10.0.0.1/8\nDHCP=yes\n";
    EXPECT_EQ(dropInText(settings),
              "# Written by marlo; every change of the adapter writes it anew.\n[Network]\nDHCP=no\n"
              "Address=192.0.2.10/24\nGateway=192.0.2.1\nDNS=\nDNS=192.0.2.53 2001:db8::53\n"
              "Domains=\nDomains=a.org ~b.org\n");
    for (const NetworkdSettings& written :
         {settings, NetworkdSettings{}, NetworkdSettings{"yes", {}, {}, Texts{}, Texts{}}}) {
        EXPECT_EQ(shown(readOwnSettings(dropInText(written))), shown(written));
        const std::string unit = unitText("eth0", written, rest);
        EXPECT_EQ(shown(readOwnSettings(unit)), shown(written));
        EXPECT_EQ(restOfOwn(unit), rest);
        EXPECT_THAT(unit, testing::HasSubstr("\n[Match]\nName=eth0\n\n[Network]\n"));
    }
    EXPECT_EQ(restOfOwn(unitText("eth0", settings, "")), "");
}

TEST(NetworkdFile, ChangesIpv4AndLeavesDhcpv6) {
    const auto dhcpAfter = [](const char* before, const AdapterSettings& wanted) {
        NetworkdSettings inForce;
        inForce.dhcp = before;
        return shown(changed({}, inForce, wanted));
    };
    EXPECT_EQ(dhcpAfter("yes", fixedAt("10.0.0.1/8", "10.0.0.2")), "ipv6 10.0.0.1/8 10.0.0.2 - -");
    EXPECT_EQ(dhcpAfter("ipv4", fixedAt("10.0.0.1/8")), "no 10.0.0.1/8 - - -");
    EXPECT_EQ(dhcpAfter("ipv6", fixedAt("10.0.0.1/8")), "ipv6 10.0.0.1/8 - - -");
    EXPECT_EQ(dhcpAfter("no", leased()), "ipv4 - - - -");
    EXPECT_EQ(dhcpAfter("ipv6", leased()), "yes - - - -");
    EXPECT_EQ(dhcpAfter("yes", leased()), "yes - - - -");
    EXPECT_EQ(dhcpAfter("yes", fixedAt()), "ipv6 - - - -");
}

TEST(NetworkdFile, ChangesDomainsAsTheyAreRead) {
    NetworkdSettings inForce;
    inForce.domains = Texts{"a.org", "b.org", "~c.org"};
    EXPECT_EQ(changed({}, inForce, {std::nullopt, {"x.org", {}, {}}}).domains,
              (Texts{"x.org", "a.org", "b.org", "~c.org"}));
    EXPECT_EQ(changed({}, inForce, {std::nullopt, {"b.org", {}, {}}}).domains, (Texts{"b.org", "a.org", "~c.org"}));
    EXPECT_EQ(changed({}, inForce, {std::nullopt, {{}, {}, Texts{"y.org"}}}).domains, (Texts{"y.org", "~c.org"}));
    EXPECT_EQ(changed({}, inForce, {std::nullopt, {{}, {}, Texts{}}}).domains, (Texts{"~c.org"}));
    EXPECT_EQ(changed({}, inForce, {std::nullopt, {"x.org", {}, Texts{"y.org", "x.org"}}}).domains,
              (Texts{"x.org", "y.org", "~c.org"}));
    EXPECT_EQ(changed({}, inForce, {std::nullopt, {{}, Texts{"10.0.0.1"}, {}}}).domains, std::nullopt);
}

} // namespace
