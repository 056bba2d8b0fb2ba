#include "agent/persistence/NameService.h"
#include "tests/persistence/Plans.h"

#include <filesystem>

#include <gmock/gmock.h>
#include <gtest/gtest.h>

namespace {

using namespace Orv::Agent;
using namespace Orv::Agent::Persistence;
using namespace Orv::Test;
using testing::HasSubstr;

struct ManagersTest : testing::Test {
    [[nodiscard]] std::string manager() const { return managerOf(interface, environment)->name(); }

    [[nodiscard]] std::string nameService() const { return nameServiceOf(interface, environment)->name(); }

    void install(std::vector<std::string>& command, const std::string& path, const std::string& script = "") {
        host.write(path, "#!/bin/sh\n" + script);
        std::filesystem::permissions(host.at(path), std::filesystem::perms(0755));
        command = {host.at(path).string()};
    }

    TemporaryHost host;
    Environment environment = environmentAt(host.root());
    InterfaceFacts interface = interfaceNamed("eth0");
};

TEST_F(ManagersTest, FindsNoneOnABareHost) {
    EXPECT_EQ(manager(), "none");
}

TEST_F(ManagersTest, FindsIfupdownWhereAStanzaNamesTheInterface) {
    host.write("/etc/network/interfaces", "iface eth0 inet6 auto\n");
    EXPECT_EQ(manager(), "ifupdown");
    host.write("/etc/network/interfaces", "iface eth1 inet dhcp\n");
    EXPECT_EQ(manager(), "none");
}

TEST_F(ManagersTest, FindsIfupdownForAnInterfaceThatNobodyNamesWhereItIsInstalled) {
    install(environment.commands.ifup, "/sbin/ifup");
    EXPECT_EQ(manager(), "ifupdown");
}

TEST_F(ManagersTest, FindsNetworkManagerWhereItHasAConnection) {
    install(environment.commands.ifup, "/sbin/ifup");
    host.write("/run/NetworkManager/devices/2", "[device]\nmanaged=false\n");
    EXPECT_EQ(manager(), "ifupdown");
    host.write("/run/NetworkManager/devices/2", "[device]\nconnection-uuid=1-2-3\n");
    EXPECT_EQ(manager(), "NetworkManager");
    host.write("/etc/network/interfaces", "iface eth0 inet dhcp\n");
    EXPECT_EQ(manager(), "ifupdown");
}

TEST_F(ManagersTest, TakesTheOneThatIsChosen) {
    host.write("/etc/network/interfaces", "iface eth0 inet dhcp\n");
    environment.choice = ManagerChoice::none;
    EXPECT_EQ(manager(), "none");
    environment.choice = ManagerChoice::ifupdown;
    host.write("/etc/network/interfaces", "");
    EXPECT_EQ(manager(), "ifupdown");
}

TEST_F(ManagersTest, RefusesEverythingForNetworkManager) {
    host.write("/run/NetworkManager/devices/2", "[device]\nconnection-uuid=1-2-3\n");
    const auto refused = managerOf(interface, environment);
    const auto isRefusal = HasSubstr("NetworkManager configures it, which is not supported yet");
    EXPECT_THAT(messageOf([&] { (void)refused->plan(interface, leased()); }), isRefusal);
    EXPECT_THAT(messageOf([&] { refused->stopDhcp(interface); }), isRefusal);
    EXPECT_THAT(messageOf([&] { refused->startDhcp(interface); }), isRefusal);
    EXPECT_THAT(messageOf([&] { refused->activate(interface, leased()); }), isRefusal);
}

TEST_F(ManagersTest, SaysThatAChangeWillNotLastWhereNobodyConfiguresTheInterface) {
    std::vector<std::string> lines;
    environment.report = [&](const std::string& line) { lines.push_back(line); };
    EXPECT_EQ(managerOf(interface, environment)->plan(interface, fixedAt("10.0.0.1/8")), FileEdits{});
    EXPECT_THAT(lines,
                testing::ElementsAre("eth0: no manager of this host configures it; the change will not survive a "
                                     "boot"));
    lines.clear();
    (void)managerOf(interface, environment)->plan(interface, {std::nullopt, {"a.org", {}, {}}});
    EXPECT_THAT(lines, testing::IsEmpty()) << "resolv.conf lasts";
}

TEST_F(ManagersTest, TakesResolvconfWhereItIsInstalled) {
    EXPECT_EQ(nameService(), "resolv.conf");
    install(environment.commands.resolvconf, "/sbin/resolvconf", "echo \"$*\" >> $0.calls; cat >> $0.calls\n");
    EXPECT_EQ(nameService(), "resolvconf");
}

TEST_F(ManagersTest, HandsTheWholeOfTheSettingsToResolvconf) {
    install(environment.commands.resolvconf, "/sbin/resolvconf", "echo \"$*\" >> $0.calls; cat >> $0.calls\n");
    const NameSettings whole{"c.org", std::vector<std::string>{"10.0.0.1", "10.0.0.2"},
                             std::vector<std::string>{"a.org"}};
    nameServiceOf(interface, environment)->apply(interface, whole);
    EXPECT_EQ(TemporaryFile::readFrom(host.at("/sbin/resolvconf.calls")),
              "-a eth0.inet\ndomain c.org\nsearch a.org\nnameserver 10.0.0.1\nnameserver 10.0.0.2\n");
    std::filesystem::remove(host.at("/sbin/resolvconf.calls"));
    nameServiceOf(interface, environment)->apply(interface, {});
    EXPECT_EQ(TemporaryFile::readFrom(host.at("/sbin/resolvconf.calls")), "-d eth0.inet\n");
}

TEST_F(ManagersTest, SaysWhyResolvconfFailed) {
    install(environment.commands.resolvconf, "/sbin/resolvconf", "echo no room; exit 1\n");
    EXPECT_THAT(messageOf([&] {
                    nameServiceOf(interface, environment)->apply(interface, {"a.org", {}, {}});
                }),
                HasSubstr("resolvconf: failed with status 1: no room"));
}

} // namespace
