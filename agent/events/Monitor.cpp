#include "agent/events/Monitor.h"

#include <algorithm>
#include <array>
#include <csignal>
#include <exception>
#include <utility>

#include <poll.h>
#include <pthread.h>

namespace Orv::Agent {

namespace {

constexpr int failureLevel = 6000;

/** After which a back end that could not collect is asked again; only then does the thread wake by the clock. */
constexpr std::chrono::nanoseconds retryAfter = std::chrono::seconds(1);

timespec toTimespec(std::chrono::nanoseconds duration) {
    const auto seconds = std::chrono::duration_cast<std::chrono::seconds>(duration);
    return {static_cast<time_t>(seconds.count()), static_cast<long>((duration - seconds).count())};
}

/** Has the threads made meanwhile take no signals: they are the host process's own affair. */
class SignalsBlocked {
  public:
    SignalsBlocked() {
        sigset_t all;
        sigfillset(&all);
        pthread_sigmask(SIG_SETMASK, &all, &_before);
    }

    ~SignalsBlocked() { pthread_sigmask(SIG_SETMASK, &_before, nullptr); }

    SignalsBlocked(const SignalsBlocked&) = delete;
    SignalsBlocked& operator=(const SignalsBlocked&) = delete;

  private:
    sigset_t _before{};
};

} // namespace

struct Monitor::Subscription {
    Key key;
    Callback callback;
    Handover handover;
};

Monitor::Monitor(BackEnd& backEnd, Handover::Report report, HandoverTimes times)
    : _backEnd(backEnd), _report(std::move(report)), _times(times), _wakeUp(std::make_shared<const WakeUp>()) {}

Monitor::~Monitor() {
    std::vector<Key> keys;
    {
        const std::lock_guard lock(_mutex);
        for (const auto& subscription : _subscriptions) {
            keys.push_back(subscription.first);
        }
    }
    for (const Key& key : keys) {
        stop(key);
    }
    if (_thread.joinable()) {
        _thread.join();
    }
}

void Monitor::start(const Key& key, Callback callback) {
    std::unique_lock lock(_mutex);
    _changed.wait(lock, [&] { return _state != State::ending; });
    if (_subscriptions.count(key) != 0) {
        return;
    }
    if (_state == State::running) {
        distribute(); // what came before belongs to those who were there
    }
    _subscriptions.emplace(
        key, std::make_shared<Subscription>(
                 Subscription{key, std::move(callback), Handover(_backEnd.events(), _wakeUp, _times, _report)}));
    try {
        if (_state == State::stopped) {
            launch();
        }
    } catch (...) {
        _subscriptions.erase(key);
        throw;
    }
}

void Monitor::launch() {
    if (_thread.joinable()) {
        _thread.join(); // it has ended
    }
    _watch = _backEnd.watch(*this);
    try {
        const SignalsBlocked blocked;
        _thread = std::thread([this] { run(); });
    } catch (...) {
        _watch.reset();
        throw;
    }
    _state = State::running;
}

void Monitor::stop(const Key& key) {
    std::unique_lock lock(_mutex);
    const auto found = _subscriptions.find(key);
    const auto subscription = found == _subscriptions.end() ? nullptr : found->second;
    if (subscription == nullptr) {
        return;
    }
    _subscriptions.erase(found);
    _wakeUp->signal();
    if (isOwnThread()) {
        return;
    }
    _changed.wait(lock, [&] { return _called != subscription.get(); });
    _changed.wait(lock, [&] { return _state == State::stopped || !_subscriptions.empty(); });
    if (_state == State::stopped && _thread.joinable()) {
        _thread.join();
    }
}

void Monitor::post(Event event) {
    {
        const std::lock_guard lock(_inboxMutex);
        _inbox.push_back(std::move(event));
    }
    _wakeUp->signal();
}

void Monitor::report(const std::string& text) {
    _report(failureLevel, text);
}

void Monitor::run() {
    pthread_setname_np(pthread_self(), "orv-monitor");
    for (;;) {
        _wakeUp->clear();
        collect();
        {
            const std::lock_guard lock(_mutex);
            if (_subscriptions.empty()) {
                _state = State::ending;
                break;
            }
            distribute();
        }
        if (!handOver()) {
            sleep();
        }
    }
    finish();
}

void Monitor::collect() {
    try {
        _watch->collect();
        _hasFailed = false;
    } catch (const std::exception& failure) {
        if (!std::exchange(_hasFailed, true)) {
            _report(failureLevel, std::string("events cannot be collected: ") + failure.what());
        }
    }
}

/** Gives what was posted to those whom it concerns. */
void Monitor::distribute() {
    std::vector<Event> events;
    {
        const std::lock_guard lock(_inboxMutex);
        events.swap(_inbox);
    }
    for (const Event& event : events) {
        for (const auto& [key, subscription] : _subscriptions) {
            if (event.node->type == key.type) {
                subscription->handover.add(event);
            }
        }
    }
}

/** Calls each subscriber for whom there is an event to hand over, once. True when there was one. */
bool Monitor::handOver() {
    std::vector<std::shared_ptr<Subscription>> subscriptions;
    std::unique_lock lock(_mutex);
    for (const auto& entry : _subscriptions) {
        subscriptions.push_back(entry.second);
    }
    bool hasCalled = false;
    for (const auto& subscription : subscriptions) {
        const auto current = _subscriptions.find(subscription->key);
        if (current == _subscriptions.end() || current->second != subscription) {
            continue; // ended meanwhile
        }
        if (const auto delivery = subscription->handover.next(Handover::Clock::now())) {
            _called = subscription.get();
            lock.unlock();
            call(*subscription, *delivery);
            lock.lock();
            _called = nullptr;
            _changed.notify_all();
            hasCalled = true;
        }
    }
    return hasCalled;
}

void Monitor::call(const Subscription& subscription, const Handover::Delivery& delivery) {
    try {
        subscription.callback(delivery);
    } catch (const std::exception& failure) {
        _report(failureLevel, std::string("an exception left a monitoring callback: ") + failure.what());
    } catch (...) {
        _report(failureLevel, "an exception of unknown type left a monitoring callback");
    }
}

/** Until something happens, or somebody has been waited for long enough. */
void Monitor::sleep() {
    std::optional<Handover::Clock::time_point> until;
    const auto now = Handover::Clock::now();
    if (_hasFailed) {
        until = now + retryAfter;
    }
    {
        const std::lock_guard lock(_mutex);
        for (const auto& entry : _subscriptions) {
            const auto deadline = entry.second->handover.deadline();
            until = deadline && (!until || *deadline < *until) ? deadline : until;
        }
    }
    const timespec timeout = toTimespec(until ? std::max(*until - now, Handover::Clock::duration::zero())
                                              : Handover::Clock::duration::zero());
    // A back end that has failed would wake at once, again and again.
    std::array<pollfd, 2> files{
        {{_wakeUp->descriptor(), POLLIN, 0}, {_hasFailed ? -1 : _watch->descriptor(), POLLIN, 0}}};
    ::ppoll(files.data(), files.size(), until ? &timeout : nullptr, nullptr);
}

void Monitor::finish() {
    _watch.reset();
    {
        const std::lock_guard lock(_inboxMutex);
        _inbox.clear();
    }
    const std::lock_guard lock(_mutex);
    _state = State::stopped;
    _changed.notify_all();
}

} // namespace Orv::Agent
