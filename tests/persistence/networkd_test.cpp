#include "agent/persistence/Networkd.h"
#include "tests/persistence/Plans.h"

#include <filesystem>

#include <gmock/gmock.h>
#include <gtest/gtest.h>

namespace {

using namespace Orv::Agent;
using namespace Orv::Agent::Persistence;
using namespace Orv::Test;
using testing::HasSubstr;
using testing::Not;

constexpr const char* unit = "/etc/systemd/network/10-lan.network";
constexpr const char* dropIn = "/etc/systemd/network/10-lan.network.d/50-marlo.conf";
constexpr const char* ownUnit = "/etc/systemd/network/05-marlo-eth0.network";

struct NetworkdTest : testing::Test {
    FileEdits plan(const AdapterSettings& wanted) { return Networkd(environment).plan(interface, wanted); }

    /** Plans, applies, and says which files changed. */
    std::vector<std::string> change(const AdapterSettings& wanted) {
        const FileEdits edits = plan(wanted);
        applied(edits);
        std::vector<std::string> paths;
        for (const FileEdit& edit : edits) {
            paths.push_back((edit.after ? "" : "-") + edit.path.substr(host.root().size()));
        }
        EXPECT_EQ(plan(wanted), FileEdits{}) << "a second time";
        return paths;
    }

    [[nodiscard]] std::string text(const std::string& path) const {
        return std::filesystem::exists(host.at(path)) ? TemporaryFile::readFrom(host.at(path)) : "absent";
    }

    [[nodiscard]] std::optional<AddressMode> modeRead() const {
        Linux::HostFiles files(host.root());
        return Linux::readNetworkd(files).modeOf(interface);
    }

    static AdapterSettings servers(std::vector<std::string> list) {
        return {std::nullopt, {{}, std::move(list), {}}};
    }

    TemporaryHost host;
    Environment environment = environmentAt(host.root());
    InterfaceFacts interface = interfaceNamed("eth0");
};

TEST_F(NetworkdTest, MakesAUnitWhereThereIsNone) {
    EXPECT_THAT(change(fixedAt("192.0.2.10/24", "192.0.2.1")), testing::ElementsAre(ownUnit));
    EXPECT_THAT(text(ownUnit), HasSubstr("[Match]\nName=eth0\n\n[Network]\nDHCP=no\nAddress=192.0.2.10/24\n"
                                         "Gateway=192.0.2.1\n"));
    EXPECT_EQ(modeRead(), AddressMode::fixed);
}

TEST_F(NetworkdTest, EditsItsOwnUnitWithTheNextChange) {
    change(fixedAt("192.0.2.10/24", "192.0.2.1"));
    change(servers({"192.0.2.53"}));
    EXPECT_THAT(change(leased()), testing::ElementsAre(ownUnit));
    EXPECT_THAT(text(ownUnit), HasSubstr("\n[Network]\nDHCP=ipv4\nDNS=192.0.2.53\n"));
    EXPECT_THAT(text(ownUnit), Not(HasSubstr("192.0.2.10")));
    EXPECT_EQ(modeRead(), AddressMode::leased);
}

TEST_F(NetworkdTest, AddsADropInToAUnitForThisInterfaceAlone) {
    const std::string base = "[Match]\nName=eth0\n[Network]\nDHCP=yes\nLLDP=yes\n";
    host.write(unit, base);
    EXPECT_THAT(change(fixedAt("192.0.2.10/24", "192.0.2.1")), testing::ElementsAre(dropIn));
    EXPECT_THAT(text(dropIn), HasSubstr("[Network]\nDHCP=ipv6\nAddress=192.0.2.10/24\nGateway=192.0.2.1\n"));
    EXPECT_EQ(modeRead(), AddressMode::fixed);
    EXPECT_THAT(change(leased()), testing::ElementsAre(dropIn));
    EXPECT_THAT(text(dropIn), HasSubstr("[Network]\nDHCP=yes\n"));
    EXPECT_THAT(text(dropIn), Not(HasSubstr("Address")));
    EXPECT_EQ(modeRead(), AddressMode::leased);
    EXPECT_EQ(text(unit), base);
}

TEST_F(NetworkdTest, KnowsAUnitForThisInterfaceByItsAddressToo) {
    for (const char* match : {"MACAddress=02:00:5e:00:00:01", "PermanentMACAddress=02:00:5e:00:00:99"}) {
        host.write(unit, std::string("[Match]\n") + match + "\n[Network]\nDHCP=yes\n");
        interface.permanentAddress = "02:00:5e:00:00:99";
        EXPECT_EQ(plan(fixedAt("192.0.2.10/24")).at(0).path, host.at(dropIn)) << match;
    }
}

TEST_F(NetworkdTest, ReplacesAUnitWhoseAddressHasToGo) {
    const std::string base = "[Match]\nName=eth0\n[Network]\nAddress=10.0.0.1/8\nAddress=2001:db8::1/64\n"
                             "Gateway=10.0.0.254\nDNS=10.0.0.53\n[Address]\nAddress=10.0.0.2/8\n";
    host.write(unit, base);
    EXPECT_THAT(change(fixedAt("192.0.2.10/24")), testing::ElementsAre(ownUnit));
    EXPECT_THAT(text(ownUnit), HasSubstr("\n[Network]\nDHCP=no\nAddress=192.0.2.10/24\nDNS=10.0.0.53\n"));
    EXPECT_THAT(text(ownUnit), HasSubstr("Address=2001:db8::1/64\n[Address]\nAddress=10.0.0.2/8\n"));
    EXPECT_THAT(text(ownUnit), Not(HasSubstr("10.0.0.1/8")));
    EXPECT_THAT(text(ownUnit), Not(HasSubstr("10.0.0.254")));
    EXPECT_EQ(text(unit), base);
    change(leased());
    EXPECT_THAT(text(ownUnit), HasSubstr("\n[Network]\nDHCP=ipv4\nDNS=10.0.0.53\n"));
    EXPECT_THAT(text(ownUnit), HasSubstr("[Address]\nAddress=10.0.0.2/8\n")) << "secondary addresses stay";
    EXPECT_EQ(modeRead(), AddressMode::leased);
}

TEST_F(NetworkdTest, KeepsADropInWhereTheUnitHasTheAddressAlready) {
    host.write(unit, "[Match]\nName=eth0\n[Network]\nAddress=10.0.0.1/8\n");
    EXPECT_THAT(change(fixedAt("10.0.0.1/8", "10.0.0.254")), testing::ElementsAre(dropIn));
    EXPECT_THAT(text(dropIn), HasSubstr("[Network]\nDHCP=no\nGateway=10.0.0.254\n"));
}

TEST_F(NetworkdTest, ReplacesADropInOfItsOwnTogetherWithTheUnit) {
    host.write(unit, "[Match]\nName=eth0\n[Network]\nAddress=10.0.0.1/8\n");
    change(servers({"192.0.2.53"}));
    EXPECT_THAT(change(leased()), testing::ElementsAre(ownUnit, std::string("-") + dropIn));
    EXPECT_THAT(text(ownUnit), HasSubstr("\n[Network]\nDHCP=ipv4\nDNS=192.0.2.53\n"));
}

TEST_F(NetworkdTest, GivesAnInterfaceOfASharedUnitAUnitOfItsOwn) {
    const std::string base = "[Match]\nName=eth*\n[Network]\nDHCP=yes\nLLDP=yes\n";
    host.write(unit, base);
    host.write("/run/systemd/network/10-lan.network.d/20-mtu.conf", "[Link]\nMTUBytes=1400\n");
    EXPECT_THAT(change(fixedAt("192.0.2.10/24")), testing::ElementsAre(ownUnit));
    EXPECT_THAT(text(ownUnit), HasSubstr("DHCP=ipv6\nAddress=192.0.2.10/24\n"));
    EXPECT_THAT(text(ownUnit), HasSubstr("[Network]\nLLDP=yes\n"));
    EXPECT_THAT(text(ownUnit), HasSubstr("[Link]\nMTUBytes=1400\n"));
    EXPECT_EQ(text(unit), base);
}

TEST_F(NetworkdTest, KeepsNamesInADropInAndTheAddressesWhereTheyAre) {
    host.write(unit, "[Match]\nName=eth0\n[Network]\nAddress=10.0.0.1/8\nDomains=a.org\n");
    EXPECT_THAT(change({std::nullopt, {"x.org", std::vector<std::string>{"192.0.2.53"}, {}}}),
                testing::ElementsAre(dropIn));
    EXPECT_THAT(text(dropIn), HasSubstr("[Network]\nDNS=\nDNS=192.0.2.53\nDomains=\nDomains=x.org a.org\n"));
    change(servers({}));
    EXPECT_THAT(text(dropIn), HasSubstr("[Network]\nDNS=\nDomains=\n"));
}

TEST_F(NetworkdTest, PutsItsDropInIntoEtcWhereverTheUnitIs) {
    host.write("/run/systemd/network/10-netplan-eth0.network", "[Match]\nName=eth0\n[Network]\nDHCP=ipv4\n");
    EXPECT_EQ(plan(fixedAt("192.0.2.10/24")).at(0).path,
              host.at("/etc/systemd/network/10-netplan-eth0.network.d/50-marlo.conf"));
}

TEST_F(NetworkdTest, TakesTheUnitThatNetworkdHasApplied) {
    host.write(unit, "[Match]\nName=eth0\n[Network]\nDHCP=yes\n");
    host.write("/etc/systemd/network/20-other.network", "[Match]\nName=eth0\n[Network]\nDHCP=yes\n");
    host.write("/run/systemd/netif/links/2",
               "ADMIN_STATE=configured\nNETWORK_FILE=/etc/systemd/network/20-other.network\n");
    EXPECT_EQ(plan(fixedAt("192.0.2.10/24")).at(0).path,
              host.at("/etc/systemd/network/20-other.network.d/50-marlo.conf"));
}

TEST_F(NetworkdTest, RefusesANameThatAMatchCannotHave) {
    interface.name = "eth[0]";
    EXPECT_THAT(messageOf([&] { plan(leased()); }), HasSubstr("no unit of systemd-networkd can name it"));
}

TEST_F(NetworkdTest, IsFoundWhereItSaysThatItConfiguresTheInterface) {
    EXPECT_EQ(managerOf(interface, environment)->name(), "none");
    host.write("/run/systemd/netif/links/2", "ADMIN_STATE=unmanaged\n");
    EXPECT_FALSE(Networkd::knows(interface, environment));
    host.write("/run/systemd/netif/state", "");
    EXPECT_EQ(managerOf(interface, environment)->name(), "systemd-networkd") << "it runs, and nobody else does";
    environment.commands.ifup = {"/bin/true"};
    EXPECT_EQ(managerOf(interface, environment)->name(), "ifupdown");
    host.write("/run/systemd/netif/links/2", "ADMIN_STATE=configured\nNETWORK_FILE=/etc/systemd/network/x.network\n");
    EXPECT_EQ(managerOf(interface, environment)->name(), "systemd-networkd");
    host.write("/etc/network/interfaces", "iface eth0 inet dhcp\n");
    EXPECT_EQ(managerOf(interface, environment)->name(), "ifupdown");
    environment.choice = ManagerChoice::networkd;
    EXPECT_EQ(managerOf(interface, environment)->name(), "systemd-networkd");
}

TEST_F(NetworkdTest, SaysThatTheBusCannotBeReached) {
    Networkd manager(environment);
    EXPECT_THAT(messageOf([&] { manager.activate(interface, leased()); }),
                HasSubstr("the system bus cannot be reached"));
    EXPECT_THAT(messageOf([&] { manager.startDhcp(interface); }), HasSubstr("the system bus cannot be reached"));
}

} // namespace
