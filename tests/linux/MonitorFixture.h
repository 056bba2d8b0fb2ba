/**
 * @file
 * A namespace whose adapters are monitored, beside what `ip monitor` says of them.
 */
#pragma once

#include "tests/agent/EventReader.h"
#include "tests/linux/BackEndFixture.h"

#include <memory>
#include <string>
#include <vector>

namespace Orv::Test {

class MonitorFixture : public BackEndFixture {
  protected:
    void TearDown() override {
        reader.reset();
        monitor.reset();
    }

    /** From now on. */
    void startMonitoring() {
        monitor = std::make_unique<Agent::Monitor>(
            *backEnd, [this](int level, const std::string& text) { reports.add(std::to_string(level) + ' ' + text); });
        reader = std::make_unique<EventReader>(*backEnd, *monitor);
    }

    /** The statuses of an adapter's status events so far. */
    [[nodiscard]] std::vector<unsigned> statusesOf(const std::string& name) const {
        std::vector<unsigned> statuses;
        for (const SeenEvent& event : reader->seen.now()) {
            if (event.name == name) {
                statuses.push_back(event.status);
            }
        }
        return statuses;
    }

    /** Waits until the adapter's events are these. */
    void expectEvents(const std::string& name, const std::vector<unsigned>& statuses) const {
        EXPECT_EQ(awaited(statuses, [&] { return statusesOf(name); }), statuses) << name;
    }

    Collection<std::string> reports;
    std::unique_ptr<Agent::Monitor> monitor;
    std::unique_ptr<EventReader> reader;
};

} // namespace Orv::Test
