/**
 * @file
 * The hardware room against a kernel, in network namespaces that the tests make, and on the host as it is.
 */
#include "agent/hardware/Ethtool.h"
#include "agent/hardware/EthtoolIoctl.h"
#include "agent/hardware/EthtoolMessages.h"
#include "agent/hardware/Hardware.h"
#include "agent/hardware/InventoryBuilder.h"
#include "agent/hardware/Sysfs.h"
#include "tests/support/Namespace.h"

#include <algorithm>
#include <array>
#include <atomic>
#include <cctype>
#include <chrono>
#include <cstddef>
#include <filesystem>
#include <nlohmann/json.hpp>
#include <stdexcept>
#include <system_error>
#include <thread>

#include <gtest/gtest.h>
#include <linux/filter.h>
#include <linux/netlink.h>
#include <linux/rtnetlink.h>
#include <linux/seccomp.h>
#include <sys/prctl.h>
#include <sys/socket.h>
#include <sys/syscall.h>

namespace Orv::Agent::Linux {
namespace {

using nlohmann::json;
using Test::Namespace;

HardwareInventory inventoryOf(const Namespace& space) {
    HardwareInventory inventory;
    space.run([&] { inventory = readHardwareInventory(); });
    return inventory;
}

const NetworkPort& portNamed(const HardwareInventory& inventory, const std::string& name) {
    const auto found = std::find_if(inventory.ports.begin(), inventory.ports.end(),
                                    [&](const NetworkPort& port) { return port.name == name; });
    if (found == inventory.ports.end()) {
        throw std::runtime_error("no port " + name);
    }
    return *found;
}

std::string digits(std::string address) {
    std::erase(address, ':');
    std::transform(address.begin(), address.end(), address.begin(), [](unsigned char c) { return std::toupper(c); });
    return address;
}

TEST(KernelInventory, ListsEveryInterfaceButLoopbackInTheKernelsOrder) {
    REQUIRE_NAMESPACES();
    const Namespace space;
    space.ip("link add zz type veth peer name aa");
    space.ip("link add br0 type bridge");
    space.ip("link add ifb0 type ifb");
    const auto inventory = inventoryOf(space);
    std::vector<std::string> expected;
    for (const auto& link : json::parse(space.ip("-j link"))) {
        if (link["ifname"] != "lo") {
            expected.push_back(link["ifname"]);
        }
    }
    std::vector<std::string> names;
    for (const auto& port : inventory.ports) {
        names.push_back(port.name);
        EXPECT_FALSE(port.card) << port.name;
    }
    ASSERT_EQ(expected.size(), 4U);
    EXPECT_EQ(names, expected);
    EXPECT_TRUE(inventory.cards.empty());
}

TEST(KernelInventory, TellsSpeedAndDuplexAsSysfsDoes) {
    REQUIRE_NAMESPACES();
    const Namespace space;
    space.ip("link add v0 type veth peer name v1");
    space.ip("link set v0 up");
    space.ip("link set v1 up");
    const auto inventory = inventoryOf(space);
    const auto& port = portNamed(inventory, "v0");
    EXPECT_EQ(port.speed, std::stoull(space.shell("cat /sys/class/net/v0/speed")) * 1'000'000U);
    EXPECT_EQ(port.fullDuplex, space.shell("cat /sys/class/net/v0/duplex") == "full\n");
    EXPECT_EQ(port.requestedSpeed, port.speed); // a veth pair does not negotiate
    EXPECT_FALSE(port.maxSpeed);                // and lists no modes
    EXPECT_FALSE(port.autoSense);
    EXPECT_FALSE(port.portType);
    EXPECT_EQ(port.linkTechnology, 2);
    EXPECT_EQ(port.caption, json::parse(space.ip("-d -j link show v0"))[0]["linkinfo"]["info_kind"]);
}

TEST(KernelInventory, LeavesSpeedOpenWhereTheDriverKnowsNone) {
    REQUIRE_NAMESPACES();
    const Namespace space;
    space.ip("link add br0 type bridge");
    const auto inventory = inventoryOf(space);
    const auto& port = portNamed(inventory, "br0");
    EXPECT_FALSE(port.speed);
    EXPECT_FALSE(port.fullDuplex);
    EXPECT_FALSE(port.permanentAddress);
}

/** The kernel settles the state of a link in a worker, some time after the carrier has changed. */
void waitForState(const Namespace& space, const std::string& name, const std::string& state) {
    constexpr int attempts = 100;
    for (int i = 0; i < attempts; ++i) {
        if (json::parse(space.ip("-j link show " + name))[0]["operstate"] == state) {
            return;
        }
        std::this_thread::sleep_for(std::chrono::milliseconds(50));
    }
    FAIL() << name << " did not become " << state;
}

TEST(KernelInventory, TellsTheStatusOfALink) {
    REQUIRE_NAMESPACES();
    const Namespace space;
    space.ip("link add v0 type veth peer name v1");
    EXPECT_EQ(portNamed(inventoryOf(space), "v0").status, "Stopped");
    space.ip("link set v0 up");
    EXPECT_EQ(portNamed(inventoryOf(space), "v0").status, "Lost Comm");
    space.ip("link set v1 up");
    waitForState(space, "v0", "UP");
    EXPECT_EQ(portNamed(inventoryOf(space), "v0").status, "OK");
}

TEST(KernelInventory, TellsTheAliasAsDescription) {
    REQUIRE_NAMESPACES();
    const Namespace space;
    space.ip("link add br0 type bridge");
    space.ip("link set br0 alias 'uplink of rack 7'");
    EXPECT_EQ(portNamed(inventoryOf(space), "br0").description, "uplink of rack 7");
}

TEST(KernelInventory, TakesANameOfFifteenCharacters) {
    REQUIRE_NAMESPACES();
    const Namespace space;
    space.ip("link add fifteen-letters type bridge");
    EXPECT_EQ(inventoryOf(space).ports.at(0).name, "fifteen-letters");
    space.run([] {
        EXPECT_FALSE(findParentDevice("fifteen-letters"));
        EXPECT_FALSE(findParentDevice("sixteen--letters"));
    });
}

TEST(KernelInventory, HasNoDeviceForVirtualOrMissingInterfaces) {
    REQUIRE_NAMESPACES();
    const Namespace space;
    space.ip("link add br0 type bridge");
    space.run([] {
        EXPECT_FALSE(findParentDevice("br0"));
        EXPECT_FALSE(findParentDevice("nothing"));
        EXPECT_FALSE(findParentDevice(""));
        EXPECT_FALSE(readPermanentAddress("br0"));
        EXPECT_FALSE(readPermanentAddress("nothing"));
    });
}

TEST(KernelInventory, SaysTheSameByIoctlAsByNetlink) {
    REQUIRE_NAMESPACES();
    const Namespace space;
    space.ip("link add v0 type veth peer name v1");
    space.ip("link add br0 type bridge");
    space.run([] {
        Hardware::NetlinkSocket socket(NETLINK_ROUTE);
        const auto links = Hardware::readLinks(socket);
        const auto byNetlink = Hardware::readLinkSettings(links);
        const Hardware::EthtoolIoctl ioctl;
        std::size_t compared = 0;
        for (const auto& link : links) {
            const auto found = byNetlink.find(link.index);
            const auto byIoctl = ioctl.linkSettings(link.name);
            EXPECT_EQ(found != byNetlink.end(), byIoctl.has_value()) << link.name;
            if (found != byNetlink.end() && byIoctl) {
                EXPECT_EQ(found->second, *byIoctl) << link.name;
                ++compared;
            }
        }
        EXPECT_EQ(compared, 3U); // the bridge and both ends of the pair
    });
}

/** Makes generic netlink look as if the kernel had none, for the calling thread. */
void hideGenericNetlink() {
    const auto argument = [](unsigned number) {
        return static_cast<__u32>(offsetof(seccomp_data, args) + number * sizeof(__u64));
    };
    std::array<sock_filter, 8> program{{
        BPF_STMT(BPF_LD | BPF_W | BPF_ABS, offsetof(seccomp_data, nr)),
        BPF_JUMP(BPF_JMP | BPF_JEQ | BPF_K, __NR_socket, 0, 5),
        BPF_STMT(BPF_LD | BPF_W | BPF_ABS, argument(0)),
        BPF_JUMP(BPF_JMP | BPF_JEQ | BPF_K, AF_NETLINK, 0, 3),
        BPF_STMT(BPF_LD | BPF_W | BPF_ABS, argument(2)),
        BPF_JUMP(BPF_JMP | BPF_JEQ | BPF_K, NETLINK_GENERIC, 0, 1),
        BPF_STMT(BPF_RET | BPF_K, SECCOMP_RET_ERRNO | EPROTONOSUPPORT),
        BPF_STMT(BPF_RET | BPF_K, SECCOMP_RET_ALLOW),
    }};
    const sock_fprog filter{program.size(), program.data()};
    if (prctl(PR_SET_NO_NEW_PRIVS, 1, 0, 0, 0) != 0 || prctl(PR_SET_SECCOMP, SECCOMP_MODE_FILTER, &filter) != 0) {
        throw std::system_error(errno, std::generic_category(), "seccomp");
    }
}

TEST(KernelInventory, AsksByIoctlWhereTheKernelHasNoEthtoolNetlink) {
    REQUIRE_NAMESPACES();
    const Namespace space;
    space.ip("link add v0 type veth peer name v1");
    const auto usual = inventoryOf(space);
    space.run([&] {
        hideGenericNetlink();
        EXPECT_THROW(Hardware::NetlinkSocket(NETLINK_GENERIC), std::system_error);
        EXPECT_EQ(readHardwareInventory(), usual);
    });
    EXPECT_EQ(portNamed(usual, "v0").speed, 10'000'000'000U);
}

TEST(KernelInventory, ReadsAThousandInterfaces) {
    REQUIRE_NAMESPACES();
    const Namespace space;
    std::string lines;
    for (int i = 0; i < 500; ++i) {
        lines += "link add a" + std::to_string(i) + " type veth peer name b" + std::to_string(i) + '\n';
    }
    space.ipBatch(lines);
    const auto inventory = inventoryOf(space);
    EXPECT_EQ(inventory.ports.size(), 1000U);
    EXPECT_TRUE(std::all_of(inventory.ports.begin(), inventory.ports.end(),
                            [](const NetworkPort& port) { return port.speed == 10'000'000'000U; }));
}

TEST(KernelInventory, SurvivesInterfacesThatComeAndGo) {
    REQUIRE_NAMESPACES();
    const Namespace space;
    space.ip("link add fixed type bridge");
    std::string add;
    std::string remove;
    for (int i = 0; i < 40; ++i) {
        add += "link add a" + std::to_string(i) + " type veth peer name b" + std::to_string(i) + '\n';
        remove += "link del a" + std::to_string(i) + '\n';
    }
    std::atomic<bool> done = false;
    std::thread changer([&] {
        for (int round = 0; round < 3; ++round) {
            space.ipBatch(add);
            space.ipBatch(remove);
        }
        done = true;
    });
    int reads = 0;
    do {
        const auto inventory = inventoryOf(space);
        EXPECT_EQ(portNamed(inventory, "fixed").name, "fixed");
        ++reads;
    } while (!done);
    changer.join();
    EXPECT_EQ(inventoryOf(space).ports.size(), 1U);
    EXPECT_GT(reads, 1);
}

std::string attribute(const NetworkPort& port, const std::string& name) {
    return Hardware::readAttribute("/sys/class/net/" + port.name + '/' + name).value_or("");
}

TEST(NetlinkSocket, ThrowsTheKernelsErrorAndIsUsableAfterwards) {
    Hardware::NetlinkSocket socket(NETLINK_ROUTE);
    Hardware::NetlinkRequest request(RTM_GETLINK, 0);
    request.put<ifinfomsg>();
    mnl_attr_put_strz(&request.message(), IFLA_IFNAME, "no-such-link");
    try {
        socket.ask(request, [](Hardware::Bytes) { ADD_FAILURE() << "an answer"; });
        FAIL() << "no error";
    } catch (const std::system_error& error) {
        EXPECT_EQ(error.code(), std::errc::no_such_device) << error.what();
    }
    EXPECT_FALSE(Hardware::readLinks(socket).empty());
}

TEST(NetlinkSocket, PassesOnWhatTheHandlerThrows) {
    Hardware::NetlinkSocket socket(NETLINK_ROUTE);
    Hardware::NetlinkRequest request(RTM_GETLINK, NLM_F_DUMP);
    request.put<ifinfomsg>();
    EXPECT_THROW(socket.ask(request, [](Hardware::Bytes) { throw std::domain_error("enough"); }), std::domain_error);
}

TEST(HostInventory, NamesACardForEveryInterfaceThatSysfsShowsADeviceFor) {
    for (const auto& port : readHardwareInventory().ports) {
        EXPECT_EQ(port.card.has_value(), std::filesystem::exists("/sys/class/net/" + port.name + "/device"))
            << port.name;
        EXPECT_EQ(port.card.has_value(), findParentDevice(port.name).has_value()) << port.name;
    }
}

TEST(HostInventory, TellsThePermanentAddressAndThePlaceOfHardware) {
    constexpr const char* addressIsPermanent = "0"; // NET_ADDR_PERM
    int compared = 0;
    for (const auto& port : readHardwareInventory().ports) {
        if (!port.card) {
            continue;
        }
        EXPECT_EQ(port.portNumber, Hardware::readNumber("/sys/class/net/" + port.name + "/dev_port")) << port.name;
        if (attribute(port, "addr_assign_type") == addressIsPermanent && attribute(port, "addr_len") == "6") {
            EXPECT_EQ(port.permanentAddress, digits(attribute(port, "address"))) << port.name;
            EXPECT_EQ(readPermanentAddress(port.name)->size(), 6U) << port.name;
            ++compared;
        }
    }
    if (compared == 0) {
        GTEST_SKIP() << "this host has no interface whose address is the hardware's own";
    }
}

} // namespace
} // namespace Orv::Agent::Linux
