/**
 * @file
 * Who waits for what: the queues of all destinations, and their way to the disk and from it.
 */
#pragma once

#include "host/delivery/Delivery.h"
#include "host/delivery/Journal.h"
#include "host/delivery/Lane.h"

#include <atomic>
#include <condition_variable>
#include <map>
#include <mutex>
#include <thread>
#include <unordered_map>

namespace marlo::delivery {

/** One indication on its way to one listener. */
struct Consignment {
    std::int64_t number = 0;
    std::string body;    ///< of the request
    std::string problem; ///< why there is no body just now; empty: there is one
};

/** What follows from a failed try. */
struct Consequences {
    std::vector<std::pair<std::string, OnFatalError>> fired; ///< subscriptions whose patience is over now
    /** When the patience of the next one will be over: the last moment for a try that may still save it. */
    std::optional<std::chrono::milliseconds> untilNext;
};

/**
 * All operations may be called from any thread, but `begin` from one thread only. Lanes go by the ids of their
 * destinations, which no other destination ever gets again.
 *
 * What is posted is written by whoever waits for it first, together with all that has been posted until then; what is
 * posted meanwhile is the next one's. No thread has to be woken up for a write, and all who wait share one.
 */
class Ledger {
  public:
    using LaneId = std::int64_t;
    /** Told of lanes that have something to send. Called on any thread, with no lock held. */
    using Wake = std::function<void(const std::vector<LaneId>& lanes)>;

    Ledger(const std::filesystem::path& file, const Options& options, Delivery::Log log, Wake wake);
    ~Ledger();
    Ledger(const Ledger&) = delete;
    Ledger& operator=(const Ledger&) = delete;

    LaneId setDestination(const Destination& destination);
    std::optional<LaneId> removeDestination(const std::string& key);
    void setSubscription(const Subscription& subscription);
    void removeSubscription(const std::string& key);
    /** Forgets what was there at the start and has not been set since; returns what has been, for sending. */
    std::vector<std::pair<LaneId, Destination>> forgetUnset();

    Delivery::Ticket post(std::span<const std::string> subscriptions, const Instance& indication);
    void wait(Delivery::Ticket ticket);

    /** No more posts. */
    void refuse();
    /** Waits until nothing waits but in lanes that fail, at most that long. */
    void awaitSent(std::chrono::milliseconds patience);
    /** Writes what is left to write, and ends the thread that does so. Once. */
    void end();

    /** The next indication of a lane; nothing when there is none that is on disk and not on its way already. */
    std::optional<Consignment> begin(LaneId id);
    void delivered(LaneId id, std::int64_t number);
    /** The indication waits again, and nothing has failed. */
    void giveBack(LaneId id);
    /** The indication waits again. */
    Consequences failed(LaneId id, const std::string& reason);

    [[nodiscard]] std::vector<Counters> counters() const;

  private:
    using Clock = std::chrono::steady_clock;
    using Lock = std::unique_lock<std::mutex>;
    using LanePointer = std::shared_ptr<Lane>;

    /** Posts that the disk did not take: those behind `after`, up to `upTo`. */
    struct Refusal {
        Delivery::Ticket after;
        Delivery::Ticket upTo;
        std::string reason;
    };

    /** The turn to write: waits for it, and gives it back. The lock may be open meanwhile. */
    class Turn {
      public:
        Turn(Ledger& ledger, Lock& lock);
        ~Turn();
        Turn(const Turn&) = delete;
        Turn& operator=(const Turn&) = delete;

      private:
        Ledger& _ledger;
        Lock& _lock;
    };

    // All of these but the first are called with the lock held; those that are given it open it meanwhile.
    void restore();
    void keep();
    [[nodiscard]] std::optional<Clock::time_point> due() const;
    void write(Lock& lock);
    void shrink(Lock& lock);
    Batch takeBatch();
    std::vector<LaneId> settle(const Batch& batch);
    void revoke(const Batch& batch, const std::string& reason, Delivery::Ticket upTo);
    std::shared_ptr<Event> makeEvent(std::shared_ptr<const std::string> xml);
    void cache(const std::shared_ptr<Event>& event);
    void append(Lane& lane, const std::shared_ptr<Event>& event, std::int64_t subscription, std::int64_t now);
    void makeRoom(Lane& lane, std::size_t bytes);
    void forget(const Lane& lane, const Item& item);
    void forgetAll(const Lane& lane, const std::vector<Item>& items);
    void announceLoss(Lane& lane);
    void addRemoval(const Removal& removal);
    void removeLane(Lock& lock, const std::string& key);
    void removeBearer(Lock& lock, const std::string& key);
    void dropUnreadable(LaneId id, std::int64_t number, const std::string& reason);
    Lane* laneOf(LaneId id) const;

    const Options _options;
    const Delivery::Log _log;
    const Wake _wake;
    Journal _journal; ///< written by whoever has the turn, read by whoever sends
    std::atomic<std::uint64_t> _lastMessage{0};

    mutable std::mutex _mutex; ///< guards all below
    std::condition_variable _settledChanged;
    std::condition_variable _keeperWakes;
    std::condition_variable _sentChanged;
    std::map<std::string, LanePointer> _lanes; ///< by the key of the destination
    std::unordered_map<LaneId, LanePointer> _lanesById;
    std::map<std::string, Bearer> _bearers; ///< by the key of the subscription
    std::deque<std::shared_ptr<Event>> _cached;
    std::size_t _cachedBytes = 0;
    std::int64_t _lastEvent = 0;

    Batch _pending; ///< without its removals
    std::deque<Removal> _removals;
    Delivery::Ticket _posted = 0;
    Delivery::Ticket _settled = 0;
    std::deque<Refusal> _refusals;
    std::optional<Clock::time_point> _pendingSince;
    std::optional<Clock::time_point> _removalsSince;
    std::optional<Clock::time_point> _shrinkDue; ///< the file may have room that nobody needs
    Clock::time_point _notBefore;                ///< after a write that failed, the keeper waits
    bool _isWriting = false;
    bool _isDiskFailing = false;
    bool _isRefusing = false;
    bool _isEnding = false;
    std::thread _keeper;
};

} // namespace marlo::delivery
