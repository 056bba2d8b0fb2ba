#include "agent/persistence/Command.h"
#include "agent/persistence/Ifupdown.h"
#include "tests/persistence/Plans.h"
#include "tests/support/Require.h"

#include <filesystem>
#include <sstream>

#include <gmock/gmock.h>
#include <gtest/gtest.h>

/** What ifupdown itself reads in the files that are written. */
namespace {

using namespace Orv::Agent;
using namespace Orv::Agent::Persistence;
using namespace Orv::Test;

constexpr const char* ifquery = "/sbin/ifquery";

#define REQUIRE_IFQUERY() GO_ON_UNLESS(std::filesystem::exists(ifquery) ? "" : "ifupdown is not installed")

/** What a query says of one key; empty when nothing. */
std::string said(const std::string& output, const std::string& key) {
    std::istringstream lines(output);
    for (std::string line; std::getline(lines, line);) {
        if (line.starts_with(key + ": ")) {
            return line.substr(key.size() + 2);
        }
    }
    return "";
}

std::string query(const std::string& file, const std::string& interface) {
    const CommandResult result = runCommand({ifquery, "-i", file, interface}, std::chrono::seconds(10));
    EXPECT_EQ(result.status, 0) << result.output;
    return result.output;
}

const std::vector<std::string> files{
    "",
    "auto lo\niface lo inet loopback\n",
    "iface eth0 inet dhcp\n",
    "iface eth0 inet manual\n\n\n# end",
    "iface eth0 inet dhcp",
    "iface eth0 inet static\n address 10.0.0.1/8\n",
    "iface eth0 inet static\n address 10.0.0.1\n netmask 255.0.0.0\n gateway 10.0.0.2\n",
    "iface eth0 inet static\n address 10.0.0.1\n netmask 8\n broadcast 10.255.255.255\n",
    "iface eth0 inet \\\n static\n address \\\n 10.0.0.1/8\n # comment \\\n gateway 10.0.0.2 \\\n\n mtu 1400\n",
    "auto eth1 eth0\niface eth1 inet static\n address 10.9.9.9/8\niface eth0 inet6 auto\niface eth0 inet static\n"
    "\taddress 10.0.0.1/8\n\tup echo a \\\n b\n",
    "\tiface eth0 inet static\naddress 10.0.0.1/8\ngateway 10.0.0.2\n",
    "iface eth0 inet static\r\n address 10.0.0.1/8\r\n",
};

TEST(Ifquery, ReadsTheStaticAddressThatWasWrittenIntoAnyFile) {
    REQUIRE_IFQUERY();
    for (const std::string& file : files) {
        for (const auto& [address, gateway] : std::vector<std::pair<std::string, std::string>>{
                 {"192.0.2.10/24", "192.0.2.1"}, {"10.7.0.1/13", ""}, {"203.0.113.5/31", "203.0.113.4"}}) {
            const TemporaryHost host;
            host.write("/etc/network/interfaces", file);
            const AdapterSettings wanted = fixedAt(address, gateway);
            applied(Ifupdown(environmentAt(host.root())).plan(interfaceNamed("eth0"), wanted));
            const std::string output = query(host.at("/etc/network/interfaces").string(), "eth0");
            const Ipv4Prefixed pair = *wanted.ipv4->address;
            EXPECT_EQ(said(output, "address"), pair.address.text()) << file << output;
            EXPECT_THAT(said(output, "netmask"),
                        testing::AnyOf(maskOf(pair.prefixLength).text(), std::to_string(pair.prefixLength)))
                << file << output;
            EXPECT_EQ(said(output, "gateway"), gateway) << file << output;
            EXPECT_EQ(said(output, "mtu"), file.find("mtu") == std::string::npos ? "" : "1400");
        }
    }
}

TEST(Ifquery, FindsNoAddressWhereDhcpWasWritten) {
    REQUIRE_IFQUERY();
    for (const std::string& file : files) {
        const TemporaryHost host;
        host.write("/etc/network/interfaces", file);
        applied(Ifupdown(environmentAt(host.root())).plan(interfaceNamed("eth0"), leased()));
        const std::string output = query(host.at("/etc/network/interfaces").string(), "eth0");
        for (const char* key : {"address", "netmask", "gateway", "broadcast"}) {
            EXPECT_EQ(said(output, key), "") << file << output;
        }
    }
}

TEST(Ifquery, FindsTheInterfaceThatWasAddedAmongThoseToBringUp) {
    REQUIRE_IFQUERY();
    const TemporaryHost host;
    applied(Ifupdown(environmentAt(host.root())).plan(interfaceNamed("eth0"), leased()));
    const auto result =
        runCommand({ifquery, "-i", host.at("/etc/network/interfaces").string(), "--list"}, std::chrono::seconds(10));
    EXPECT_THAT(result.output, testing::HasSubstr("eth0\n"));
}

} // namespace
