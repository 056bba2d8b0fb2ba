/**
 * @file
 * The events that were handed out, by the paths that they were handed out as.
 */
#pragma once

#include "agent/events/Event.h"
#include "agent/events/WakeUp.h"

#include <atomic>
#include <cstddef>
#include <cstdint>
#include <deque>
#include <map>
#include <memory>
#include <mutex>
#include <optional>
#include <string>
#include <string_view>
#include <thread>
#include <utility>

namespace Orv::Agent {

/** What has become of the events that a receiver was handed; wakes who waits for it. Any thread. */
class PickUps {
  public:
    explicit PickUps(std::shared_ptr<const WakeUp> wakeUp) : _wakeUp(std::move(wakeUp)) {}

    void addPickUp();

    /** Whether a pick-up wakes: not where its thread's end is waited for, which does. Not in the beginning. */
    void wakeOnPickUp(bool wakes) { _wakesOnPickUp.store(wakes); }

    /** The thread that picked an event up has ended: whatever it did with the event is done. */
    void addThreadEnd(std::uint64_t number);

    /** How many events have been picked up. */
    [[nodiscard]] std::uint64_t count() const { return _count.load(); }

    /** The latest event of which the thread has ended; 0: none. */
    [[nodiscard]] std::uint64_t lastThreadEnd() const { return _lastThreadEnd.load(); }

  private:
    std::shared_ptr<const WakeUp> _wakeUp;
    std::atomic<std::uint64_t> _count{0};
    std::atomic<std::uint64_t> _lastThreadEnd{0};
    std::atomic<bool> _wakesOnPickUp{false};
};

/**
 * An event path is "event/", a number, ":" and the path of the node in the tree. While there is a record of the
 * event, the path leads to the node as it was; afterwards to the node as it is.
 *
 * A record is open until the receiver has picked the event up or is given up on; of the closed ones the latest are
 * kept, for who looks at an event twice. Every operation from any thread.
 */
class EventRecords {
  public:
    static constexpr std::size_t keptRecords = 256;

    struct Ticket {
        std::uint64_t number;
        std::string path;
    };

    Ticket open(Event event, std::shared_ptr<PickUps> receiver);

    /** Which thread has picked the event up; none: no thread so far, or there is no record. */
    [[nodiscard]] std::optional<std::thread::id> pickedUpBy(std::uint64_t number) const;

    void close(std::uint64_t number);

    /** A node, with nothing but its ancestors beside it. */
    struct Moment {
        std::shared_ptr<const Tree> tree;
        std::string path; ///< of the node in this tree
    };

    /** What an event path leads to; its first use tells the receiver's PickUps. None without a record. */
    std::optional<Moment> pickUp(std::string_view path);

    /** The path of the node itself, from an event path; any other path as it is. */
    static std::string_view livePath(std::string_view path);

  private:
    struct Record {
        Event event;
        std::shared_ptr<PickUps> receiver;
        std::optional<std::thread::id> pickedUpBy;
    };

    mutable std::mutex _mutex; ///< guards everything below
    std::map<std::uint64_t, Record> _records;
    std::deque<std::uint64_t> _closed; ///< oldest first
    std::uint64_t _last = 0;
};

} // namespace Orv::Agent
