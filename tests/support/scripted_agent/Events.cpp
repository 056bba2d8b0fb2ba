#include "tests/support/scripted_agent/Recorder.h"
#include "tests/support/scripted_agent/ScriptedAgent.h"

#include <algorithm>
#include <condition_variable>
#include <mutex>
#include <shared_mutex>
#include <thread>

namespace scripted_agent {

namespace {

struct Events {
    std::shared_mutex mutex; ///< guards the monitorings; held shared while callbacks run
    std::vector<Monitoring> monitorings;

    std::mutex pickUpMutex; ///< guards what follows
    std::condition_variable pickUp;
    std::string awaited;
    bool isPickedUp = false;
};

Events& theEvents() {
    static Events events;
    return events;
}

void handOver(const Event& event) {
    Events& events = theEvents();
    const std::shared_lock lock(events.mutex);
    std::vector<Monitoring> called;
    for (const Monitoring& monitoring : events.monitorings) {
        if (monitoring.type == Orv::NodeLexicon::NODE_NETWORK_ADAPTER &&
            std::find(called.begin(), called.end(), monitoring) == called.end()) {
            called.push_back(monitoring);
            monitoring.callback(event.code, Orv::DateTime(event.time), event.path, monitoring.context);
        }
    }
}

void handOverAndWait(const Event& event) {
    Events& events = theEvents();
    {
        const std::lock_guard lock(events.pickUpMutex);
        events.awaited = event.path;
        events.isPickedUp = false;
    }
    handOver(event);
    std::unique_lock lock(events.pickUpMutex);
    events.pickUp.wait(lock, [&] { return events.isPickedUp; });
}

} // namespace

void addMonitoring(const Monitoring& monitoring) {
    const std::unique_lock lock(theEvents().mutex);
    theEvents().monitorings.push_back(monitoring);
}

void removeMonitoring(const Monitoring& monitoring) {
    const std::unique_lock lock(theEvents().mutex);
    std::erase(theEvents().monitorings, monitoring);
}

std::vector<Monitoring> monitorings() {
    const std::shared_lock lock(theEvents().mutex);
    return theEvents().monitorings;
}

void pickUp(const std::string& path) {
    const std::lock_guard lock(theEvents().pickUpMutex);
    if (theEvents().awaited == path) {
        theEvents().isPickedUp = true;
        theEvents().pickUp.notify_all();
    }
}

void resetEvents() {
    const std::unique_lock lock(theEvents().mutex);
    theEvents().monitorings.clear();
}

void fire(const std::vector<Event>& events, PickUp pickUp) {
    std::thread agent([&] {
        for (const Event& event : events) {
            if (pickUp == PickUp::awaited) {
                handOverAndWait(event);
            } else {
                handOver(event);
            }
        }
    });
    agent.join();
}

} // namespace scripted_agent
