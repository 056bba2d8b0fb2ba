#include "host/delivery/Ledger.h"

#include <algorithm>
#include <utility>

namespace marlo::delivery {
namespace {

constexpr std::chrono::hours longestTrigger{24 * 365 *
                                            10}; ///< the clock counts in nanoseconds, and clients in 64 bits

} // namespace

Ledger::Turn::Turn(Ledger& ledger, Lock& lock) : _ledger(ledger), _lock(lock) {
    ledger._settledChanged.wait(lock, [&ledger] { return !ledger._isWriting; });
    ledger._isWriting = true;
}

Ledger::Turn::~Turn() {
    if (!_lock.owns_lock()) {
        _lock.lock();
    }
    _ledger._isWriting = false;
    _ledger._settledChanged.notify_all();
    _ledger._keeperWakes.notify_one();
}

Ledger::Ledger(const std::filesystem::path& file, const Options& options, Delivery::Log log, Wake wake)
    : _options(options), _log(std::move(log)), _wake(std::move(wake)), _journal(file) {
    restore();
    _shrinkDue = Clock::now() + _options.shrinkTime; // a former process may have had no time for it
    _keeper = std::thread([this] { keep(); });
}

Ledger::~Ledger() {
    end();
}

/** What a destination left behind that was removed just before the end is removed now. */
void Ledger::restore() {
    for (Record& record : _journal.destinations()) {
        auto lane = std::make_shared<Lane>(Queue(record.id, std::move(record.context), record.next));
        lane->setting.key = record.key;
        _lanesById.emplace(record.id, lane);
        _lanes.emplace(std::move(record.key), std::move(lane));
    }
    for (Record& record : _journal.subscriptions()) {
        _bearers[record.key].id = record.id;
    }
    std::vector<Batch::NewItem> orphans;
    _journal.restore([this, &orphans](LaneId destination, Item&& item) {
        if (Lane* lane = laneOf(destination)) {
            lane->queue.restore(std::move(item));
        } else {
            orphans.push_back({destination, std::move(item)});
        }
    });
    for (const auto& [destination, item] : orphans) {
        addRemoval({destination, item.number, item.event->waiting == 0 ? item.event->id : 0});
    }
    _lastEvent = _journal.lastEvent();
}

Lane* Ledger::laneOf(LaneId id) const {
    const auto found = _lanesById.find(id);
    return found == _lanesById.end() ? nullptr : found->second.get();
}

Ledger::LaneId Ledger::setDestination(const Destination& destination) {
    Lock lock(_mutex);
    const Turn turn(*this, lock);
    auto found = _lanes.find(destination.key);
    if (found == _lanes.end()) {
        lock.unlock();
        Record record = _journal.addDestination(destination.key);
        lock.lock();
        auto lane = std::make_shared<Lane>(Queue(record.id, std::move(record.context), record.next));
        _lanesById.emplace(record.id, lane);
        found = _lanes.emplace(destination.key, std::move(lane)).first;
    }
    Lane& lane = *found->second;
    lane.setting = destination;
    lane.isSet = true;
    return lane.queue.destination();
}

std::optional<Ledger::LaneId> Ledger::removeDestination(const std::string& key) {
    Lock lock(_mutex);
    const Turn turn(*this, lock);
    const auto found = _lanes.find(key);
    if (found == _lanes.end()) {
        return std::nullopt;
    }
    const LaneId id = found->second->queue.destination();
    removeLane(lock, key);
    return id;
}

/** At once from memory; its rows leave the disk in portions. */
void Ledger::removeLane(Lock& lock, const std::string& key) {
    const LanePointer lane = _lanes.extract(key).mapped();
    const LaneId id = lane->queue.destination();
    _lanesById.erase(id);
    forgetAll(*lane, lane->queue.takeAll());
    std::vector<std::int64_t> bearers;
    for (auto bearer = _bearers.begin(); bearer != _bearers.end();) {
        if (bearer->second.lane == lane) {
            bearers.push_back(bearer->second.id);
            bearer = _bearers.erase(bearer);
        } else {
            ++bearer;
        }
    }
    _sentChanged.notify_all();
    lock.unlock();
    _journal.removeDestination(id);
    for (const std::int64_t bearer : bearers) {
        _journal.removeSubscription(bearer);
    }
    lock.lock();
}

void Ledger::setSubscription(const Subscription& subscription) {
    Lock lock(_mutex);
    const Turn turn(*this, lock);
    const auto lane = _lanes.find(subscription.destination);
    if (lane == _lanes.end() || !lane->second->isSet) {
        throw std::invalid_argument("no destination \"" + subscription.destination + "\" is known");
    }
    const LanePointer pointer = lane->second;
    auto bearer = _bearers.find(subscription.key);
    if (bearer == _bearers.end()) {
        lock.unlock();
        const Record record = _journal.addSubscription(subscription.key);
        lock.lock();
        bearer = _bearers.emplace(subscription.key, Bearer{record.id, {}, nullptr, false}).first;
    }
    bearer->second.setting = subscription;
    bearer->second.setting.failureTrigger =
        std::min<std::chrono::seconds>(subscription.failureTrigger, longestTrigger);
    bearer->second.lane = pointer;
    bearer->second.hasFired = false;
}

void Ledger::removeSubscription(const std::string& key) {
    Lock lock(_mutex);
    const Turn turn(*this, lock);
    if (_bearers.contains(key)) {
        removeBearer(lock, key);
    }
}

/** It may have had another destination before. */
void Ledger::removeBearer(Lock& lock, const std::string& key) {
    const std::int64_t id = _bearers.extract(key).mapped().id;
    for (const auto& [laneKey, lane] : _lanes) {
        forgetAll(*lane, lane->queue.takeOf(id));
    }
    _sentChanged.notify_all();
    lock.unlock();
    _journal.removeSubscription(id);
    lock.lock();
}

std::vector<std::pair<Ledger::LaneId, Destination>> Ledger::forgetUnset() {
    Lock lock(_mutex);
    const Turn turn(*this, lock);
    std::vector<std::string> lanes;
    std::vector<std::string> bearers;
    for (const auto& [key, lane] : _lanes) {
        if (!lane->isSet) {
            lanes.push_back(key);
        }
    }
    for (const auto& [key, bearer] : _bearers) {
        if (!bearer.lane) {
            bearers.push_back(key);
        }
    }
    for (const std::string& key : lanes) {
        removeLane(lock, key);
    }
    for (const std::string& key : bearers) {
        removeBearer(lock, key);
    }
    std::vector<std::pair<LaneId, Destination>> set;
    for (const auto& [key, lane] : _lanes) {
        set.emplace_back(lane->queue.destination(), lane->setting);
    }
    return set;
}

} // namespace marlo::delivery
