/**
 * @file
 * Playing a recording to the agent: message by message to its state of the kernel, and from there to events.
 */
#pragma once

#include "agent/events/Differences.h"
#include "agent/linux/LinkEvents.h"
#include "tests/linux/NoHardware.h"
#include "tests/linux/Recording.h"
#include "tests/linux/TemporaryHost.h"

#include <optional>
#include <ostream>
#include <string>
#include <utility>
#include <vector>

#include <gtest/gtest.h>

namespace Orv::Test {

/** Keeps "NAME STATUS" of every event that changes a status. */
class Statuses : public Agent::EventSink {
  public:
    void post(Agent::Event event) override {
        if (event.code == Agent::EventCode::status) {
            _seen.push_back(event.node->description + ' ' + std::to_string(Agent::statusOf(*event.node).value_or(0)));
        }
    }

    void report(const std::string& text) override { ADD_FAILURE() << text; }

    std::vector<std::string> take() { return std::exchange(_seen, {}); }

  private:
    std::vector<std::string> _seen;
};

/** An interface that stands on others, and the file of what happened to it. */
struct RecordedInterface {
    const char* name;
    const char* fixture;

    friend std::ostream& operator<<(std::ostream& out, const RecordedInterface& shown) { return out << shown.name; }
};

/** Of eth0, the primary member, and eth1: an active-backup bond of Linux 6.1. */
inline constexpr RecordedInterface recordedBond{"bond0", "bond_fail_over.links"};

/** Of eth0, with the higher priority, and eth1: run as activebackup by teamd on Linux 6.1. */
inline constexpr RecordedInterface recordedTeam{"team0", "team_fail_over.links"};

/** A recording, played step by step. */
class RecordedTest : public testing::Test {
  protected:
    explicit RecordedTest(const RecordedInterface& interface)
        : steps(readRecording(std::string(MARLO_SOURCE_DIR "/tests/linux/fixtures/") + interface.fixture)),
          _interface(interface.name) {
        configuration.refresh();
        for (const RecordedMessage& message : steps.front().messages) {
            state.load(message.parse());
        }
        tree.update(state, configuration, state.takeChanges());
        events.emplace(tree, statuses, state);
    }

    /** The steps up to the first that begins so, exclusively, whatever they bring. */
    void playUpTo(const std::string& command) {
        while (next < steps.size() && steps[next].command.rfind(command, 0) != 0) {
            play(steps[next].command);
        }
    }

    /** The next step, which must begin so: its events. */
    std::vector<std::string> play(const std::string& command) {
        EXPECT_EQ(steps.at(next).command.substr(0, command.size()), command);
        liveStatuses.clear();
        for (const RecordedMessage& message : steps.at(next).messages) {
            state.apply(message.parse());
            events->take(state, configuration, state.takeChanges());
            liveStatuses.push_back(liveStatus());
        }
        ++next;
        return statuses.take();
    }

    /** Of the interface's live node; 0 when there is none. */
    [[nodiscard]] unsigned liveStatus() const {
        for (const auto& [index, link] : state.links()) {
            if (link.name == _interface && tree.adapter(index) != nullptr) {
                return Agent::statusOf(*tree.adapter(index)).value_or(0);
            }
        }
        return 0;
    }

    std::vector<RecordedStep> steps;
    std::size_t next = 1;
    std::vector<unsigned> liveStatuses; ///< after each message of the last step

    TemporaryHost host;
    Agent::Linux::HostConfiguration configuration{host.root()};
    Agent::Linux::KernelState state;
    Agent::Linux::HostTree tree{noHardware()};
    Statuses statuses;
    std::optional<Agent::Linux::LinkEvents> events;

  private:
    std::string _interface;
};

} // namespace Orv::Test
