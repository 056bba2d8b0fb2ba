#include "agent/persistence/DhcpClient.h"
#include "agent/persistence/Ifupdown.h"
#include "tests/persistence/Plans.h"
#include "tests/support/Namespace.h"

#include <chrono>
#include <csignal>
#include <filesystem>
#include <thread>

#include <gmock/gmock.h>
#include <gtest/gtest.h>
#include <sys/wait.h>
#include <unistd.h>

namespace {

using namespace Orv::Agent;
using namespace Orv::Agent::Persistence;
using namespace Orv::Test;
using testing::HasSubstr;

using Texts = std::vector<std::string>;

struct Arguments {
    Texts arguments;
    bool isClient;
    bool others;
};

TEST(ClientArguments, TellAClientOfTheInterface) {
    const Arguments cases[] = {
        {{"dhclient", "-4", "-v", "-i", "-pf", "/run/dhclient.eth0.pid", "-lf", "/x", "-I", "-df", "/y", "eth0"},
         true,
         false},
        {{"/sbin/dhclient", "eth0"}, true, false},
        {{"dhclient", "-1", "eth0", "-nw"}, true, false},
        {{"dhclient", "eth0", "eth1"}, true, true},
        {{"dhclient", "eth1"}, false, false},
        {{"dhclient", "-6", "eth0"}, false, false},
        {{"dhclient", "-pf", "eth0", "eth1"}, false, false},
        {{"dhclient", "-H", "eth0"}, false, false},
        {{"dhclient"}, false, false},
        {{"udhcpc", "-n", "-p", "/run/udhcpc.eth0.pid", "-i", "eth0"}, true, false},
        {{"udhcpc", "-ieth0"}, true, false},
        {{"busybox", "udhcpc", "-i", "eth0"}, true, false},
        {{"udhcpc", "-i", "eth1", "eth0"}, false, false},
        {{"udhcpc", "-i"}, false, false},
        {{"dhcpcd", "eth0"}, true, false},
        {{"dhcpcd", "-h", "eth0", "eth1"}, false, false},
        {{"dhcpcd: eth0 [ip4]"}, true, false},
        {{"dhcpcd: eth1 [ip4]"}, false, false},
        {{"/bin/sh", "/tmp/dhclient", "eth0"}, true, false},
        {{"vi", "notes", "dhclient", "eth0"}, false, false},
        {{"grep", "eth0"}, false, false},
        {{}, false, false},
        {{""}, false, false},
    };
    for (const auto& [arguments, isClient, others] : cases) {
        const ClientArguments found = ClientArguments::of(arguments, "eth0");
        EXPECT_EQ(found.isClient, isClient) << testing::PrintToString(arguments);
        EXPECT_EQ(found.others, others) << testing::PrintToString(arguments);
    }
}

/** An interface of this test alone, and clients that are scripts. */
struct DhcpClientTest : testing::Test {
    void TearDown() override {
        for (const pid_t child : children) {
            ::kill(child, SIGKILL);
            ::waitpid(child, nullptr, 0);
        }
    }

    /** A program below the root that says how it was called and stays; it is known by its name. */
    std::string script(const std::string& name, const std::string& work) {
        const std::string path = "/sbin/" + name;
        host.write(path, "#!/bin/sh\necho \"$0 $*\" >> " + host.root() + "/calls\n" + work + "\n");
        std::filesystem::permissions(host.at(path), std::filesystem::perms(0755));
        return host.at(path).string();
    }

    pid_t run(const Texts& arguments) {
        std::vector<char*> vector;
        for (const std::string& argument : arguments) {
            vector.push_back(const_cast<char*>(argument.c_str()));
        }
        vector.push_back(nullptr);
        const pid_t child = ::fork();
        if (child == 0) {
            ::execv(vector[0], vector.data());
            ::_exit(127);
        }
        children.push_back(child);
        for (int i = 0; i < 500 && !std::filesystem::exists(host.at("/calls")); ++i) {
            std::this_thread::sleep_for(std::chrono::milliseconds(10));
        }
        return child;
    }

    bool hasEnded(pid_t child) {
        int status = 0;
        const bool ended = ::waitpid(child, &status, WNOHANG) == child;
        if (ended) {
            std::erase(children, child);
        }
        return ended;
    }

    [[nodiscard]] std::string calls() const { return TemporaryFile::readFrom(host.at("/calls")); }

    TemporaryHost host;
    Environment environment = environmentAt(host.root());
    std::string interface = "tst" + std::to_string(::getpid());
    std::vector<pid_t> children;
};

constexpr const char* stays = "while :; do sleep 0.1; done";

TEST_F(DhcpClientTest, StopsAClientAndSaysSo) {
    const pid_t child = run({script("dhclient", stays), "-4", interface});
    DhcpClient client(environment);
    EXPECT_TRUE(client.isRunning(interface));
    EXPECT_TRUE(client.stop(interface));
    EXPECT_TRUE(hasEnded(child));
    EXPECT_FALSE(client.isRunning(interface));
    EXPECT_FALSE(client.stop(interface));
}

TEST_F(DhcpClientTest, KillsAClientThatDoesNotListen) {
    const pid_t child = run({script("udhcpc", "trap '' TERM\n" + std::string(stays)), "-i", interface});
    EXPECT_TRUE(DhcpClient(environment).stop(interface));
    EXPECT_TRUE(hasEnded(child));
}

TEST_F(DhcpClientTest, LeavesClientsOfOthersAlone) {
    const pid_t child = run({script("dhclient", stays), interface + "x"});
    EXPECT_FALSE(DhcpClient(environment).stop(interface));
    EXPECT_FALSE(hasEnded(child));
}

TEST_F(DhcpClientTest, DoesNotEndAClientThatServesOthersToo) {
    const pid_t child = run({script("dhclient", stays), interface, interface + "x"});
    EXPECT_THAT(messageOf([&] { DhcpClient(environment).stop(interface); }), HasSubstr("serves other interfaces"));
    EXPECT_FALSE(hasEnded(child));
}

TEST_F(DhcpClientTest, LeavesAClientOfAnInterfaceOfThatNameInAnotherNamespaceAlone) {
    REQUIRE_NAMESPACES();
    const std::string client = script("dhclient", stays);
    const Namespace other;
    pid_t child = -1;
    other.run([&] { child = run({client, interface}); });
    EXPECT_FALSE(DhcpClient(environment).isRunning(interface));
    EXPECT_FALSE(DhcpClient(environment).stop(interface));
    EXPECT_FALSE(hasEnded(child));
    other.run([&] { EXPECT_TRUE(DhcpClient(environment).stop(interface)); });
}

TEST_F(DhcpClientTest, StartsTheClientAsIfupDoes) {
    environment.commands.dhclient = {script("dhclient", "")};
    environment.commands.udhcpc = {script("udhcpc", "")};
    environment.commands.dhcpcd = {script("dhcpcd", "")};
    DhcpClient client(environment);
    client.start(interface);
    const std::string root = host.root();
    EXPECT_EQ(calls(), root + "/sbin/dhclient -4 -v -i -pf " + root + "/run/dhclient." + interface + ".pid -lf " +
                           root + "/var/lib/dhcp/dhclient." + interface + ".leases -I -df " + root +
                           "/var/lib/dhcp/dhclient6." + interface + ".leases " + interface + "\n");
    std::filesystem::remove(host.at("/sbin/dhclient"));
    std::filesystem::remove(host.at("/calls"));
    client.start(interface);
    EXPECT_THAT(calls(), HasSubstr("udhcpc -b -p " + root + "/run/udhcpc." + interface + ".pid -i " + interface));
    std::filesystem::remove(host.at("/sbin/udhcpc"));
    client.start(interface);
    EXPECT_THAT(calls(), HasSubstr("dhcpcd -4 " + interface));
    std::filesystem::remove(host.at("/sbin/dhcpcd"));
    EXPECT_EQ(messageOf([&] { client.start(interface); }), "no DHCP client is installed");
}

TEST_F(DhcpClientTest, SaysWhyTheClientFailed) {
    environment.commands.dhclient = {script("dhclient", "echo Cannot find device; exit 1")};
    EXPECT_THAT(messageOf([&] { DhcpClient(environment).start(interface); }),
                HasSubstr("dhclient: failed with status 1: Cannot find device"));
}

TEST_F(DhcpClientTest, BringsUpAnInterfaceThatIfupHasNotYetConfigured) {
    const std::string dhclient = script("dhclient", stays);
    environment.commands.ifup = {script("ifup", dhclient + " \"$1\" >/dev/null 2>&1 & sleep 0.3")};
    environment.commands.dhclient = {dhclient};
    Ifupdown manager(environment);
    manager.startDhcp(interfaceNamed(interface));
    EXPECT_THAT(calls(), HasSubstr("/sbin/ifup " + interface + "\n"));
    const std::string before = calls();
    manager.startDhcp(interfaceNamed(interface));
    EXPECT_EQ(calls(), before) << "it runs already";
    EXPECT_TRUE(manager.stopDhcp(interfaceNamed(interface)));
}

TEST_F(DhcpClientTest, StartsTheClientAloneWhereIfupHasConfiguredTheRest) {
    host.write("/run/network/ifstate", "lo=lo\n" + interface + "=" + interface + "\n");
    environment.commands.ifup = {script("ifup", "")};
    environment.commands.dhclient = {script("dhclient", "")};
    Ifupdown(environment).startDhcp(interfaceNamed(interface));
    EXPECT_THAT(calls(), testing::Not(HasSubstr("ifup")));
    EXPECT_THAT(calls(), HasSubstr("dhclient -4"));
}

TEST_F(DhcpClientTest, SaysThatNoClientRunsBehindIfup) {
    environment.commands.ifup = {script("ifup", "echo ifup: unknown interface; exit 1")};
    EXPECT_THAT(messageOf([&] { Ifupdown(environment).startDhcp(interfaceNamed(interface)); }),
                HasSubstr("no DHCP client runs behind it: status 1, ifup: unknown interface"));
}

} // namespace
