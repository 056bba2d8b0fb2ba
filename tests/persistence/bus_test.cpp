#include "agent/persistence/NameService.h"
#include "agent/persistence/Networkd.h"
#include "tests/persistence/Plans.h"
#include "tests/persistence/PrivateBus.h"

#include <filesystem>

#include <gmock/gmock.h>
#include <gtest/gtest.h>

namespace {

using namespace Orv::Agent;
using namespace Orv::Agent::Persistence;
using namespace Orv::Test;
using testing::ElementsAre;
using testing::HasSubstr;

using Texts = std::vector<std::string>;

struct BusTest : testing::Test {
    void SetUp() override {
        REQUIRE_BUS();
        bus = std::make_unique<PrivateBus>();
        environment.systemBus = bus->address();
        environment.report = [this](const std::string& line) { reports.push_back(line); };
        host.write("/etc/resolv.conf", "nameserver 127.0.0.53\n");
    }

    TemporaryHost host;
    Environment environment = environmentAt(host.root());
    InterfaceFacts interface = interfaceNamed("eth0");
    std::unique_ptr<PrivateBus> bus;
    Texts reports;
};

TEST_F(BusTest, TellsResolvedWhatHoldsForTheLink) {
    MockServices services(*bus);
    const auto resolved = nameServiceOf(interface, environment);
    EXPECT_EQ(resolved->name(), "systemd-resolved");
    EXPECT_EQ(resolved->plan({"x.org", {}, {}}), FileEdits{});
    resolved->apply(interface,
                    {"x.org", Texts{"192.0.2.53", "2001:db8::53", "fe80::1%eth0"}, Texts{"a.org", "x.org"}});
    EXPECT_THAT(services.calls(),
                ElementsAre("SetLinkDNS 2 192.0.2.53 2001:db8::53 fe80::1", "SetLinkDomains 2 x.org a.org"));
}

TEST_F(BusTest, TellsResolvedThatThereIsNothing) {
    MockServices services(*bus);
    nameServiceOf(interface, environment)->apply(interface, {{}, Texts{}, Texts{}});
    EXPECT_THAT(services.calls(), ElementsAre("SetLinkDNS 2", "SetLinkDomains 2"));
}

TEST_F(BusTest, SaysWhatIsNotKnownToResolvedAtAll) {
    MockServices services(*bus);
    nameServiceOf(interface, environment)->apply(interface, {{}, Texts{"192.0.2.53"}, {}});
    EXPECT_THAT(services.calls(), ElementsAre("SetLinkDNS 2 192.0.2.53"));
}

TEST_F(BusTest, PassesOnWhyResolvedRefuses) {
    MockServices services(*bus);
    services.failWith("Link eth0 is managed.\n");
    EXPECT_EQ(messageOf([&] {
                  nameServiceOf(interface, environment)->apply(interface, {{}, Texts{"192.0.2.53"}, {}});
              }),
              "org.freedesktop.resolve1: SetLinkDNS failed: Link eth0 is managed. ");
}

TEST_F(BusTest, SaysThatResolvedDoesNotRun) {
    EXPECT_THAT(messageOf([&] {
                    nameServiceOf(interface, environment)->apply(interface, {{}, Texts{}, {}});
                }),
                HasSubstr("SetLinkDNS failed: "));
}

TEST_F(BusTest, FindsResolvedByItsFileAndByItsStub) {
    EXPECT_EQ(nameServiceOf(interface, environment)->name(), "systemd-resolved");
    host.write("/etc/resolv.conf", "nameserver 127.0.0.53\nnameserver 192.0.2.53\n");
    EXPECT_EQ(nameServiceOf(interface, environment)->name(), "resolv.conf");
    std::filesystem::remove(host.at("/etc/resolv.conf"));
    EXPECT_EQ(nameServiceOf(interface, environment)->name(), "resolv.conf");
    host.write("/run/systemd/resolve/resolv.conf", "nameserver 192.0.2.53\n");
    std::filesystem::create_symlink("../run/systemd/resolve/resolv.conf", host.at("/etc/resolv.conf"));
    EXPECT_EQ(nameServiceOf(interface, environment)->name(), "systemd-resolved");
}

TEST_F(BusTest, HasNetworkdReadItsFilesAgain) {
    MockServices services(*bus);
    Networkd manager(environment);
    manager.activate(interface, leased());
    EXPECT_THAT(services.calls(), ElementsAre("Reload"));
    services.failWith("No.");
    EXPECT_EQ(messageOf([&] { manager.activate(interface, leased()); }),
              "org.freedesktop.network1: Reload failed: No.");
}

TEST_F(BusTest, WaitsUntilNetworkdHasConfiguredTheInterface) {
    MockServices services(*bus);
    host.write("/run/systemd/netif/links/2", "ADMIN_STATE=configured\n");
    std::thread networkd([&] {
        while (services.calls().empty()) {
            std::this_thread::sleep_for(std::chrono::milliseconds(5));
        }
        host.write("/run/systemd/netif/links/2", "ADMIN_STATE=configuring\n");
        std::this_thread::sleep_for(std::chrono::milliseconds(900));
        host.write("/run/systemd/netif/links/2", "ADMIN_STATE=configured\n#\n");
    });
    const auto start = std::chrono::steady_clock::now();
    Networkd manager(environment);
    applied(manager.plan(interface, fixedAt("192.0.2.10/24")));
    manager.activate(interface, fixedAt("192.0.2.10/24"));
    EXPECT_GT(std::chrono::steady_clock::now() - start, std::chrono::milliseconds(700));
    networkd.join();
    EXPECT_THAT(reports, testing::IsEmpty());
}

TEST_F(BusTest, DoesNotWaitWhereNothingWasEdited) {
    MockServices services(*bus);
    host.write("/run/systemd/netif/links/2", "ADMIN_STATE=configured\n");
    applied(Networkd(environment).plan(interface, fixedAt("192.0.2.10/24")));
    Networkd manager(environment);
    applied(manager.plan(interface, fixedAt("192.0.2.10/24")));
    const auto start = std::chrono::steady_clock::now();
    manager.activate(interface, fixedAt("192.0.2.10/24"));
    EXPECT_LT(std::chrono::steady_clock::now() - start, std::chrono::seconds(1));
}

TEST_F(BusTest, WaitsForALeaseOfNetworkd) {
    MockServices services(*bus);
    host.write("/run/systemd/netif/leases/1", "");
    std::thread networkd([&] {
        std::this_thread::sleep_for(std::chrono::milliseconds(300));
        host.write("/run/systemd/netif/leases/2", "");
    });
    Networkd(environment).startDhcp(interface);
    EXPECT_TRUE(std::filesystem::exists(host.at("/run/systemd/netif/leases/2")));
    networkd.join();
}

TEST_F(BusTest, ReportsThatNetworkdDoesNotRun) {
    Networkd(environment).activate(interface, leased());
    EXPECT_THAT(reports, ElementsAre("eth0: systemd-networkd does not run; it will find the change when it does"));
    EXPECT_THAT(messageOf([&] { Networkd(environment).startDhcp(interface); }),
                HasSubstr("systemd-networkd does not run"));
}

} // namespace
