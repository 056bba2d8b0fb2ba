/**
 * @file
 * A receiver of events as providers are: it has room for one event only, and looks at it on another thread.
 */
#pragma once

#include "agent/events/Differences.h"
#include "agent/events/Monitor.h"
#include "agent/tree/Cursor.h"
#include "tests/agent/Collection.h"

#include <condition_variable>
#include <mutex>
#include <ostream>
#include <string>
#include <thread>
#include <utility>
#include <vector>

namespace Orv::Test {

/** What the receiver has read of an event. */
struct SeenEvent {
    std::string name; ///< empty when the path led to no node
    unsigned int status = 0;
    Agent::EventCode code = Agent::EventCode::status;

    bool operator==(const SeenEvent&) const = default;

    friend std::ostream& operator<<(std::ostream& out, const SeenEvent& event) {
        return out << event.name << ' ' << event.status << " (" << static_cast<unsigned>(event.code) << ')';
    }
};

inline SeenEvent readEvent(Agent::BackEnd& backEnd, Agent::EventCode code, const std::string& path) {
    Agent::Cursor cursor(backEnd);
    cursor.select(path);
    SeenEvent seen;
    seen.code = code;
    cursor.get(NodeLexicon::PROP_NODE_STRING, seen.name);
    cursor.get(NodeLexicon::PROP_STATUS, seen.status);
    return seen;
}

/** Subscribes to the adapters of a monitor and reads every status event on a thread that is made for it. */
class EventReader {
  public:
    EventReader(Agent::BackEnd& backEnd, Agent::Monitor& monitor) : _backEnd(backEnd), _monitor(monitor) {
        _monitor.start(key(), [this](const Agent::Handover::Delivery& delivery) { take(delivery); });
    }

    ~EventReader() {
        _monitor.stop(key());
        std::unique_lock lock(_mutex);
        _idle.wait(lock, [&] { return _threads == 0; });
    }

    EventReader(const EventReader&) = delete;
    EventReader& operator=(const EventReader&) = delete;

    Collection<SeenEvent> seen;
    Collection<Agent::EventCode> ignored; ///< codes of the other events

  private:
    [[nodiscard]] Agent::Monitor::Key key() const { return {NodeLexicon::NODE_NETWORK_ADAPTER, 1, this}; }

    void take(const Agent::Handover::Delivery& delivery) {
        if (delivery.code != Agent::EventCode::status) {
            ignored.add(delivery.code);
            return;
        }
        const std::lock_guard lock(_mutex);
        _record = delivery.path;
        ++_threads;
        std::thread([this] { read(); }).detach();
    }

    void read() {
        std::string path;
        {
            const std::lock_guard lock(_mutex);
            path = _record;
        }
        SeenEvent event = readEvent(_backEnd, Agent::EventCode::status, path);
        // In the order of the pick-ups, for the next event may be read before this thread goes on.
        const std::lock_guard lock(_mutex);
        seen.add(std::move(event));
        --_threads;
        _idle.notify_all();
    }

    Agent::BackEnd& _backEnd;
    Agent::Monitor& _monitor;
    std::mutex _mutex;
    std::condition_variable _idle;
    std::string _record; ///< the one event that there is room for
    int _threads = 0;
};

} // namespace Orv::Test
