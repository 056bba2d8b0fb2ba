#include "host/delivery/Ledger.h"
#include "host/delivery/Message.h"

#include <algorithm>
#include <limits>
#include <utility>

namespace marlo::delivery {
namespace {

constexpr std::size_t removalsWithPosts = 64; ///< so many are worth being written with what is posted
constexpr std::size_t removalsAlone = 512;    ///< so many are not kept waiting for a post
constexpr std::size_t removalsAtOnce = 256;   ///< so that nobody who posts waits long for them
constexpr std::chrono::seconds afterFailure{1};
constexpr std::chrono::minutes afterShrinkFailure{10};

std::int64_t microsecondsNow() {
    const auto now = std::chrono::system_clock::now().time_since_epoch();
    return std::chrono::duration_cast<std::chrono::microseconds>(now).count();
}

} // namespace

Delivery::Ticket Ledger::post(std::span<const std::string> subscriptions, const Instance& indication) {
    const auto xml = std::make_shared<const std::string>(exportMessage(std::to_string(++_lastMessage), indication));
    const std::int64_t now = microsecondsNow();
    const Lock lock(_mutex);
    if (_isRefusing) {
        throw NotKept("the delivery of indications has ended");
    }
    std::shared_ptr<Event> event;
    for (const std::string& key : subscriptions) {
        const auto bearer = _bearers.find(key);
        if (bearer != _bearers.end() && bearer->second.lane) {
            if (!event) {
                event = makeEvent(xml);
            }
            append(*bearer->second.lane, event, bearer->second.id, now);
        }
    }
    if (!event) {
        return 0;
    }
    cache(event);
    if (!_pendingSince) {
        _pendingSince = Clock::now();
        _keeperWakes.notify_one();
    }
    return ++_posted;
}

std::shared_ptr<Event> Ledger::makeEvent(std::shared_ptr<const std::string> xml) {
    auto event = std::make_shared<Event>();
    event->id = ++_lastEvent;
    event->bytes = xml->size();
    event->xml = std::move(xml);
    _pending.events.emplace_back(event->id, event->xml);
    return event;
}

/** The newest ones stay in memory: those who keep up get them from there. */
void Ledger::cache(const std::shared_ptr<Event>& event) {
    _cached.push_back(event);
    _cachedBytes += event->bytes;
    while (!_cached.empty() && (_cached.front()->waiting == 0 || _cachedBytes > _options.memoryBytes)) {
        _cachedBytes -= _cached.front()->bytes;
        _cached.front()->xml.reset();
        _cached.pop_front();
    }
}

void Ledger::append(Lane& lane, const std::shared_ptr<Event>& event, std::int64_t subscription, std::int64_t now) {
    makeRoom(lane, event->bytes);
    _pending.items.push_back({lane.queue.destination(), lane.queue.append(event, subscription, now)});
}

/** The oldest give way: what tells of the present state is worth more to a manager than what tells of a former one.
 */
void Ledger::makeRoom(Lane& lane, std::size_t bytes) {
    while (lane.queue.length() >= _options.queueLength || lane.queue.bytes() + bytes > _options.queueBytes) {
        const std::optional<Item> oldest = lane.queue.takeOldest();
        if (!oldest) {
            return;
        }
        if (lane.loss.count++ == 0) {
            lane.loss.first = oldest->number;
            _log("delivery to " + lane.setting.url + ": the queue is full with " +
                 std::to_string(lane.queue.length() + 1) + " indications: from now on the oldest are dropped");
        }
        lane.loss.last = oldest->number;
        ++lane.dropped;
        forget(lane, *oldest);
    }
}

void Ledger::announceLoss(Lane& lane) {
    const Lane::Loss loss = std::exchange(lane.loss, {});
    _log("delivery to " + lane.setting.url + ": the queue has room again; " + std::to_string(loss.count) +
         " indications were dropped, SequenceNumber " + std::to_string(loss.first) + " to " +
         std::to_string(loss.last));
    const std::int64_t now = microsecondsNow();
    const auto event = makeEvent(std::make_shared<const std::string>(
        exportMessage(std::to_string(++_lastMessage), lossNotice(loss.count, loss.first, loss.last, now))));
    append(lane, event, 0, now);
    cache(event);
    ++_posted;
    _pendingSince = Clock::time_point(); // nobody waits for it: the keeper writes it at once
    _keeperWakes.notify_one();
}

void Ledger::forget(const Lane& lane, const Item& item) {
    const bool isLast = --item.event->waiting == 0;
    addRemoval({lane.queue.destination(), item.number, isLast ? item.event->id : 0});
}

void Ledger::forgetAll(const Lane& lane, const std::vector<Item>& items) {
    for (const Item& item : items) {
        forget(lane, item);
    }
}

void Ledger::addRemoval(const Removal& removal) {
    _removals.push_back(removal);
    if (!_removalsSince || _removals.size() == removalsAlone) {
        _removalsSince = _removalsSince.value_or(Clock::now());
        _keeperWakes.notify_one();
    }
}

void Ledger::wait(Delivery::Ticket ticket) {
    Lock lock(_mutex);
    while (_settled < ticket) {
        if (_isWriting) {
            _settledChanged.wait(lock);
        } else {
            write(lock);
        }
    }
    for (const Refusal& refusal : _refusals) {
        if (ticket > refusal.after && ticket <= refusal.upTo) {
            throw NotKept(refusal.reason);
        }
    }
}

/** Whoever has the turn next finds what is posted meanwhile. */
void Ledger::write(Lock& lock) {
    std::vector<LaneId> lanes;
    {
        const Turn turn(*this, lock);
        const Batch batch = takeBatch();
        const Delivery::Ticket upTo = _posted;
        std::string problem;
        lock.unlock();
        try {
            _journal.write(batch);
        } catch (const std::exception& error) {
            problem = error.what();
        }
        lock.lock();
        if (problem.empty()) {
            lanes = settle(batch);
        } else {
            revoke(batch, problem, upTo);
        }
        _settled = upTo;
    }
    if (!lanes.empty()) {
        lock.unlock();
        _wake(lanes);
        lock.lock();
    }
}

Batch Ledger::takeBatch() {
    Batch batch = std::exchange(_pending, {});
    _pendingSince.reset();
    const bool isDue = _removalsSince && *_removalsSince + _options.deletionTime <= Clock::now();
    if (isDue || _isEnding || _removals.size() >= removalsWithPosts) {
        const auto count = static_cast<std::ptrdiff_t>(std::min(_removals.size(), removalsAtOnce));
        batch.removals.assign(_removals.begin(), _removals.begin() + count);
        _removals.erase(_removals.begin(), _removals.begin() + count);
        if (_removals.empty()) {
            _removalsSince.reset();
        }
    }
    return batch;
}

/** Returns the lanes that have something to send now and had not before. */
std::vector<Ledger::LaneId> Ledger::settle(const Batch& batch) {
    if (std::exchange(_isDiskFailing, false)) {
        _log("delivery: indications are kept on disk again");
    }
    if (!batch.removals.empty() && !_shrinkDue) {
        _shrinkDue = Clock::now() + _options.shrinkTime;
    }
    std::vector<LaneId> lanes;
    for (const auto& [destination, item] : batch.items) {
        Lane* lane = laneOf(destination);
        if (lane == nullptr) {
            continue;
        }
        lane->queue.keptUpTo(item.number + 1);
        if (!lane->queue.isOnItsWay() && (lanes.empty() || lanes.back() != destination)) {
            lanes.push_back(destination);
        }
    }
    return lanes;
}

/** Nobody is told that these are kept; their numbers stay away, so that a listener sees that something is missing. */
void Ledger::revoke(const Batch& batch, const std::string& reason, Delivery::Ticket upTo) {
    if (!std::exchange(_isDiskFailing, true)) {
        _log("delivery: indications cannot be kept: " + reason);
    }
    for (const auto& [destination, item] : batch.items) {
        if (Lane* lane = laneOf(destination)) {
            if (const std::optional<Item> taken = lane->queue.take(item.number)) {
                --taken->event->waiting;
                ++lane->dropped;
            }
        }
    }
    _removals.insert(_removals.begin(), batch.removals.begin(), batch.removals.end());
    if (!_removals.empty()) {
        _removalsSince = _removalsSince.value_or(Clock::now());
    }
    _notBefore = Clock::now() + afterFailure;
    if (upTo == _settled) {
        return;
    }
    if (!_refusals.empty() && _refusals.back().upTo == _settled) {
        _refusals.back().upTo = upTo;
        _refusals.back().reason = reason;
    } else {
        _refusals.push_back({_settled, upTo, reason});
    }
    if (_refusals.size() > 1000) {
        _refusals.pop_front();
    }
}

std::optional<Ledger::Clock::time_point> Ledger::due() const {
    auto earliest = Clock::time_point::max();
    if (_pendingSince) {
        earliest = std::min(earliest, *_pendingSince + _options.deletionTime);
    }
    if (_removalsSince) {
        const bool isMany = _removals.size() >= removalsAlone;
        earliest = std::min(earliest, isMany ? *_removalsSince : *_removalsSince + _options.deletionTime);
    }
    earliest = std::min(earliest, _shrinkDue.value_or(earliest));
    if (earliest == Clock::time_point::max()) {
        return std::nullopt;
    }
    return std::max(earliest, _notBefore);
}

/** Whoever posts meanwhile waits, for as long as what is left takes to be copied. */
void Ledger::shrink(Lock& lock) {
    const Turn turn(*this, lock);
    _shrinkDue.reset();
    lock.unlock();
    std::string problem;
    try {
        _journal.shrink();
    } catch (const std::exception& error) {
        problem = error.what();
    }
    lock.lock();
    if (!problem.empty()) {
        _shrinkDue = Clock::now() + afterShrinkFailure;
        _log("delivery: the database stays as large as it is: " + problem);
    }
}

/**
 * Writes what nobody waits for: what was answered, and posts whose ticket is not asked for. And sees to it that the
 * file does not stay as large as its largest backlog.
 */
void Ledger::keep() {
    Lock lock(_mutex);
    while (!_isEnding) {
        const auto time = due();
        if (!time || _isWriting) {
            _keeperWakes.wait(lock);
        } else if (*time > Clock::now()) {
            _keeperWakes.wait_until(lock, *time);
        } else if (_shrinkDue && *_shrinkDue <= Clock::now()) {
            shrink(lock);
        } else {
            write(lock);
        }
    }
}

void Ledger::refuse() {
    const Lock lock(_mutex);
    _isRefusing = true;
}

void Ledger::end() {
    Lock lock(_mutex);
    _isRefusing = true;
    if (std::exchange(_isEnding, true)) {
        return;
    }
    _keeperWakes.notify_one();
    lock.unlock();
    _keeper.join();
    lock.lock();
    while ((!_pending.items.empty() || !_removals.empty()) && !_isDiskFailing) {
        write(lock);
    }
}

} // namespace marlo::delivery
