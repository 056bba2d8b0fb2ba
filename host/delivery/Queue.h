/**
 * @file
 * What waits for one destination.
 */
#pragma once

#include <chrono>
#include <cstddef>
#include <cstdint>
#include <deque>
#include <memory>
#include <optional>
#include <string>
#include <vector>

namespace marlo::delivery {

/** One indication, shared by all the queues that it waits in. */
struct Event {
    std::int64_t id = 0;
    std::size_t bytes = 0;
    std::size_t waiting = 0;                ///< queues' items that stand for it
    std::shared_ptr<const std::string> xml; ///< null: on disk only
};

/** An indication in the queue of one destination. */
struct Item {
    std::int64_t number = 0; ///< SequenceNumber
    std::shared_ptr<Event> event;
    std::int64_t subscription = 0; ///< 0: for the destination itself
    std::int64_t posted = 0;       ///< µs since 1970
};

/** An item that has left its queue, and may leave the disk. */
struct Removal {
    std::int64_t destination = 0;
    std::int64_t number = 0;
    std::int64_t endedEvent = 0; ///< the event for which nobody waits any more; 0: somebody does
};

/**
 * The items of one destination in the order of their numbers, and which of them are on disk. Whoever uses it sees to
 * that threads do so one after the other.
 */
class Queue {
  public:
    Queue(std::int64_t destination, std::string context, std::int64_t next)
        : _destination(destination), _context(std::move(context)), _next(next) {}

    [[nodiscard]] std::int64_t destination() const { return _destination; }

    [[nodiscard]] const std::string& context() const { return _context; }

    [[nodiscard]] std::size_t length() const { return _items.size(); }

    [[nodiscard]] std::size_t bytes() const { return _bytes; }

    [[nodiscard]] const std::deque<Item>& items() const { return _items; }

    /** Gives the next number. */
    const Item& append(std::shared_ptr<Event> event, std::int64_t subscription, std::int64_t posted);
    /** As the disk had it; in the order of the numbers, before anything is appended. */
    void restore(Item&& item);

    /** All numbers below are on disk, those that a disk did not take left out. */
    void keptUpTo(std::int64_t number) { _kept = number; }

    [[nodiscard]] std::int64_t next() const { return _next; }

    /** The first item, when it is on disk; from now on it is on its way. Null when there is none. */
    const Item* begin();

    /** The item that was on its way waits again. */
    void giveBack() { _isOnItsWay = false; }

    [[nodiscard]] bool isOnItsWay() const { return _isOnItsWay; }

    /** Takes the item that was on its way out; nothing when it has left the queue meanwhile. */
    std::optional<Item> end(std::int64_t number);

    /** Takes the oldest item that is not on its way out; nothing when there is none. */
    std::optional<Item> takeOldest();
    /** Takes all items of a subscription out. */
    std::vector<Item> takeOf(std::int64_t subscription);
    /** Takes one item out; nothing when it is not there. */
    std::optional<Item> take(std::int64_t number);
    std::vector<Item> takeAll();

  private:
    Item takeAt(std::size_t place);
    template <typename Predicate>
    std::vector<Item> takeIf(Predicate isWanted);

    std::int64_t _destination;
    std::string _context;
    std::int64_t _next;
    std::int64_t _kept = 0;
    std::deque<Item> _items;
    std::size_t _bytes = 0;
    bool _isOnItsWay = false; ///< the first item
};

} // namespace marlo::delivery
