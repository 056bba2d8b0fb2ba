#include "tests/linux/BackEndFixture.h"

#include <random>

#include <gmock/gmock.h>
#include <gtest/gtest.h>
#include <sys/syscall.h>
#include <unistd.h>

namespace Orv::Agent::Linux {
namespace {

using namespace NodeLexicon;
using namespace Orv::Test;
using testing::HasSubstr;

class LinuxBackEndTest : public BackEndFixture {};

TEST_F(LinuxBackEndTest, hasNoAdapterInANewNamespace) {
    EXPECT_EQ(adapterNames(*tree()), std::set<std::string>());
    space->ip("link set lo up");
    EXPECT_EQ(adapterNames(*tree()), std::set<std::string>());
}

TEST_F(LinuxBackEndTest, readsWhatIpShows) {
    addPair();
    space->ip("link set left address 02:00:00:00:00:0a");
    space->ip("addr add 192.0.2.10/24 dev left");
    space->ip("addr add fd00::10/64 dev left");
    space->ip("route add default via 192.0.2.1 dev left");
    EXPECT_EQ(textOf(*tree(), "left", PROP_MAC_ADDRESS), "02:00:00:00:00:0a");
    EXPECT_EQ(textOf(*tree(), "left", PROP_IPV4_ADDRESS), "192.0.2.10");
    EXPECT_EQ(textOf(*tree(), "left", PROP_IPV4_SUBNET_MASK), "255.255.255.0");
    expectIpv6("left", "fd00::10");
    EXPECT_EQ(textOf(*tree(), "left", PROP_DEFAULT_GATEWAY), "192.0.2.1");
    EXPECT_EQ(awaited(3U, [&] { return numberOf(*tree(), "left", PROP_IP_SUPPORT); }), 3U);
    expectAgreement();
    backEnd = makeBackEnd();
    expectAgreement();
}

TEST_F(LinuxBackEndTest, hangsAdaptersBelowHostChassisAndDevice) {
    addPair();
    const auto current = tree();
    const auto adapter = adapterOf(*current, "left");
    const auto device = current->find(adapter->parentPath);
    ASSERT_NE(device, nullptr);
    EXPECT_EQ(device->description, "veth");
    EXPECT_EQ(adapterOf(*current, "right")->parentPath, device->path);
    const auto chassis = current->find(device->parentPath);
    ASSERT_NE(chassis, nullptr);
    EXPECT_NE(chassis->description, "BMC");
    const auto top = current->find(chassis->parentPath);
    ASSERT_NE(top, nullptr);
    EXPECT_EQ(top->parentPath, "");
    EXPECT_TRUE(current->nodesOfType(NODE_NETWORK_PORT).empty()) << "virtual interfaces have no port";
}

TEST_F(LinuxBackEndTest, tellsTheStatusOfEachAdapter) {
    space->ip("link add left type veth peer name right");
    expectStatus("left", 5);
    space->ip("link set left up");
    expectStatus("left", 12);
    space->ip("link set right up");
    expectStatus("left", 1);
    space->ip("link set right down");
    expectStatus("left", 12);
    expectStatus("right", 5);
    expectAgreement();
}

TEST_F(LinuxBackEndTest, followsARename) {
    addPair();
    (void)tree();
    space->ip("link set left down");
    space->ip("link set left name fifteen-letters");
    EXPECT_EQ(adapterNames(*tree()), (std::set<std::string>{"fifteen-letters", "right"}));
    expectAgreement();
}

TEST_F(LinuxBackEndTest, followsNamesThatChangeHands) {
    addPair("one", "two");
    const std::string mac = textOf(*tree(), "one", PROP_MAC_ADDRESS);
    space->ipBatch("link set one down\nlink set two down\nlink set one name swap\nlink set two name one\n"
                   "link set swap name two\n");
    EXPECT_EQ(textOf(*tree(), "two", PROP_MAC_ADDRESS), mac);
    expectAgreement();
}

TEST_F(LinuxBackEndTest, ignoresAlternativeNames) {
    addPair();
    space->ip("link property add dev left altname quite-a-long-alternative-name");
    EXPECT_EQ(adapterNames(*tree()), (std::set<std::string>{"left", "right"}));
}

TEST_F(LinuxBackEndTest, losesAnInterfaceThatMovesAway) {
    addPair();
    (void)tree();
    const Namespace there;
    std::unique_ptr<BackEnd> other;
    there.run([&] { other = makeLinuxBackEnd({host.root()}); });
    space->ip("link set left netns " + there.descriptorPath());
    EXPECT_EQ(adapterNames(*tree()), std::set<std::string>{"right"});
    EXPECT_EQ(adapterNames(*other->snapshot()), std::set<std::string>{"left"});
    expectAgreement();
}

TEST_F(LinuxBackEndTest, keepsAnInterfaceThatLeavesABridge) {
    addPair();
    space->ip("link add bridge0 type bridge");
    space->ip("link set left master bridge0");
    space->ip("link set bridge0 up");
    expectAgreement();
    space->ip("link set left nomaster");
    EXPECT_NE(adapterOf(*tree(), "left"), nullptr);
    expectAgreement();
    EXPECT_EQ(tree()->find(adapterOf(*tree(), "bridge0")->parentPath)->description, "bridge");
}

TEST_F(LinuxBackEndTest, readsTunnelsWithoutAHardwareAddress) {
    space->ip("tuntap add dev tun7 mode tun");
    space->ip("link set tun7 up");
    EXPECT_EQ(textOf(*tree(), "tun7", PROP_MAC_ADDRESS), "");
    expectStatus("tun7", 12);
    expectAgreement();
}

TEST_F(LinuxBackEndTest, tellsLeasedFromFixedAddresses) {
    addPair();
    EXPECT_EQ(numberOf(*tree(), "left", PROP_DHCP_ENABLED), 0U) << "nothing is known without address and file";
    space->ip("addr add 192.0.2.10/24 dev left");
    EXPECT_EQ(numberOf(*tree(), "left", PROP_DHCP_ENABLED), 3U);
    space->ip("addr change 192.0.2.10/24 dev left valid_lft 3600 preferred_lft 3600");
    EXPECT_EQ(numberOf(*tree(), "left", PROP_DHCP_ENABLED), 1U);
    host.write("/etc/network/interfaces", "iface right inet dhcp\niface left inet static\n");
    EXPECT_EQ(numberOf(*tree(), "right", PROP_DHCP_ENABLED), 1U);
    EXPECT_EQ(numberOf(*tree(), "left", PROP_DHCP_ENABLED), 1U) << "the kernel knows better";
}

TEST_F(LinuxBackEndTest, showsTheResolverOnEveryAdapterAndFollowsIt) {
    addPair();
    EXPECT_FALSE(propertyOf<std::vector<std::string>>(*tree(), "left", PROP_DNS_SERVERS));
    host.write("/etc/resolv.conf", "nameserver 192.0.2.53\nsearch a.example b.example\n");
    for (const char* name : {"left", "right"}) {
        EXPECT_EQ(propertyOf<std::vector<std::string>>(*tree(), name, PROP_DNS_SERVERS),
                  std::vector<std::string>{"192.0.2.53"});
        EXPECT_EQ(propertyOf<std::vector<std::string>>(*tree(), name, PROP_DNS_SUFFIXES),
                  (std::vector<std::string>{"a.example", "b.example"}));
    }
    const std::string node = space->shell("uname -n");
    EXPECT_EQ(textOf(*tree(), "left", PROP_DNS_HOSTNAME), node.substr(0, node.find_first_of(".\n")));
}

TEST_F(LinuxBackEndTest, givesTheSameTreeWhileNothingChanges) {
    addPair();
    const auto quiet = [&] {
        const auto first = tree();
        usleep(200'000);
        return tree() == first;
    };
    EXPECT_TRUE(awaited(true, quiet));
    const auto before = tree();
    EXPECT_EQ(tree(), before);
    space->ip("link set right address 02:00:00:00:00:0b");
    const auto after = tree();
    EXPECT_NE(after, before);
    EXPECT_EQ(adapterOf(*after, "left"), adapterOf(*before, "left")) << "unchanged nodes are shared";
    EXPECT_NE(adapterOf(*after, "right"), adapterOf(*before, "right"));
}

TEST_F(LinuxBackEndTest, leavesAnOldTreeAsItWas) {
    addPair();
    const auto before = tree();
    space->ip("link del left");
    EXPECT_TRUE(adapterNames(*tree()).empty());
    EXPECT_EQ(adapterNames(*before), (std::set<std::string>{"left", "right"}));
}

TEST_F(LinuxBackEndTest, refusesWritesByNameOfInterfaceAndProperty) {
    addPair();
    const std::string path = adapterOf(*tree(), "left")->path;
    try {
        backEnd->setProperty(path, PROP_MAC_ADDRESS, std::string("02:00:00:00:00:01"));
        FAIL() << "the write is accepted";
    } catch (const std::runtime_error& error) {
        EXPECT_THAT(error.what(), HasSubstr("left: "));
        EXPECT_THAT(error.what(), HasSubstr("can only be read"));
    }
}

TEST_F(LinuxBackEndTest, needsNoPrivileges) {
    addPair();
    std::unique_ptr<BackEnd> made;
    space->run([&] {
        constexpr unsigned nobody = 65534;
        // The system call, because the library's function would change every thread of the process.
        ASSERT_EQ(syscall(SYS_setresuid, nobody, nobody, nobody), 0);
        made = makeLinuxBackEnd({host.root()});
    });
    EXPECT_EQ(adapterNames(*made->snapshot()), (std::set<std::string>{"left", "right"}));
}

/** One change of a small namespace; some fail, as deleting what is not there. */
std::string randomChange(std::mt19937& random) {
    const auto pick = [&](std::initializer_list<std::string> choices) {
        return *(choices.begin() + random() % choices.size());
    };
    const std::string device = pick({"left", "right"});
    const std::string verb = pick({"add", "del", "replace"});
    const std::string ipv4 = "192.0." + pick({"2", "3"}) + "." + pick({"10", "11", "12"}) + "/24 dev " + device;
    const std::string ipv6 = "fd00::" + pick({"10", "11", "12"}) + "/64 dev " + device;
    const std::string gateway = "192.0." + pick({"2", "3"}) + "." + pick({"1", "2"}) + " dev " + device;
    return pick({"addr " + verb + " " + ipv4, "addr " + verb + " " + ipv6, "addr " + verb + " " + ipv4,
                 "link set " + device + " " + pick({"up", "down", "up"}), "addr flush dev " + device,
                 "route " + pick({"append", "prepend", "del", "replace"}) + " default via " + gateway,
                 "route append default via " + gateway + " metric " + pick({"1", "2"}),
                 "-6 route " + verb + " default via fd00::1 dev " + device});
}

/** Whatever happens: following the notifications must lead to what a new reading finds. */
TEST_F(LinuxBackEndTest, arrivesWhereANewReadingDoes) {
    addPair();
    space->shell("echo 1 > /proc/sys/net/ipv4/conf/left/promote_secondaries");
    std::mt19937 random(20);
    std::string history;
    for (int round = 0; round < 60; ++round) {
        std::string changes;
        for (std::size_t count = random() % 6; count < 6; ++count) {
            changes += randomChange(random) + "\n";
        }
        history += changes;
        space->shell("ip -force -batch - >/dev/null 2>&1 <<'END' || true\n" + changes + "END");
        // The kernel may still be at work between one reading and the other; what was missed stays missed.
        Report followed;
        Report read;
        const auto same = [&] {
            followed = kernelProperties(*tree());
            read = kernelProperties(*makeBackEnd()->snapshot());
            return followed == read;
        };
        ASSERT_TRUE(awaited(true, same)) << "followed:\n" << toText(followed) << "read:\n" << toText(read) << history;
    }
}

} // namespace
} // namespace Orv::Agent::Linux
