/**
 * @file
 * A sink that keeps the events that come of the kernel's messages.
 */
#pragma once

#include "agent/events/Differences.h"

#include <ostream>
#include <string>
#include <utility>
#include <vector>

#include <gtest/gtest.h>

namespace Orv::Test {

/** One event, without its node. */
struct Seen {
    std::string name;
    Agent::EventCode code;
    unsigned status;

    bool operator==(const Seen&) const = default;

    friend std::ostream& operator<<(std::ostream& out, const Seen& seen) {
        return out << seen.name << ' ' << static_cast<unsigned>(seen.code) << ' ' << seen.status;
    }
};

inline Seen statusOfAdapter(const std::string& name, unsigned status) {
    return {name, Agent::EventCode::status, status};
}

/** Keeps events in the order in which they come. */
class EventRecorder : public Agent::EventSink {
  public:
    void post(Agent::Event event) override {
        seen.push_back({event.node->description, event.code, Agent::statusOf(*event.node).value_or(0)});
        events.push_back(std::move(event));
    }

    void report(const std::string& text) override { ADD_FAILURE() << text; }

    std::vector<Seen> take() {
        events.clear();
        return std::exchange(seen, {});
    }

    std::vector<Seen> seen;
    std::vector<Agent::Event> events;
};

} // namespace Orv::Test
