#include "agent/linux/AddressMode.h"
#include "agent/linux/HostConfiguration.h"
#include "tests/linux/TemporaryHost.h"

#include <chrono>
#include <thread>

#include <gtest/gtest.h>

namespace Orv::Agent::Linux {
namespace {

using Test::TemporaryHost;
using Modes = std::map<std::string, AddressMode>;

Modes ifupdown(const TemporaryHost& host) {
    HostFiles files(host.root());
    return readIfupdown(files);
}

TEST(AddressMode, hasTheCodesOfTheTree) {
    EXPECT_EQ(static_cast<unsigned>(AddressMode::leased), 1U);
    EXPECT_EQ(static_cast<unsigned>(AddressMode::fixed), 3U);
}

TEST(Ifupdown, tellsTheMethodOfEachInterface) {
    const TemporaryHost host;
    host.write("/etc/network/interfaces", "auto lo eth0\n"
                                          "iface lo inet loopback\n"
                                          "iface eth0 inet dhcp\n"
                                          "iface eth0 inet6 auto\n"
                                          "\tiface  eth1   inet static\n"
                                          "    address 10.0.0.1/24\n"
                                          "iface eth2 inet manual\n"
                                          "# iface eth3 inet dhcp\n"
                                          "iface eth4 inet \\\n"
                                          "  dhcp\n"
                                          "iface eth5 inet6 dhcp\n"
                                          "iface eth6 inet\n");
    EXPECT_EQ(ifupdown(host),
              (Modes{{"eth0", AddressMode::leased}, {"eth1", AddressMode::fixed}, {"eth4", AddressMode::leased}}));
}

TEST(Ifupdown, goesByTheFirstStanzaOfAnInterface) {
    const TemporaryHost host;
    host.write("/etc/network/interfaces", "iface eth0 inet dhcp\niface eth0 inet static\n");
    EXPECT_EQ(ifupdown(host), (Modes{{"eth0", AddressMode::leased}}));
}

TEST(Ifupdown, followsSourcesOfBothKinds) {
    const TemporaryHost host;
    host.write("/etc/network/interfaces", "source interfaces.d/*.cfg\nsource-directory /etc/network/more\n");
    host.write("/etc/network/interfaces.d/a.cfg", "iface eth0 inet dhcp\n");
    host.write("/etc/network/interfaces.d/b.old", "iface eth1 inet dhcp\n");
    host.write("/etc/network/more/plain_name-1", "iface eth2 inet static\n");
    host.write("/etc/network/more/backup~", "iface eth3 inet static\n");
    EXPECT_EQ(ifupdown(host), (Modes{{"eth0", AddressMode::leased}, {"eth2", AddressMode::fixed}}));
}

TEST(Ifupdown, comesToAnEndWhenFilesSourceOneAnother) {
    const TemporaryHost host;
    host.write("/etc/network/interfaces", "source interfaces interfaces\niface eth0 inet dhcp\n");
    EXPECT_EQ(ifupdown(host), (Modes{{"eth0", AddressMode::leased}}));
}

TEST(Ifupdown, withoutItsFileSaysNothing) {
    const TemporaryHost host;
    EXPECT_TRUE(ifupdown(host).empty());
}

TEST(NetworkUnit, tellsTheMode) {
    const std::vector<std::pair<const char*, std::optional<AddressMode>>> cases{
        {"[Network]\nDHCP=yes\n", AddressMode::leased},
        {"[Network]\nDHCP = ipv4 \n", AddressMode::leased},
        {"[Network]\nDHCP=ipv6\n", std::nullopt},
        {"[Network]\nDHCP=no\nAddress=10.0.0.1/24\n", AddressMode::fixed},
        {"[Network]\nAddress=10.0.0.1/24\nDHCP=yes\n", AddressMode::leased},
        {"[Network]\nDHCP=yes\nDHCP=no\n", std::nullopt},
        {"[Address]\nAddress=10.0.0.1/24\n", AddressMode::fixed},
        {"[Network]\nAddress=fd00::1/64\n", std::nullopt},
        {"[DHCP]\nDHCP=yes\n", std::nullopt},
        {"[Network]\n#DHCP=yes\n;DHCP=yes\n", std::nullopt},
        {"DHCP=yes\n", std::nullopt},
        {"[Network\nDHCP\n=yes\n", std::nullopt},
        {"", std::nullopt},
    };
    for (const auto& [text, expected] : cases) {
        NetworkUnit unit;
        parseNetworkUnit(text, unit);
        EXPECT_EQ(unit.mode(), expected) << text;
    }
}

TEST(NetworkUnit, matchesByWhatIsKnownAndByNothingElse) {
    const InterfaceFacts interface { 7, "enp3s0", "02:00:00:00:00:01", "02:00:00:00:00:02", "veth", true };
    const std::vector<std::pair<const char*, bool>> cases{
        {"Name=enp3s0", true},
        {"Name=eth* en*", true},
        {"Name=eth*", false},
        {"Name=eth*\nName=enp?s0", true},
        {"Name=en*\nName=\nName=eth*", false},
        {"Name=!eth* wl*", true},
        {"Name=!en*", false},
        {"MACAddress=02-00-00-00-00-01", true},
        {"MACAddress=02:00:00:00:00:03 02:00:00:00:00:01", true},
        {"MACAddress=02:00:00:00:00:02", false},
        {"PermanentMACAddress=02:00:00:00:00:02", true},
        {"Type=ether", true},
        {"Type=bridge", false},
        {"Kind=veth", true},
        {"Kind=bridge", false},
        {"Name=en*\nDriver=e1000e", false},
        {"Host=web1", false},
        {"", false},
    };
    for (const auto& [text, expected] : cases) {
        NetworkUnit unit;
        parseNetworkUnit("[Match]\n" + std::string(text), unit);
        EXPECT_EQ(unit.matches(interface), expected) << text;
    }
}

std::optional<AddressMode> networkdMode(const TemporaryHost& host, const std::string& name, int index = 7) {
    HostFiles files(host.root());
    return readNetworkd(files).modeOf({index, name, "", "", "", true});
}

TEST(Networkd, goesByTheFirstUnitThatMatchesInTheOrderOfNames) {
    const TemporaryHost host;
    host.write("/usr/lib/systemd/network/10-first.network", "[Match]\nName=eth0\n[Network]\nDHCP=yes\n");
    host.write("/etc/systemd/network/20-second.network", "[Match]\nName=eth*\n[Network]\nAddress=10.0.0.1/24\n");
    EXPECT_EQ(networkdMode(host, "eth0"), AddressMode::leased);
    EXPECT_EQ(networkdMode(host, "eth1"), AddressMode::fixed);
    EXPECT_EQ(networkdMode(host, "lan0"), std::nullopt);
}

TEST(Networkd, readsAUnitFromTheDirectoryOfHighestPriority) {
    const TemporaryHost host;
    host.write("/usr/lib/systemd/network/10-a.network", "[Match]\nName=eth0\n[Network]\nDHCP=yes\n");
    host.write("/run/systemd/network/10-a.network", "[Match]\nName=eth0\n[Network]\nAddress=10.0.0.1/24\n");
    EXPECT_EQ(networkdMode(host, "eth0"), AddressMode::fixed);
    host.write("/etc/systemd/network/10-a.network", "");
    EXPECT_EQ(networkdMode(host, "eth0"), std::nullopt) << "an empty file masks the others";
}

TEST(Networkd, readsTheDropInsOfAUnit) {
    const TemporaryHost host;
    host.write("/usr/lib/systemd/network/10-a.network", "[Match]\nName=eth0\n[Network]\nDHCP=yes\n");
    host.write("/etc/systemd/network/10-a.network.d/50-off.conf", "[Network]\nDHCP=no\nAddress=10.0.0.1/24\n");
    EXPECT_EQ(networkdMode(host, "eth0"), AddressMode::fixed);
    host.write("/run/systemd/network/10-a.network.d/60-on.conf", "[Network]\nDHCP=ipv4\n");
    EXPECT_EQ(networkdMode(host, "eth0"), AddressMode::leased);
    host.write("/etc/systemd/network/10-a.network.d/60-on.conf", "");
    EXPECT_EQ(networkdMode(host, "eth0"), AddressMode::fixed) << "the drop-in of that name is hidden";
}

TEST(Networkd, believesItsOwnStateBeforeItsFiles) {
    const TemporaryHost host;
    host.write("/etc/systemd/network/10-a.network", "[Match]\nName=eth0\n[Network]\nDHCP=yes\n");
    host.write("/etc/systemd/network/20-b.network", "[Match]\nName=other\n[Network]\nAddress=10.0.0.1/24\n");
    host.write("/run/systemd/netif/links/7", "NETWORK_FILE=/etc/systemd/network/20-b.network\n");
    host.write("/run/systemd/netif/links/8", "ADMIN_STATE=unmanaged\n");
    EXPECT_EQ(networkdMode(host, "eth0", 7), AddressMode::fixed);
    EXPECT_EQ(networkdMode(host, "eth0", 8), std::nullopt);
    EXPECT_EQ(networkdMode(host, "eth0", 9), AddressMode::leased);
    host.write("/run/systemd/netif/leases/8", "ADDRESS=192.0.2.8\n");
    EXPECT_EQ(networkdMode(host, "eth0", 8), AddressMode::leased);
}

/** File times must be old enough to be relied on before a change is looked for. */
void letTimesSettle() {
    std::this_thread::sleep_for(std::chrono::milliseconds(150));
}

TEST(HostConfiguration, isReadAgainWhenAFileChanges) {
    const TemporaryHost host;
    host.write("/etc/resolv.conf", "nameserver 192.0.2.1\n");
    HostConfiguration configuration(host.root());
    EXPECT_TRUE(configuration.refresh());
    EXPECT_FALSE(configuration.refresh());
    host.write("/etc/resolv.conf", "nameserver 192.0.2.2\n");
    EXPECT_TRUE(configuration.refresh()) << "the same size, within the same step of the file's times";
    EXPECT_EQ(configuration.resolverOf(2).servers, std::vector<std::string>{"192.0.2.2"});
    letTimesSettle();
    EXPECT_FALSE(configuration.refresh());
    host.write("/etc/resolv.conf", "nameserver 192.0.2.3\n");
    EXPECT_TRUE(configuration.refresh());
}

TEST(HostConfiguration, noticesFilesThatComeAndGo) {
    const TemporaryHost host;
    host.write("/etc/network/interfaces", "source interfaces.d/*\n");
    host.write("/etc/network/interfaces.d/a", "iface eth0 inet dhcp\n");
    std::filesystem::create_directories(host.at("/etc/systemd/network"));
    HostConfiguration configuration(host.root());
    configuration.refresh();
    letTimesSettle();
    EXPECT_FALSE(configuration.refresh());

    host.write("/etc/network/interfaces.d/b", "iface eth1 inet dhcp\n");
    EXPECT_TRUE(configuration.refresh());
    EXPECT_EQ(configuration.modeOf({3, "eth1", "", "", "", true}), AddressMode::leased);

    host.write("/etc/systemd/network/x.network", "[Match]\nName=eth2\n[Network]\nDHCP=yes\n");
    EXPECT_TRUE(configuration.refresh());
    EXPECT_EQ(configuration.modeOf({4, "eth2", "", "", "", true}), AddressMode::leased);

    host.write("/etc/systemd/network/x.network.d/off.conf", "[Network]\nDHCP=no\n");
    EXPECT_TRUE(configuration.refresh());
    EXPECT_EQ(configuration.modeOf({4, "eth2", "", "", "", true}), std::nullopt);

    std::filesystem::remove(host.at("/etc/network/interfaces.d/a"));
    EXPECT_TRUE(configuration.refresh());
    EXPECT_EQ(configuration.modeOf({2, "eth0", "", "", "", true}), std::nullopt);
}

TEST(HostConfiguration, givesAnInterfaceItsOwnResolverAndElseTheHosts) {
    const TemporaryHost host;
    host.write("/etc/resolv.conf", "nameserver 192.0.2.1\nsearch host.example\n");
    host.write("/run/systemd/netif/links/3", "DNS=192.0.2.3\nDOMAINS=link.example\n");
    HostConfiguration configuration(host.root());
    configuration.refresh();
    EXPECT_EQ(configuration.resolverOf(2).servers, std::vector<std::string>{"192.0.2.1"});
    EXPECT_EQ(configuration.resolverOf(3).servers, std::vector<std::string>{"192.0.2.3"});
    EXPECT_EQ(configuration.resolverOf(3).suffixes, std::vector<std::string>{"link.example"});
    EXPECT_EQ(configuration.resolverOf(3).domain, "link.example");
}

TEST(HostFiles, countsAFileThatIsTooLargeAsAbsent) {
    const TemporaryHost host;
    HostFiles files(host.root());
    host.write("/etc/large", std::string(HostFiles::largestFile, 'x'));
    EXPECT_EQ(files.read("/etc/large").value_or("").size(), HostFiles::largestFile);
    host.write("/etc/large", std::string(HostFiles::largestFile + 1, 'x'));
    EXPECT_EQ(files.read("/etc/large"), std::nullopt);
}

} // namespace
} // namespace Orv::Agent::Linux
