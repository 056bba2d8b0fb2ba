#include "host/delivery/Ledger.h"
#include "host/delivery/Message.h"

#include <algorithm>
#include <utility>

namespace marlo::delivery {
namespace {

std::chrono::microseconds sincePost(std::int64_t posted) {
    const auto now = std::chrono::system_clock::now().time_since_epoch();
    return std::chrono::duration_cast<std::chrono::microseconds>(now) - std::chrono::microseconds(posted);
}

} // namespace

std::optional<Consignment> Ledger::begin(LaneId id) {
    while (true) {
        Lock lock(_mutex);
        Lane* lane = laneOf(id);
        const Item* item = lane == nullptr ? nullptr : lane->queue.begin();
        if (item == nullptr) {
            return std::nullopt;
        }
        const std::int64_t number = item->number;
        const std::int64_t event = item->event->id;
        const std::shared_ptr<const std::string> xml = item->event->xml;
        const std::string context = lane->queue.context();
        lock.unlock();
        try {
            return Consignment{number, inSequence(xml ? *xml : _journal.read(event), context, number), {}};
        } catch (const store::Error& error) {
            if (error.code() != 0 && !error.isCorrupt()) {
                return Consignment{number, {}, error.what()};
            }
            dropUnreadable(id, number, error.what());
        }
    }
}

/** It would hold up for ever what waits behind it. */
void Ledger::dropUnreadable(LaneId id, std::int64_t number, const std::string& reason) {
    const Lock lock(_mutex);
    Lane* lane = laneOf(id);
    const std::optional<Item> item = lane == nullptr ? std::nullopt : lane->queue.end(number);
    if (item) {
        ++lane->dropped;
        _log("delivery to " + lane->setting.url + ": SequenceNumber " + std::to_string(number) +
             " is lost: " + reason);
        forget(*lane, *item);
    }
}

void Ledger::delivered(LaneId id, std::int64_t number) {
    const Lock lock(_mutex);
    Lane* lane = laneOf(id);
    if (lane == nullptr) {
        return;
    }
    if (std::exchange(lane->failingSince, std::nullopt)) {
        _log("delivery to " + lane->setting.url + ": the listener takes indications again");
        for (auto& [key, bearer] : _bearers) {
            bearer.hasFired = bearer.hasFired && bearer.lane.get() != lane;
        }
    }
    ++lane->sent;
    if (const std::optional<Item> item = lane->queue.end(number)) {
        lane->latency.count(sincePost(item->posted));
        forget(*lane, *item);
    }
    if (lane->loss.count != 0 && lane->queue.length() <= _options.queueLength / 2 &&
        lane->queue.bytes() <= _options.queueBytes / 2) {
        announceLoss(*lane);
    }
    if (_isRefusing) {
        _sentChanged.notify_all();
    }
}

void Ledger::giveBack(LaneId id) {
    const Lock lock(_mutex);
    if (Lane* lane = laneOf(id)) {
        lane->queue.giveBack();
    }
}

Consequences Ledger::failed(LaneId id, const std::string& reason) {
    const Lock lock(_mutex);
    Lane* lane = laneOf(id);
    if (lane == nullptr) {
        return {};
    }
    const auto now = Clock::now();
    lane->queue.giveBack();
    ++lane->retried;
    lane->lastError = reason;
    lane->lastErrorTime = Lane::WallClock::now();
    if (!lane->failingSince) {
        lane->failingSince = lane->lastErrorTime;
        lane->failingFrom = now;
        _log("delivery to " + lane->setting.url + ": " + reason + "; tried again until it succeeds");
    }
    Consequences consequences;
    for (auto& [key, bearer] : _bearers) {
        if (bearer.lane.get() != lane || bearer.hasFired || bearer.setting.onFatalError == OnFatalError::ignore) {
            continue;
        }
        const auto left =
            std::chrono::ceil<std::chrono::milliseconds>(lane->failingFrom + bearer.setting.failureTrigger - now);
        if (left.count() <= 0) {
            bearer.hasFired = true;
            consequences.fired.emplace_back(key, bearer.setting.onFatalError);
        } else {
            consequences.untilNext = std::min(left, consequences.untilNext.value_or(left));
        }
    }
    _sentChanged.notify_all();
    return consequences;
}

/** Lanes that fail have had their chance. */
void Ledger::awaitSent(std::chrono::milliseconds patience) {
    Lock lock(_mutex);
    _sentChanged.wait_for(lock, patience, [this] {
        return std::ranges::all_of(_lanes, [](const auto& entry) {
            return entry.second->queue.length() == 0 || entry.second->failingSince.has_value();
        });
    });
}

std::vector<Counters> Ledger::counters() const {
    const Lock lock(_mutex);
    std::vector<Counters> all;
    for (const auto& [key, lane] : _lanes) {
        if (lane->isSet) {
            all.push_back(lane->counters());
        }
    }
    return all;
}

} // namespace marlo::delivery
