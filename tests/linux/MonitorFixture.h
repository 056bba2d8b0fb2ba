/**
 * @file
 * A namespace whose adapters are monitored, beside what `ip monitor` says of them.
 */
#pragma once

#include "tests/agent/EventReader.h"
#include "tests/linux/BackEndFixture.h"
#include "tests/linux/IpMonitor.h"

#include <algorithm>
#include <memory>
#include <sstream>
#include <string>
#include <vector>

namespace Orv::Test {

class MonitorFixture : public BackEndFixture {
  protected:
    void TearDown() override {
        ipMonitor.reset();
        reader.reset();
        monitor.reset();
    }

    /** From now on. */
    void startMonitoring() {
        ipMonitor = std::make_unique<IpMonitor>(*space);
        monitor = std::make_unique<Agent::Monitor>(*backEnd, [this](int level, const std::string& text) {
            reports.add(std::to_string(level) + ' ' + text);
        });
        reader = std::make_unique<EventReader>(*backEnd, *monitor);
    }

    [[nodiscard]] std::vector<Transition> transitions() const {
        std::vector<Transition> transitions;
        for (const SeenEvent& event : reader->seen.now()) {
            transitions.push_back({event.name, event.status});
        }
        return transitions;
    }

    /** The statuses of an adapter's events so far. */
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

    /**
     * The events are what `ip monitor` saw, of all interfaces, in the same order. Returns how many. Compared again
     * when they are not: the kernel may have something to say while they are.
     */
    std::size_t expectAgreementWithIpMonitor() {
        std::vector<Transition> expected;
        bool isEqual = false;
        for (int attempt = 0; attempt < 3 && !isEqual; ++attempt) {
            expected = ipMonitor->transitions();
            reader->seen.await(expected.size());
            isEqual = transitions() == expected;
        }
        EXPECT_TRUE(isEqual) << firstDifference(transitions(), expected);
        EXPECT_EQ(reports.now(), std::vector<std::string>());
        return expected.size();
    }

    /** Where two long lists part, for people. */
    static std::string firstDifference(const std::vector<Transition>& events,
                                       const std::vector<Transition>& expected) {
        const auto place = std::mismatch(events.begin(), events.end(), expected.begin(), expected.end());
        std::ostringstream text;
        text << events.size() << " events, " << expected.size() << " expected; from number "
             << place.first - events.begin() << " on:\n";
        for (auto event = place.first; event != events.end() && event - place.first < 5; ++event) {
            text << "  " << *event << '\n';
        }
        text << "instead of:\n";
        for (auto other = place.second; other != expected.end() && other - place.second < 5; ++other) {
            text << "  " << *other << '\n';
        }
        return text.str();
    }

    Collection<std::string> reports;
    std::unique_ptr<Agent::Monitor> monitor;
    std::unique_ptr<EventReader> reader;
    std::unique_ptr<IpMonitor> ipMonitor;
};

} // namespace Orv::Test
