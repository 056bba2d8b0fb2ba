#include "agent/linux/KernelReader.h"
#include "agent/linux/LinuxBackEnd.h"
#include "tests/linux/IpReport.h"
#include "tests/linux/TemporaryHost.h"
#include "tests/linux/TreeReading.h"
#include "tests/support/Namespace.h"

#include <atomic>
#include <cerrno>
#include <chrono>
#include <system_error>
#include <thread>

#include <gmock/gmock.h>
#include <gtest/gtest.h>
#include <libmnl/libmnl.h>
#include <linux/rtnetlink.h>

namespace Orv::Agent::Linux {
namespace {

using namespace Orv::Test;

std::string pairs(int from, int to) {
    std::string lines;
    for (int pair = from; pair < to; ++pair) {
        const std::string number = std::to_string(pair);
        lines += "link add a" + number + " type veth peer name b" + number + "\n";
    }
    return lines;
}

std::set<std::string> linkNames(const KernelState& state) {
    std::set<std::string> names;
    for (const auto& entry : state.links()) {
        names.insert(entry.second.name);
    }
    return names;
}

std::set<std::string> namesByIp(const Namespace& space) {
    std::set<std::string> names{"lo"};
    for (const auto& entry : ipReport(space)) {
        names.insert(entry.first);
    }
    return names;
}

std::unique_ptr<KernelReader> readerIn(const Namespace& space, int receiveBytes) {
    std::unique_ptr<KernelReader> reader;
    space.run([&] { reader = std::make_unique<KernelReader>(receiveBytes); });
    return reader;
}

TEST(KernelReader, readsEverythingOnceAndThenFollows) {
    REQUIRE_NAMESPACES();
    const Namespace space;
    const auto reader = readerIn(space, KernelReader::usualReceiveBytes);
    EXPECT_EQ(reader->fullReads(), 1U);
    space.ipBatch(pairs(0, 50));
    EXPECT_EQ(linkNames(reader->update()).size(), 101U);
    space.ipBatch("link del a0\nlink del a1\n");
    EXPECT_EQ(linkNames(reader->update()), namesByIp(space));
    EXPECT_EQ(reader->fullReads(), 1U);
}

/** A queue of the smallest size overflows; what follows must be a full reading, and nothing of the lost time may
 * stay. */
TEST(KernelReader, readsEverythingAgainAfterAnOverrun) {
    REQUIRE_NAMESPACES();
    const Namespace space;
    const auto reader = readerIn(space, 1);
    space.ipBatch(pairs(0, 100));
    reader->takeChanges();
    EXPECT_EQ(linkNames(reader->update()), namesByIp(space));
    const unsigned reads = reader->fullReads();
    EXPECT_GT(reads, 1U);
    EXPECT_EQ(reader->takeChanges().size(), 201U);

    // The queue takes notifications again.
    space.ip("link set a0 up");
    EXPECT_NE(reader->update().links().size(), 0U);
    EXPECT_EQ(reader->fullReads(), reads);
    EXPECT_FALSE(reader->takeChanges().empty());
}

/** The queue still holds the news of an interface whose end was lost in the overrun. */
TEST(KernelReader, doesNotBelieveWhatWaitedBeforeAnOverrun) {
    REQUIRE_NAMESPACES();
    const Namespace space;
    const auto reader = readerIn(space, 1);
    space.ipBatch("link add ghost0 type veth peer name ghost1\n" + pairs(0, 100) + "link del ghost0\n");
    EXPECT_EQ(linkNames(reader->update()), namesByIp(space));
    EXPECT_EQ(linkNames(reader->update()), namesByIp(space));
}

TEST(KernelReader, reportsInterfacesThatVanishedInAnOverrunAsChanged) {
    REQUIRE_NAMESPACES();
    const Namespace space;
    space.ipBatch(pairs(0, 100));
    const auto reader = readerIn(space, 1);
    reader->takeChanges();
    std::string lines;
    for (int pair = 0; pair < 100; ++pair) {
        lines += "link del a" + std::to_string(pair) + "\n";
    }
    space.ipBatch(lines);
    EXPECT_EQ(reader->update().links().size(), 1U);
    EXPECT_GE(reader->takeChanges().size(), 200U);
}

TEST(KernelReader, hearsOfDefaultRoutesAndNotOfOthers) {
    REQUIRE_NAMESPACES();
    const Namespace space;
    space.ipBatch(pairs(0, 1) + "link set a0 up\nlink set b0 up\naddr add 192.0.2.10/24 dev a0\n");
    const auto reader = readerIn(space, 1);
    const unsigned reads = reader->fullReads();
    std::string lines;
    for (int route = 0; route < 1000; ++route) {
        lines += "route add 10." + std::to_string(route / 250) + "." + std::to_string(route % 250) +
                 ".0/24 via 192.0.2.1 dev a0\n";
    }
    space.ipBatch(lines);
    reader->update();
    EXPECT_EQ(reader->fullReads(), reads) << "a thousand routes went through a queue that holds a few";
    space.ip("route add default via 192.0.2.1 dev a0");
    EXPECT_EQ(reader->update().routesOf(2).size() + reader->update().routesOf(3).size(), 1U);
}

TEST(RequestSocket, passesOnTheKernelsOwnWords) {
    RequestSocket socket;
    std::array<char, 256> buffer{};
    nlmsghdr* request = mnl_nlmsg_put_header(buffer.data());
    request->nlmsg_type = RTM_GETADDR;
    auto* header = static_cast<ifaddrmsg*>(mnl_nlmsg_put_extra_header(request, sizeof(ifaddrmsg)));
    header->ifa_family = AF_INET;
    header->ifa_prefixlen = 24;
    try {
        socket.dump(*request, "asking what cannot be asked", [](const nlmsghdr&) {});
        FAIL() << "the kernel answers";
    } catch (const std::system_error& error) {
        EXPECT_EQ(error.code().value(), EINVAL);
        EXPECT_THAT(error.what(), testing::HasSubstr("asking what cannot be asked: ipv4: Invalid values"));
    }
    // The next exchange on the same socket is not disturbed.
    header->ifa_prefixlen = 0;
    int addresses = 0;
    EXPECT_EQ(socket.dump(*request, "reading", [&](const nlmsghdr&) { ++addresses; }),
              RequestSocket::Dump::consistent);
}

/** Readers and one back end under steady change; what is read is checked where a change has a before and an after. */
TEST(LinuxBackEnd, isReadByManyThreadsWhileInterfacesChange) {
    REQUIRE_NAMESPACES();
    const Namespace space;
    const TemporaryHost host;
    space.ipBatch(pairs(0, 20));
    std::unique_ptr<BackEnd> backEnd;
    space.run([&] { backEnd = makeLinuxBackEnd({host.root()}); });
    std::atomic<bool> running{true};
    std::atomic<unsigned> snapshots{0};
    std::vector<std::thread> readers;
    for (int reader = 0; reader < 4; ++reader) {
        readers.emplace_back([&] {
            while (running) {
                const auto tree = backEnd->snapshot();
                for (const auto& node : tree->nodesOfType(NodeLexicon::NODE_NETWORK_ADAPTER)) {
                    EXPECT_NE(tree->find(node->parentPath), nullptr);
                }
                // Pairs come and go together.
                EXPECT_NE(adapterOf(*tree, "a0"), nullptr);
                ++snapshots;
            }
        });
    }
    for (int round = 0; round < 10; ++round) {
        space.ipBatch(pairs(100, 110) + "addr add 192.0.2.10/24 dev a1\nlink set a1 up\n");
        EXPECT_EQ(textOf(*backEnd->snapshot(), "a1", NodeLexicon::PROP_IPV4_ADDRESS), "192.0.2.10");
        std::string lines = "addr del 192.0.2.10/24 dev a1\nlink set a1 down\n";
        for (int pair = 100; pair < 110; ++pair) {
            lines += "link del a" + std::to_string(pair) + "\n";
        }
        space.ipBatch(lines);
        EXPECT_EQ(textOf(*backEnd->snapshot(), "a1", NodeLexicon::PROP_IPV4_ADDRESS), "");
        EXPECT_EQ(adapterNames(*backEnd->snapshot()).size(), 40U);
    }
    running = false;
    for (std::thread& reader : readers) {
        reader.join();
    }
    EXPECT_GT(snapshots, 0U);
}

/** New readings while interfaces come and go under them, the vanishing of one between two requests included. */
TEST(LinuxBackEnd, readsANamespaceInWhichInterfacesVanish) {
    REQUIRE_NAMESPACES();
    const Namespace space;
    const TemporaryHost host;
    std::atomic<bool> running{true};
    std::thread changer([&] {
        while (running) {
            space.ipBatch(pairs(0, 20) + "link del a3\nlink del a4\nlink del a5\n");
            space.ipBatch("link del a0\nlink del a1\nlink del a2\n" + pairs(3, 6));
            space.shell("for pair in $(seq 3 19); do ip link del a$pair; done");
        }
    });
    const auto end = std::chrono::steady_clock::now() + std::chrono::seconds(2);
    unsigned readings = 0;
    while (std::chrono::steady_clock::now() < end) {
        std::unique_ptr<BackEnd> backEnd;
        space.run([&] { backEnd = makeLinuxBackEnd({host.root()}); });
        EXPECT_NO_THROW(backEnd->snapshot());
        ++readings;
    }
    running = false;
    changer.join();
    EXPECT_GT(readings, 5U);
    std::unique_ptr<BackEnd> backEnd;
    space.run([&] { backEnd = makeLinuxBackEnd({host.root()}); });
    EXPECT_TRUE(awaited(true, [&] { return kernelProperties(*backEnd->snapshot()) == ipReport(space); }));
}

TEST(KernelReader, followsTenThousandInterfacesAsTheyCome) {
    REQUIRE_NAMESPACES();
    const Namespace space;
    const auto follower = readerIn(space, KernelReader::usualReceiveBytes);
    space.ipBatch(pairs(0, 5000));
    EXPECT_EQ(follower->update().links().size(), 10001U);
    EXPECT_EQ(follower->fullReads(), 1U) << "the queue is too short";
    const auto reader = readerIn(space, KernelReader::usualReceiveBytes);
    EXPECT_EQ(reader->update().links(), follower->update().links());
}

TEST(LinuxBackEnd, readsAThousandInterfaces) {
    REQUIRE_NAMESPACES();
    const Namespace space;
    const TemporaryHost host;
    std::string lines = pairs(0, 500);
    for (int pair = 0; pair < 500; ++pair) {
        const std::string number = std::to_string(pair);
        lines += "addr add 10." + std::to_string(pair / 250) + "." + std::to_string(pair % 250) + ".1/24 dev a" +
                 number + "\n";
        lines += pair % 3 == 0 ? "link set a" + number + " up\n" : "";
    }
    std::unique_ptr<BackEnd> before;
    space.run([&] { before = makeLinuxBackEnd({host.root()}); });
    space.ipBatch(lines);
    std::unique_ptr<BackEnd> after;
    space.run([&] { after = makeLinuxBackEnd({host.root()}); });
    EXPECT_EQ(ipReport(space).size(), 1000U);
    const auto agrees = [&](BackEnd& backEnd) {
        return awaited(true, [&] { return kernelProperties(*backEnd.snapshot()) == ipReport(space); });
    };
    EXPECT_TRUE(agrees(*after)) << "read at once";
    EXPECT_TRUE(agrees(*before)) << "followed";
}

} // namespace
} // namespace Orv::Agent::Linux
