#include "tests/linux/WriteFixture.h"
#include "tests/persistence/PrivateBus.h"

#include <filesystem>

#include <gmock/gmock.h>
#include <gtest/gtest.h>

/** Changes of adapters that a running systemd-networkd configures. */
namespace Orv::Test {
namespace {

using namespace NodeLexicon;
using testing::AllOf;
using testing::Contains;
using testing::ElementsAre;
using testing::HasSubstr;
using testing::Not;
using testing::UnorderedElementsAre;

constexpr const char* networkd = "/lib/systemd/systemd-networkd";

class NetworkdLiveTest : public WriteFixture {
  protected:
    void SetUp() override {
        REQUIRE_BUS();
        GO_ON_UNLESS(std::filesystem::exists(networkd) ? "" : "systemd-networkd is not installed");
        WriteFixture::SetUp();
        if (!space) {
            return;
        }
        // Without a udev of its own, networkd waits for none where /sys cannot be written.
        space->shell(
            "ip link set left down; ip addr flush dev left; mkdir -p /etc/systemd/network /run/systemd/netif/links "
            "/run/systemd/netif/leases /run/systemd/netif/lldp; chown -R systemd-network: /run/systemd/netif; "
            "mount -o remount,bind,ro /sys");
        write("/etc/network/interfaces", "auto lo\niface lo inet loopback\n");
    }

    /** Starts networkd with this unit for "left", and a back end once it has configured the interface. */
    void start(const std::string& unit) {
        write("/etc/systemd/network/10-left.network", "[Match]\nName=left\n[Network]\nIPv6AcceptRA=no\n" + unit);
        startNetworkd();
        Agent::Persistence::Environment host;
        host.systemBus = bus.address();
        space->run([&] { backEnd = Agent::Linux::makeLinuxBackEnd({}, host); });
    }

    void startNetworkd() const {
        space->shell(
            "DBUS_SYSTEM_BUS_ADDRESS=" + bus.address() + " " + networkd +
            " > /run/networkd.log 2>&1 & echo $! > /run/networkd.pid; index=$(cat /sys/class/net/left/ifindex); "
            "for i in $(seq 100); do grep -qs ADMIN_STATE=configured /run/systemd/netif/links/$index && exit 0; "
            "sleep 0.1; done; cat /run/networkd.log; exit 1");
    }

    /** What a boot makes of the files. */
    void bootAgain() const {
        space->shell("pid=$(cat /run/networkd.pid); kill $pid; while kill -0 $pid 2>/dev/null; do sleep 0.05; done; "
                     "ip link set left down; ip addr flush dev left; rm -f /run/systemd/netif/links/* "
                     "/run/systemd/netif/leases/*");
        startNetworkd();
    }

    PrivateBus bus;
};

TEST_F(NetworkdLiveTest, movesTheAddressAndKeepsAllElse) {
    start("[Network]\nAddress=192.0.2.10/24\nAddress=2001:db8::10/64\nGateway=192.0.2.1\n"
          "[Address]\nAddress=198.51.100.9/24\n[Route]\nDestination=10.0.0.0/8\nGateway=198.51.100.1\n");
    set(PROP_IPV4_ADDRESS, Text("192.0.2.77"));
    const auto expectChange = [&] {
        EXPECT_THAT(addresses(), UnorderedElementsAre(HasSubstr("192.0.2.77/24"), HasSubstr("198.51.100.9/24")));
        EXPECT_THAT(routes(), AllOf(Contains(HasSubstr("default via 192.0.2.1")), Contains(HasSubstr("10.0.0.0/8"))));
        EXPECT_THAT(ipv6Addresses(*space, "left"), HasSubstr("2001:db8::10"));
        EXPECT_EQ(textOf(*tree(), "left", PROP_IPV4_ADDRESS), "192.0.2.77");
        EXPECT_EQ(numberOf(*tree(), "left", PROP_DHCP_ENABLED), 3U);
    };
    expectChange();
    bootAgain();
    expectChange();
}

TEST_F(NetworkdLiveTest, makesALeaseAStaticAddressAndBack) {
    startServer();
    start("[Network]\nDHCP=ipv4\nLLDP=no\n");
    EXPECT_THAT(addresses(), ElementsAre(AllOf(HasSubstr("198.51.100."), HasSubstr("dynamic"))));
    EXPECT_EQ(numberOf(*tree(), "left", PROP_DHCP_ENABLED), 1U);
    set(PROP_DHCP_ENABLED, 3U);
    set(PROP_IPV4_ADDRESS, Text("255.255.255.0"));
    set(PROP_IPV4_SUBNET_MASK, Text("192.0.2.30"));
    set(PROP_DEFAULT_GATEWAY, Text("192.0.2.1"));
    const auto expectStatic = [&] {
        EXPECT_THAT(addresses(), ElementsAre(AllOf(HasSubstr("192.0.2.30/24"), Not(HasSubstr("dynamic")))));
        EXPECT_THAT(routes(), ElementsAre(HasSubstr("default via 192.0.2.1")));
        EXPECT_EQ(numberOf(*tree(), "left", PROP_DHCP_ENABLED), 3U);
    };
    expectStatic();
    bootAgain();
    expectStatic();
    set(PROP_DHCP_ENABLED, 1U);
    const auto expectLease = [&] {
        EXPECT_THAT(addresses(), ElementsAre(AllOf(HasSubstr("198.51.100."), HasSubstr("dynamic"))));
        EXPECT_EQ(numberOf(*tree(), "left", PROP_DHCP_ENABLED), 1U);
    };
    expectLease();
    bootAgain();
    expectLease();
}

TEST_F(NetworkdLiveTest, replacesAStaticUnitByALease) {
    startServer();
    start("[Network]\nAddress=192.0.2.10/24\nGateway=192.0.2.1\n");
    set(PROP_DHCP_ENABLED, 1U);
    EXPECT_THAT(addresses(), ElementsAre(AllOf(HasSubstr("198.51.100."), HasSubstr("dynamic"))));
    EXPECT_THAT(read("/etc/systemd/network/10-left.network"), HasSubstr("Address=192.0.2.10/24"));
    EXPECT_THAT(read("/etc/systemd/network/05-marlo-left.network"), HasSubstr("DHCP=ipv4"));
}

} // namespace
} // namespace Orv::Test
