#include "agent/persistence/Ifupdown.h"
#include "tests/persistence/Plans.h"

#include <filesystem>

#include <gmock/gmock.h>
#include <gtest/gtest.h>

namespace {

using namespace Orv::Agent;
using namespace Orv::Agent::Persistence;
using namespace Orv::Test;
using testing::HasSubstr;

constexpr const char* mainFile = "/etc/network/interfaces";

struct IfupdownTest : testing::Test {
    FileEdits plan(const AdapterSettings& wanted, const std::string& interface = "eth0") {
        return Ifupdown(environment).plan(interfaceNamed(interface), wanted);
    }

    /** The main file after the change; "unchanged" without an edit. */
    std::string planned(const std::string& before, const AdapterSettings& wanted) {
        host.write(mainFile, before);
        const FileEdits edits = plan(wanted);
        if (edits.empty()) {
            return "unchanged";
        }
        EXPECT_EQ(edits.size(), 1U);
        EXPECT_EQ(edits[0].path, host.at(mainFile));
        EXPECT_EQ(edits[0].before, before);
        return edits[0].after.value_or("absent");
    }

    std::string refusal(const std::string& before, const AdapterSettings& wanted) {
        host.write(mainFile, before);
        return messageOf([&] { plan(wanted); });
    }

    static AdapterSettings names(NameSettings settings) { return {std::nullopt, std::move(settings)}; }

    TemporaryHost host;
    Environment environment = environmentAt(host.root());
};

TEST_F(IfupdownTest, EditsAStaticStanzaInTheFormThatItHas) {
    const std::pair<const char*, const char*> cases[] = {
        {"iface eth0 inet static\n address 10.0.0.1/8\n gateway 10.0.0.2\n",
         "iface eth0 inet static\n address 192.0.2.10/24\n gateway 192.0.2.1\n"},
        {"iface eth0 inet static\n\taddress 10.0.0.1\n\tnetmask 255.0.0.0\n",
         "iface eth0 inet static\n\taddress 192.0.2.10\n\tnetmask 255.255.255.0\n\tgateway 192.0.2.1\n"},
        {"iface eth0 inet static\n address 10.0.0.1\n netmask 8\n",
         "iface eth0 inet static\n address 192.0.2.10\n netmask 24\n gateway 192.0.2.1\n"},
        {"iface eth0 inet static\n address 10.0.0.1/8\n netmask 255.0.0.0\n",
         "iface eth0 inet static\n address 192.0.2.10/24\n netmask 255.255.255.0\n gateway 192.0.2.1\n"},
        {"iface eth0 inet static\n address 10.0.0.1\n", "iface eth0 inet static\n address 192.0.2.10/24\n"
                                                        " gateway 192.0.2.1\n"},
        {"iface eth0 inet static\n address 10.0.0.1/8\n broadcast 10.255.255.255\n network 10.0.0.0\n mtu 1400\n",
         "iface eth0 inet static\n address 192.0.2.10/24\n broadcast 192.0.2.255\n network 192.0.2.0\n"
         " gateway 192.0.2.1\n mtu 1400\n"},
        {"iface eth0 inet static\n address 10.0.0.1/8\n broadcast +\n",
         "iface eth0 inet static\n address 192.0.2.10/24\n broadcast +\n gateway 192.0.2.1\n"},
        {"iface eth0 inet dhcp\n hostname me\n",
         "iface eth0 inet static\n address 192.0.2.10/24\n gateway 192.0.2.1\n"
         " hostname me\n"},
        {"iface eth0 inet manual\n", "iface eth0 inet static\n    address 192.0.2.10/24\n    gateway 192.0.2.1\n"},
    };
    for (const auto& [before, after] : cases) {
        EXPECT_EQ(planned(before, fixedAt("192.0.2.10/24", "192.0.2.1")), after);
        EXPECT_EQ(planned(after, fixedAt("192.0.2.10/24", "192.0.2.1")), "unchanged");
    }
}

TEST_F(IfupdownTest, RemovesAGatewayThatIsNotWanted) {
    EXPECT_EQ(
        planned("iface eth0 inet static\n address 10.0.0.1/8\n gateway 10.0.0.2\n up x\n", fixedAt("10.0.0.1/8")),
        "iface eth0 inet static\n address 10.0.0.1/8\n up x\n");
}

TEST_F(IfupdownTest, LeavesNoStaticAddressBehindForDhcp) {
    EXPECT_EQ(
        planned("auto eth0\niface eth0 inet static\n # ours\n address 10.0.0.1\n netmask 255.0.0.0\n"
                " network 10.0.0.0\n broadcast 10.255.255.255\n gateway 10.0.0.2\n mtu 1400\n up ip route add x\n",
                leased()),
        "auto eth0\niface eth0 inet dhcp\n # ours\n mtu 1400\n up ip route add x\n");
    EXPECT_EQ(planned("iface eth0 inet dhcp\n", leased()), "unchanged");
    EXPECT_EQ(planned("iface eth0 inet bootp\n", leased()), "unchanged");
}

TEST_F(IfupdownTest, SaysManualWhereStaticHasNoAddress) {
    EXPECT_EQ(planned("iface eth0 inet dhcp\n", fixedAt()), "iface eth0 inet manual\n");
    EXPECT_EQ(planned("", fixedAt()), "unchanged");
}

TEST_F(IfupdownTest, LeavesOtherStanzasAndAddressesAlone) {
    const std::string before =
        "# top\nauto lo eth0\niface lo inet loopback\n\niface eth0 inet6 static\n address 2001:db8::1/64\n"
        "\niface eth0 inet static\n address 10.0.0.1/8\n\n# second\niface eth0 inet static\n"
        " address 10.1.0.1/16\niface eth0:1 inet static\n address 10.2.0.1/16\n"
        "iface eth1 inet static\n address 10.0.0.1/8\n";
    std::string after = before;
    after.replace(after.find("10.0.0.1/8"), 10, "10.0.0.9/8");
    EXPECT_EQ(planned(before, fixedAt("10.0.0.9/8")), after);
}

TEST_F(IfupdownTest, PrefersAStanzaThatSetsAnAddressToAManualOne) {
    EXPECT_EQ(planned("iface eth0 inet manual\n up x\niface eth0 inet static\n address 10.0.0.1/8\n",
                      fixedAt("10.0.0.2/8")),
              "iface eth0 inet manual\n up x\niface eth0 inet static\n address 10.0.0.2/8\n");
}

TEST_F(IfupdownTest, AddsAStanzaWhereThereIsNone) {
    EXPECT_EQ(planned("", leased()), "auto eth0\niface eth0 inet dhcp\n");
    EXPECT_EQ(planned("auto lo\niface lo inet loopback\n", fixedAt("192.0.2.10/24", "192.0.2.1")),
              "auto lo\niface lo inet loopback\n\nauto eth0\niface eth0 inet static\n    address 192.0.2.10/24\n"
              "    gateway 192.0.2.1\n");
    EXPECT_EQ(planned("# no end", leased()), "# no end\n\nauto eth0\niface eth0 inet dhcp\n");
    EXPECT_EQ(planned("auto lo\nallow-hotplug eth1\niface eth1 inet dhcp\n", leased()),
              "auto lo\nallow-hotplug eth1\niface eth1 inet dhcp\n\nallow-hotplug eth0\niface eth0 inet dhcp\n");
    EXPECT_EQ(planned("auto eth0\niface eth0 inet6 auto\n", leased()),
              "auto eth0\niface eth0 inet6 auto\n\niface eth0 inet dhcp\n");
    EXPECT_EQ(planned("auto /eth*\n", leased()), "auto /eth*\n\niface eth0 inet dhcp\n");
}

TEST_F(IfupdownTest, MakesTheFileWhereThereIsNone) {
    const FileEdits edits = plan(leased());
    ASSERT_EQ(edits.size(), 1U);
    EXPECT_EQ(edits[0], (FileEdit{host.at(mainFile), std::nullopt, "auto eth0\niface eth0 inet dhcp\n"}));
}

TEST_F(IfupdownTest, EditsTheFileThatHasTheStanza) {
    host.write(mainFile, "source /etc/network/interfaces.d/*\nsource-directory more\niface eth1 inet dhcp\n");
    host.write("/etc/network/interfaces.d/eth0", "iface eth0 inet dhcp\n");
    host.write("/etc/network/more/eth2", "source deeper/x\n");
    host.write("/etc/network/more/eth2.bak", "iface eth2 inet dhcp\n");
    host.write("/etc/network/more/deeper/x", "iface eth2 inet dhcp\n");
    EXPECT_EQ(plan(fixedAt("10.0.0.1/8")).at(0).path, host.at("/etc/network/interfaces.d/eth0"));
    EXPECT_EQ(plan(fixedAt("10.0.0.1/8"), "eth1").at(0).path, host.at(mainFile));
    EXPECT_EQ(plan(fixedAt("10.0.0.1/8"), "eth2").at(0).path, host.at("/etc/network/more/deeper/x"));
    EXPECT_TRUE(Ifupdown::knows(interfaceNamed("eth2"), environment));
    EXPECT_FALSE(Ifupdown::knows(interfaceNamed("eth3"), environment));
}

TEST_F(IfupdownTest, RefusesWhatItCannotReadToTheEnd) {
    host.write(mainFile, "source loop\n");
    host.write("/etc/network/loop", "source loop\n");
    EXPECT_EQ(plan(leased()).size(), 1U) << "a file that sources itself is read once";
    for (int i = 0; i < 12; ++i) {
        host.write("/etc/network/n" + std::to_string(i), "source n" + std::to_string(i + 1) + "\n");
    }
    EXPECT_THAT(refusal("source n0\n", leased()), HasSubstr("without end"));
    host.write(mainFile, "");
    std::filesystem::remove(host.at(mainFile));
    std::filesystem::create_directory(host.at(mainFile));
    EXPECT_THAT(messageOf([&] { plan(leased()); }), HasSubstr("interfaces"));
}

TEST_F(IfupdownTest, RefusesWhatTheFileAloneDoesNotDecide) {
    EXPECT_THAT(refusal("mapping eth*\n script x\niface home inet dhcp\n", leased()), HasSubstr("mapping"));
    EXPECT_THAT(refusal("auto eth0=home\niface home inet dhcp\n", leased()), HasSubstr("logical name"));
    EXPECT_THAT(refusal("auto /eth*=home\niface home inet dhcp\n", leased()), HasSubstr("logical name"));
    EXPECT_THAT(refusal("iface t inet static\n mtu 1\niface eth0 inet static inherits t\n", leased()),
                HasSubstr("inherits"));
    EXPECT_THAT(refusal("iface eth0 inet ppp\n provider x\n", leased()), HasSubstr("\"ppp\""));
    EXPECT_EQ(
        planned("mapping wlan*\n script x\nauto eth1=home\niface eth0 inet static\n address 1.0.0.1/8\n", leased()),
        "mapping wlan*\n script x\nauto eth1=home\niface eth0 inet dhcp\n");
}

TEST_F(IfupdownTest, RefusesAFormInWhichAnEditWouldBeLost) {
    EXPECT_THAT(refusal("iface eth0 inet static\\", fixedAt("10.0.0.1/8")), HasSubstr("cannot be edited"));
}

TEST_F(IfupdownTest, AddsAStanzaBehindALineThatGoesOn) {
    EXPECT_EQ(planned("auto lo \\\n", leased()), "auto lo \\\n\nauto eth0\niface eth0 inet dhcp\n");
    EXPECT_EQ(planned("auto lo \\", leased()), "auto lo \\\n\nauto eth0\niface eth0 inet dhcp\n");
}

TEST_F(IfupdownTest, KeepsNameServiceWhereTheStanzaHasIt) {
    const NameSettings wanted{"c.org", std::vector<std::string>{"192.0.2.53", "2001:db8::53"},
                              std::vector<std::string>{"a.org", "b.org"}};
    EXPECT_EQ(
        planned("iface eth0 inet dhcp\n dns-nameservers 10.0.0.1\n dns-search x\n dns-domain y\n", names(wanted)),
        "iface eth0 inet dhcp\n dns-nameservers 192.0.2.53 2001:db8::53\n dns-search a.org b.org\n dns-domain "
        "c.org\n");
    EXPECT_EQ(planned("iface eth0 inet dhcp\n dns-nameserver 10.0.0.1\n dns-nameserver 10.0.0.2\n", names(wanted)),
              "iface eth0 inet dhcp\n dns-nameservers 192.0.2.53 2001:db8::53\n");
    EXPECT_EQ(planned("iface eth0 inet dhcp\n dns-nameservers 10.0.0.1\n dns-search x\n mtu 1\n",
                      names({{}, std::vector<std::string>{}, std::vector<std::string>{}})),
              "iface eth0 inet dhcp\n mtu 1\n");
    EXPECT_EQ(planned("iface eth0 inet dhcp\n", names(wanted)), "unchanged") << "nobody would read it";
    EXPECT_EQ(planned("", names(wanted)), "unchanged");
}

TEST_F(IfupdownTest, AddsNameServiceWhereSomebodyReadsIt) {
    const NameSettings wanted{"c.org", std::vector<std::string>{"192.0.2.53"},
                              std::vector<std::string>{"a.org", "b.org"}};
    const std::string after =
        "iface eth0 inet dhcp\n mtu 1\n dns-nameservers 192.0.2.53\n dns-search a.org b.org\n dns-domain c.org\n";
    host.write("/sbin/resolvconf", "");
    environment.commands.resolvconf = {host.at("/sbin/resolvconf").string()};
    EXPECT_EQ(planned("iface eth0 inet dhcp\n mtu 1\n", names(wanted)), after);
    environment.commands = noCommands();
    host.write("/etc/network/if-up.d/resolved", "");
    host.write("/run/systemd/resolve/stub-resolv.conf", "");
    EXPECT_EQ(planned("iface eth0 inet dhcp\n mtu 1\n", names(wanted)), after);
}

TEST_F(IfupdownTest, TakesTheChangeToDhcpAndBackWithoutATrace) {
    const std::string before =
        "# top\nauto eth0\niface eth0 inet static\n\taddress 192.0.2.10/24\n\tgateway 192.0.2.1\n"
        "\tup x\n# end\n";
    const std::string between = planned(before, leased());
    EXPECT_EQ(planned(between, fixedAt("192.0.2.10/24", "192.0.2.1")), before);
}

} // namespace
