/**
 * @file
 * Handing the events of one receiver over, one at a time.
 */
#pragma once

#include "agent/events/EventRecords.h"

#include <chrono>
#include <deque>
#include <functional>
#include <memory>
#include <optional>
#include <string>
#include <thread>

namespace Orv::Agent {

/** How long a receiver is waited for. */
struct HandoverTimes {
    /** For an event to be picked up, where events are picked up. */
    std::chrono::nanoseconds whole = std::chrono::seconds(5);

    /** Where they are not: shared among the events that wait, which bounds how far they fall behind. */
    std::chrono::nanoseconds crowded = std::chrono::milliseconds(100);

    /** From the pick-up of an event to the end of the thread that did it, where such threads end. */
    std::chrono::nanoseconds work = std::chrono::milliseconds(500);
};

/**
 * The events that wait for one receiver, and the one that it has not picked up yet. A receiver may have room for one
 * event only, so that the next would take the place of one that it has not looked at: it is handed over when the last
 * has been picked up, or given up on. Events of a code other than EventCode::status are not waited for.
 *
 * A receiver that has a thread made for every event would see its events overtake each other, should the next be
 * handed over as soon as the last has been picked up. So the thread that picked an event up is given some time to
 * end, too; not after one has used up that time, until one ends again: then the receiver's threads are of another
 * kind.
 *
 * A receiver that switches itself off picks nothing up: each event in a row that goes by unselected quarters the
 * wait for the next. The first that is picked up, however late, makes the wait whole again. One thread at a time.
 */
class Handover {
  public:
    using Clock = std::chrono::steady_clock;

    /** Takes lines for the log with their level. */
    using Report = std::function<void(int level, const std::string& text)>;

    /** `records` must outlive this. `wakeUp` is signalled when the receiver picks an event up. */
    Handover(EventRecords& records, const std::shared_ptr<const WakeUp>& wakeUp, HandoverTimes times, Report report);

    void add(const Event& event) { _waiting.push_back(event); }

    struct Delivery {
        EventCode code;
        std::chrono::system_clock::time_point time;
        std::string path;
    };

    /** The event to hand over now; none while the last one is waited for, and when there is none. */
    std::optional<Delivery> next(Clock::time_point now);

    /** When next() is to be asked again though nothing happens before; none: never. */
    [[nodiscard]] std::optional<Clock::time_point> deadline() const;

  private:
    struct Outstanding {
        std::uint64_t number;
        std::string name;
        Clock::time_point since;
        std::optional<Clock::time_point> pickedUp; ///< when that was seen
        bool isLate = false;                       ///< so that its pick-up wakes
    };

    [[nodiscard]] std::chrono::nanoseconds patience() const;
    void settle(Clock::time_point now);
    void settlePickUp(std::thread::id thread, Clock::time_point now);
    void giveUp();

    EventRecords& _records;
    HandoverTimes _times;
    Report _report;
    std::shared_ptr<PickUps> _pickUps;
    std::uint64_t _seenPickUps = 0;
    std::uint64_t _seenThreadEnd = 0;
    bool _threadsEnd = true; ///< as far as is known, a thread ends when it is done with an event
    std::deque<Event> _waiting;
    std::optional<Outstanding> _outstanding;
    unsigned _missed = 0; ///< events in a row that were not picked up
};

} // namespace Orv::Agent
