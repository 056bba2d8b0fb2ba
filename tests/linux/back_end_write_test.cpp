#include "tests/linux/WriteFixture.h"

#include <algorithm>
#include <atomic>
#include <thread>

#include <gmock/gmock.h>
#include <gtest/gtest.h>
#include <linux/capability.h>
#include <sys/syscall.h>
#include <unistd.h>

namespace Orv::Agent::Linux {
namespace {

using namespace NodeLexicon;
using namespace Orv::Test;
using testing::AllOf;
using testing::ElementsAre;
using testing::HasSubstr;
using testing::IsEmpty;

constexpr unsigned fixed = 3;

/** What does not need a DHCP server. */
class LinuxWriteTest : public WriteFixture {
  protected:
    /** All that a write may touch. */
    struct Everything {
        Lines addresses;
        Lines routes;
        std::string interfaces;
        std::string resolver;

        bool operator==(const Everything&) const = default;
    };

    [[nodiscard]] Everything everything() const {
        return {addresses(), routes(), interfaces(), read("/etc/resolv.conf")};
    }
};

TEST_F(LinuxWriteTest, writesAnAddressToKernelAndFileAndReadsItBack) {
    set(PROP_IPV4_ADDRESS, Text("192.0.2.20"));
    EXPECT_EQ(textOf(*tree(), "left", PROP_IPV4_ADDRESS), "192.0.2.20");
    EXPECT_EQ(textOf(*tree(), "left", PROP_IPV4_SUBNET_MASK), "255.255.255.0");
    EXPECT_THAT(addresses(), ElementsAre("192.0.2.20/24 brd 192.0.2.255"));
    EXPECT_THAT(routes(), ElementsAre("default via 192.0.2.1"));
    EXPECT_EQ(interfaces(), "# the network\nauto lo\niface lo inet loopback\n\nauto left\niface left inet static\n"
                            "    address 192.0.2.20/24\n    gateway 192.0.2.1\n");
}

TEST_F(LinuxWriteTest, appliesMaskAndAddressInEitherRole) {
    set(PROP_DHCP_ENABLED, fixed);
    set(PROP_IPV4_ADDRESS, Text("255.255.240.0"));
    set(PROP_IPV4_SUBNET_MASK, Text("192.0.3.7"));
    EXPECT_THAT(addresses(), ElementsAre("192.0.3.7/20 brd 192.0.15.255"));
    EXPECT_EQ(textOf(*tree(), "left", PROP_IPV4_SUBNET_MASK), "255.255.240.0");
    EXPECT_THAT(interfaces(), HasSubstr("address 192.0.3.7/20"));
    EXPECT_THAT(routes(), ElementsAre("default via 192.0.2.1"));
}

TEST_F(LinuxWriteTest, writesTheGatewayAndKeepsItsMetric) {
    configure("auto left\niface left inet static\n\taddress 192.0.2.10\n\tnetmask 255.255.255.0\n"
              "\tgateway 192.0.2.1\n\tmetric 70\n");
    set(PROP_DEFAULT_GATEWAY, Text("192.0.2.9"));
    EXPECT_THAT(routes(), ElementsAre("default via 192.0.2.9 metric 70"));
    EXPECT_EQ(textOf(*tree(), "left", PROP_DEFAULT_GATEWAY), "192.0.2.9");
    EXPECT_THAT(interfaces(), HasSubstr("\tgateway 192.0.2.9\n\tmetric 70\n"));
}

TEST_F(LinuxWriteTest, writesWhatTheResolverReads) {
    set(PROP_DNS_SERVERS, List{"192.0.2.99", "2001:db8::53"});
    set(PROP_DNS_SUFFIXES, List{"example.net", "example.org"});
    EXPECT_EQ(read("/etc/resolv.conf"), "# by hand\nnameserver 192.0.2.99\nnameserver 2001:db8::53\n"
                                        "search example.net example.org\n");
    set(PROP_DNS_DOMAIN, Text("example.net"));
    EXPECT_EQ(textOf(*tree(), "left", PROP_DNS_DOMAIN), "example.net");
    EXPECT_THAT(*propertyOf<List>(*tree(), "left", PROP_DNS_SERVERS), ElementsAre("192.0.2.99", "2001:db8::53"));
    EXPECT_THAT(addresses(), ElementsAre("192.0.2.10/24 brd 192.0.2.255"));
}

TEST_F(LinuxWriteTest, leavesOtherAddressesRoutesAndIpv6) {
    addIpv6(*space, "left", "2001:db8::1");
    space->ip("addr add 192.0.2.11/24 dev left");
    space->ip("route add 10.0.0.0/8 via 192.0.2.3 dev left");
    const std::string ipv6 = ipv6Addresses(*space, "left");
    set(PROP_IPV4_ADDRESS, Text("192.0.2.20"));
    EXPECT_THAT(addresses(), ElementsAre("192.0.2.20/24 brd 192.0.2.255", "192.0.2.11/24 secondary"));
    EXPECT_THAT(routes(), ElementsAre("10.0.0.0/8 via 192.0.2.3", "default via 192.0.2.1"));
    EXPECT_EQ(ipv6Addresses(*space, "left"), ipv6);
}

TEST_F(LinuxWriteTest, bootsIntoWhatItMadeLive) {
    set(PROP_DHCP_ENABLED, fixed);
    set(PROP_IPV4_ADDRESS, Text("255.255.255.128"));
    set(PROP_IPV4_SUBNET_MASK, Text("203.0.113.5"));
    set(PROP_DEFAULT_GATEWAY, Text("203.0.113.1"));
    set(PROP_DNS_SERVERS, List{"203.0.113.53"});
    const Everything live = everything();
    EXPECT_THAT(live.addresses, ElementsAre("203.0.113.5/25 brd 203.0.113.127"));
    EXPECT_THAT(live.routes, ElementsAre("default via 203.0.113.1"));
    boot();
    EXPECT_EQ(everything(), live);
}

TEST_F(LinuxWriteTest, refusesAGatewayThatTheLinkDoesNotReach) {
    const Everything before = everything();
    EXPECT_THAT(failureOf(PROP_DEFAULT_GATEWAY, Text("198.51.100.1")),
                AllOf(HasSubstr("left"), HasSubstr("DefaultIPGateway"), HasSubstr("198.51.100.1")));
    EXPECT_EQ(everything(), before);
}

TEST_F(LinuxWriteTest, changesNothingInAnEtcThatCannotBeWritten) {
    const Everything before = everything();
    space->shell("mount -o remount,ro /etc");
    EXPECT_THAT(failureOf(PROP_IPV4_ADDRESS, Text("192.0.2.20")),
                AllOf(HasSubstr("left: IPv4Address cannot be set to \"192.0.2.20\""), HasSubstr("/etc/network"),
                      HasSubstr("Read-only file system")));
    EXPECT_THAT(failureOf(PROP_DNS_SERVERS, List{"192.0.2.99"}), HasSubstr("Read-only file system"));
    EXPECT_EQ(everything(), before);
}

TEST_F(LinuxWriteTest, putsTheFileBackWhenTheKernelRefuses) {
    const Everything before = everything();
    const std::string path = pathOf("left");
    std::string text;
    space->run([&] {
        __user_cap_header_struct header{_LINUX_CAPABILITY_VERSION_3, 0};
        __user_cap_data_struct data[2]{};
        ASSERT_EQ(syscall(SYS_capget, &header, data), 0);
        data[0].effective &= ~(1U << CAP_NET_ADMIN);
        ASSERT_EQ(syscall(SYS_capset, &header, data), 0);
        try {
            backEnd->setProperty(path, PROP_IPV4_ADDRESS, Text("192.0.2.20"));
        } catch (const std::exception& failure) {
            text = failure.what();
        }
    });
    EXPECT_THAT(text, AllOf(HasSubstr("left: IPv4Address cannot be set to \"192.0.2.20\""),
                            HasSubstr("adding the address 192.0.2.20/32"), HasSubstr("Operation not permitted")));
    EXPECT_EQ(everything(), before);
}

TEST_F(LinuxWriteTest, putsFileAndAddressBackWhenTheRouteIsRefused) {
    configure("auto left\niface left inet static\n    address 192.0.2.10/24\n");
    const Everything before = everything();
    space->ip("link set left down");
    EXPECT_THAT(failureOf(PROP_DEFAULT_GATEWAY, Text("192.0.2.1")),
                AllOf(HasSubstr("setting the gateway 192.0.2.1"), HasSubstr("Nexthop device is not up")));
    EXPECT_EQ(everything(), before);
}

TEST_F(LinuxWriteTest, saysThatTheInterfaceIsGone) {
    const std::string path = pathOf("left");
    const std::string file = interfaces();
    space->ip("link del left");
    space->run(
        [&] { EXPECT_THROW(backEnd->setProperty(path, PROP_IPV4_ADDRESS, Text("192.0.2.20")), std::runtime_error); });
    EXPECT_EQ(interfaces(), file);
}

TEST_F(LinuxWriteTest, takesWritersOnTwoAdaptersAndReadersAtTheSameTime) {
    space->ip("link add one type veth peer name two");
    space->ip("link set one up");
    space->ip("link set two up");
    std::atomic<bool> done = false;
    constexpr int rounds = 40;
    const auto writeAll = [&](const std::string& name, const std::string& prefix) {
        for (int round = 0; round < rounds; ++round) {
            const std::string wanted = prefix + std::to_string(10 + round % 7);
            set(PROP_IPV4_ADDRESS, wanted, name);
            EXPECT_EQ(textOf(*tree(), name, PROP_IPV4_ADDRESS), wanted);
        }
    };
    const auto readAll = [&] {
        while (!done) {
            const auto present = tree();
            for (const auto& node : present->nodesOfType(NODE_NETWORK_ADAPTER)) {
                EXPECT_FALSE(node->properties.empty());
            }
        }
    };
    std::vector<std::thread> readers;
    std::generate_n(std::back_inserter(readers), 2, [&] { return std::thread(readAll); });
    std::thread first(writeAll, "one", "192.0.2.");
    std::thread second(writeAll, "two", "198.51.100.");
    first.join();
    second.join();
    done = true;
    for (std::thread& reader : readers) {
        reader.join();
    }
    EXPECT_THAT(addressLines(*space, "one"), ElementsAre(HasSubstr("192.0.2.1")));
    EXPECT_THAT(interfaces(), AllOf(HasSubstr("iface one inet static"), HasSubstr("iface two inet static"),
                                    HasSubstr(textOf(*tree(), "one", PROP_IPV4_ADDRESS)),
                                    HasSubstr(textOf(*tree(), "two", PROP_IPV4_ADDRESS))));
}

} // namespace
} // namespace Orv::Agent::Linux
