/**
 * @file
 * Monitoring of a back end's nodes, on a thread of its own.
 */
#pragma once

#include "agent/events/Handover.h"
#include "agent/tree/BackEnd.h"

#include <compare>
#include <condition_variable>
#include <cstdint>
#include <functional>
#include <map>
#include <memory>
#include <mutex>
#include <thread>
#include <vector>

namespace Orv::Agent {

/**
 * Hands events over to those who have subscribed. The thread runs while there is a subscription, sleeps until
 * something happens, and calls the subscribers one after the other; each has a queue of its own and is waited for by
 * itself (see Handover). Every operation may be called from any thread, from within a call of a subscriber too.
 */
class Monitor : private EventSink {
  public:
    /** What tells one subscription from another. */
    struct Key {
        NodeLexicon::NodeType type;
        std::uintptr_t callback;
        const void* context;

        // NOLINTNEXTLINE(modernize-use-nullptr): takes the comparison with 0 for one with a pointer
        auto operator<=>(const Key&) const = default;
    };

    /** Called without any lock; what it throws is logged. */
    using Callback = std::function<void(const Handover::Delivery&)>;

    /** The back end must outlive the monitor. `report` is called from the monitor's thread. */
    explicit Monitor(BackEnd& backEnd, Handover::Report report, HandoverTimes times = {});

    /** Ends every subscription and the thread; not from within a call of a subscriber. */
    ~Monitor() override;

    /**
     * Subscribes to the events on nodes of `key.type` from now on. Nothing when the key has subscribed already.
     * Throws what BackEnd::watch throws, and std::system_error without a thread.
     */
    void start(const Key& key, Callback callback);

    /**
     * Ends a subscription; events that were not handed over are forgotten. When it returns the subscriber is not
     * being called and is never called again; called from within that very call, only the latter. Nothing when the
     * key has not subscribed.
     */
    void stop(const Key& key);

  private:
    struct Subscription;

    void post(Event event) override;
    void report(const std::string& text) override;
    void launch();
    void run();
    void collect();
    void distribute();
    bool handOver();
    void call(const Subscription& subscription, const Handover::Delivery& delivery);
    void sleep();
    void finish();

    [[nodiscard]] bool isOwnThread() const { return std::this_thread::get_id() == _thread.get_id(); }

    BackEnd& _backEnd;
    const Handover::Report _report;
    const HandoverTimes _times;
    const std::shared_ptr<const WakeUp> _wakeUp;

    std::mutex _inboxMutex; ///< guards _inbox; taken last of all
    std::vector<Event> _inbox;

    std::mutex _mutex; ///< guards everything below; not held during calls, nor while the back end collects
    std::condition_variable _changed;
    std::map<Key, std::shared_ptr<Subscription>> _subscriptions;
    const Subscription* _called = nullptr; ///< who is being called
    enum class State { stopped, running, ending } _state = State::stopped;
    std::thread _thread;

    std::unique_ptr<EventWatch> _watch; ///< made before the thread runs and its own while it does
    bool _hasFailed = false;            ///< the thread's own: the last collecting threw
};

} // namespace Orv::Agent
