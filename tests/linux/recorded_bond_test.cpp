// What becomes of the messages of a real bond, recorded while its cables were pulled and put back in.
#include "agent/events/Differences.h"
#include "agent/linux/LinkEvents.h"
#include "tests/linux/Recording.h"
#include "tests/linux/TemporaryHost.h"

#include <optional>
#include <string>
#include <utility>
#include <vector>

#include <gmock/gmock.h>
#include <gtest/gtest.h>

namespace Orv::Agent::Linux {
namespace {

using namespace Orv::Test;
using testing::Each;
using testing::ElementsAre;
using testing::IsEmpty;

/** Keeps "NAME STATUS" of every event that changes a status. */
class Statuses : public EventSink {
  public:
    void post(Event event) override {
        if (event.code == EventCode::status) {
            _seen.push_back(event.node->description + ' ' + std::to_string(statusOf(*event.node).value_or(0)));
        }
    }

    void report(const std::string& text) override { ADD_FAILURE() << text; }

    std::vector<std::string> take() { return std::exchange(_seen, {}); }

  private:
    std::vector<std::string> _seen;
};

HardwareSource noHardware() {
    return {[](const DeviceName&) { return std::nullopt; }, [](const std::string&) { return std::nullopt; },
            [](const std::string&) { return std::nullopt; }};
}

/** eth0, the primary member, and eth1 in bond0, an active-backup bond of Linux 6.1. */
class RecordedBondTest : public testing::Test {
  protected:
    void SetUp() override {
        configuration.refresh();
        steps = readRecording(MARLO_SOURCE_DIR "/tests/linux/fixtures/bond_fail_over.links");
        for (const MessageBytes& message : steps.front().messages) {
            state.load(message.parse());
        }
        tree.update(state, configuration, state.takeChanges());
        events.emplace(tree, statuses, state);
    }

    /** The steps up to this one, exclusively, whatever they bring. */
    void playUpTo(const std::string& command) {
        while (next < steps.size() && steps[next].command != command) {
            play(steps[next].command);
        }
    }

    /** The next step, which must be this one: its events. */
    std::vector<std::string> play(const std::string& command) {
        EXPECT_EQ(steps.at(next).command, command);
        bondStatuses.clear();
        for (const MessageBytes& message : steps.at(next).messages) {
            state.apply(message.parse());
            events->take(state, configuration, state.takeChanges());
            bondStatuses.push_back(bondStatus());
        }
        ++next;
        return statuses.take();
    }

    /** Of the live node; 0 when there is none. */
    [[nodiscard]] unsigned bondStatus() const {
        for (const auto& [index, link] : state.links()) {
            if (link.name == "bond0" && tree.adapter(index) != nullptr) {
                return statusOf(*tree.adapter(index)).value_or(0);
            }
        }
        return 0;
    }

    std::vector<RecordedStep> steps;
    std::size_t next = 1;
    std::vector<unsigned> bondStatuses; ///< of the live node, after each message of the last step

    TemporaryHost host;
    HostConfiguration configuration{host.root()};
    KernelState state;
    HostTree tree{noHardware()};
    Statuses statuses;
    std::optional<LinkEvents> events;
};

TEST_F(RecordedBondTest, comesUpWithItsMembers) {
    EXPECT_THAT(play("ip link add bond0 type bond mode active-backup miimon 100 primary_reselect always"), IsEmpty());
    EXPECT_THAT(play("ip link set eth0 master bond0"), ElementsAre("eth0 1"));
    EXPECT_THAT(play("ip link set eth1 master bond0"), ElementsAre("eth1 1"));
    EXPECT_THAT(play("ip link set bond0 type bond primary eth0"), IsEmpty());
    EXPECT_THAT(play("ip link set bond0 up"), ElementsAre("bond0 1"));
}

TEST_F(RecordedBondTest, switchesOverAndBackOnceEach) {
    playUpTo("cable eth0 off");
    EXPECT_THAT(play("cable eth0 off"), ElementsAre("eth0 12", "bond0 32"));
    EXPECT_THAT(bondStatuses, Each(1U));
    EXPECT_THAT(play("cable eth0 on"), ElementsAre("eth0 1", "bond0 33"));
    EXPECT_THAT(bondStatuses, Each(1U));
}

TEST_F(RecordedBondTest, losingTheBackupIsNoSwitch) {
    playUpTo("cable eth1 off");
    EXPECT_THAT(play("cable eth1 off"), ElementsAre("eth1 12"));
    EXPECT_EQ(bondStatus(), 1U);
}

TEST_F(RecordedBondTest, thatLostBothMembersComesBackOnItsBackup) {
    playUpTo("cable eth1 off");
    play("cable eth1 off");
    EXPECT_THAT(play("cable eth0 off"), ElementsAre("eth0 12", "bond0 12"));
    // The kernel names the member first, and says only then that there is a carrier.
    EXPECT_THAT(play("cable eth1 on"), ElementsAre("eth1 1", "bond0 32", "bond0 1"));
    EXPECT_THAT(play("cable eth0 on"), ElementsAre("eth0 1", "bond0 33"));
}

TEST_F(RecordedBondTest, moveByHandIsASwitchOfTheBondAlone) {
    playUpTo("ip link set bond0 type bond active_slave eth1");
    EXPECT_THAT(play("ip link set bond0 type bond active_slave eth1"), ElementsAre("bond0 32"));
    EXPECT_THAT(play("ip link set eth1 nomaster"), ElementsAre("bond0 33", "eth1 5"));
}

TEST_F(RecordedBondTest, isStoppedWhenItIsRemoved) {
    playUpTo("ip link del bond0");
    EXPECT_THAT(play("ip link del bond0"), ElementsAre("bond0 5", "eth0 5"));
    EXPECT_EQ(bondStatus(), 0U);
    EXPECT_EQ(next, steps.size());
}

} // namespace
} // namespace Orv::Agent::Linux
