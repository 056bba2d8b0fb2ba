// Teams as the reader of the kernel's tables finds them.
#include "agent/linux/KernelReader.h"
#include "tests/vm/Guest.h"

#include <algorithm>
#include <memory>

#include <gmock/gmock.h>
#include <linux/if.h>
#include <poll.h>
#include <sys/syscall.h>
#include <unistd.h>

namespace Orv::Test {
namespace {

using Agent::Linux::Carrier;
using Agent::Linux::KernelReader;
using Agent::Linux::KernelState;
using Agent::Linux::Link;

Link linkNamed(const KernelState& state, const std::string& name) {
    for (const auto& known : state.links()) {
        if (known.second.name == name) {
            return known.second;
        }
    }
    throw std::runtime_error("no " + name);
}

std::string carrierOf(const KernelState& state) {
    const int member = state.carrierOf(linkNamed(state, "team0")).member;
    return member == 0 ? "" : state.links().at(member).name;
}

bool isReadable(const KernelReader& reader) {
    pollfd file{reader.descriptor(), POLLIN, 0};
    return poll(&file, 1, 0) > 0;
}

void carryBy(const std::string& port) {
    shell("teamnl team0 setoption activeport $(cat /sys/class/net/" + port + "/ifindex)");
}

TEST_F(PreferringTeamTest, isReadableOnceItHasMoved) {
    KernelReader reader;
    EXPECT_EQ(carrierOf(reader.state()), "eth0");
    isSoon([&] { return reader.update(), !isReadable(reader); });
    EXPECT_FALSE(isReadable(reader));
    carryBy("eth1");
    EXPECT_TRUE(isReadable(reader));
    EXPECT_EQ(carrierOf(reader.update()), "eth1");
    EXPECT_EQ(reader.fullReads(), 1U);
}

TEST_F(PreferringTeamTest, movesBehindThePortsThatItMovesFor) {
    KernelReader reader;

    struct Step {
        bool isCabled;
        std::string carrier;
    };

    std::vector<Step> steps;
    reader.onStep([&](const KernelState& state) {
        reader.takeChanges();
        steps.push_back({(linkNamed(state, "eth0").flags & IFF_LOWER_UP) != 0, carrierOf(state)});
    });
    pullCable("eth0");
    expectCarrier("eth1");
    reader.update();
    const auto move =
        std::find_if(steps.begin(), steps.end(), [](const Step& step) { return step.carrier == "eth1"; });
    ASSERT_NE(move, steps.end());
    EXPECT_FALSE(move->isCabled);
    ASSERT_NE(move, steps.begin());
    EXPECT_FALSE((move - 1)->isCabled) << "a step of its own";
}

TEST_F(PreferringTeamTest, isReadAnewAfterAnOverrun) {
    KernelReader reader(1);
    const unsigned reads = reader.fullReads();
    for (int round = 0; round < 20; ++round) {
        carryBy("eth1");
        carryBy("eth0");
    }
    carryBy("eth1");
    EXPECT_EQ(carrierOf(reader.update()), "eth1");
    EXPECT_GT(reader.fullReads(), reads) << "nothing was lost";
    carryBy("eth0");
    EXPECT_EQ(carrierOf(reader.update()), "eth0") << "the queue takes announcements again";
}

TEST_F(PreferringTeamTest, hasNoCarrierForWhoMayNotAsk) {
    std::unique_ptr<KernelReader> reader;
    std::thread reading([&] {
        // The system call itself, which concerns this thread alone.
        ASSERT_EQ(syscall(SYS_setresuid, 65534, 65534, 65534), 0);
        reader = std::make_unique<KernelReader>();
    });
    reading.join();
    EXPECT_EQ(linkNamed(reader->state(), "team0").kind, "team");
    EXPECT_EQ(carrierOf(reader->state()), "");
    carryBy("eth1");
    shell("teamnl -p eth1 team0 setoption priority 5");
    EXPECT_EQ(carrierOf(reader->update()), "") << "announcements tell only half of it";
}

} // namespace
} // namespace Orv::Test
