#include "agent/events/Handover.h"

#include <algorithm>
#include <thread>
#include <utility>

namespace Orv::Agent {

namespace {

constexpr int failureLevel = 6000;
constexpr int routineLevel = 4000;

/** Quartered so often, every wait is next to nothing, and no shift goes too far. */
constexpr unsigned mostQuarters = 16;

} // namespace

Handover::Handover(EventRecords& records, const std::shared_ptr<const WakeUp>& wakeUp, HandoverTimes times,
                   Report report)
    : _records(records), _times(times), _report(std::move(report)), _pickUps(std::make_shared<PickUps>(wakeUp)) {}

std::chrono::nanoseconds Handover::patience() const {
    const std::chrono::nanoseconds quartered = _times.whole / (1L << (2 * std::min(_missed, mostQuarters)));
    const std::chrono::nanoseconds share = _times.crowded / static_cast<long>(1 + _waiting.size());
    return std::min(_times.whole, std::max(quartered, share));
}

void Handover::giveUp() {
    _records.close(_outstanding->number);
    // Said once: a receiver that is switched off for good would fill the log.
    _report(_missed == 0 ? failureLevel : routineLevel,
            "an event of " + _outstanding->name + " was handed over and not picked up");
    _outstanding.reset();
    ++_missed;
}

void Handover::settle(Clock::time_point now) {
    if (const auto count = _pickUps->count(); count != _seenPickUps) {
        _seenPickUps = count;
        _missed = 0;
    }
    if (const auto last = _pickUps->lastThreadEnd(); last != _seenThreadEnd) {
        _seenThreadEnd = last;
        _threadsEnd = true;
    }
    if (!_outstanding) {
        return;
    }
    if (now >= _outstanding->since + _times.work) {
        _outstanding->isLate = true;
        _pickUps->wakeOnPickUp(true); // one that came before is seen below
    }
    if (const auto thread = _records.pickedUpBy(_outstanding->number)) {
        settlePickUp(*thread, now);
    } else if (now >= _outstanding->since + patience()) {
        giveUp();
    }
}

/** Picked up on this thread, an event was done with before the call returned; on another, when that has ended. */
void Handover::settlePickUp(std::thread::id thread, Clock::time_point now) {
    const bool isDone = thread == std::this_thread::get_id() || _seenThreadEnd >= _outstanding->number;
    if (_threadsEnd && !isDone) {
        _outstanding->pickedUp = _outstanding->pickedUp.value_or(now);
        if (now < *_outstanding->pickedUp + _times.work) {
            return;
        }
        _threadsEnd = false;
    }
    _records.close(_outstanding->number);
    _outstanding.reset();
    _missed = 0;
}

std::optional<Handover::Delivery> Handover::next(Clock::time_point now) {
    settle(now);
    if (_outstanding || _waiting.empty()) {
        return std::nullopt;
    }
    const Event event = std::move(_waiting.front());
    _waiting.pop_front();
    auto [number, path] = _records.open(event, _pickUps);
    if (event.code == EventCode::status) {
        _outstanding = {number, event.node->description, now, std::nullopt, false};
        _pickUps->wakeOnPickUp(!_threadsEnd);
    } else {
        _records.close(number);
    }
    return Delivery{event.code, event.time, std::move(path)};
}

std::optional<Handover::Clock::time_point> Handover::deadline() const {
    if (!_outstanding) {
        return std::nullopt;
    }
    if (_outstanding->pickedUp) {
        return *_outstanding->pickedUp + _times.work;
    }
    const bool isAskedBefore = _threadsEnd && !_outstanding->isLate;
    return _outstanding->since + (isAskedBefore ? std::min(_times.work, patience()) : patience());
}

} // namespace Orv::Agent
