/**
 * @file
 * The threads that the provider starts through the broker, under a test's control: detached as they are, they must
 * be at their end before the test's broker goes.
 */
#pragma once

#include <condition_variable>
#include <memory>
#include <mutex>
#include <vector>

#include <cmpift.h>

namespace provider_test {

/** One at a time in a process. Waits for all threads at its end. */
class AlertThreads {
  public:
    enum class Mode {
        inTurn, ///< newThread returns when the thread's work is done: everything happens in one order
        atOnce, ///< newThread returns at once, as it always does
        held,   ///< threads begin when release() says so
    };

    struct Start {
        CMPIThreadFunc function;
        void* argument;
        int detached;
    };

    /** Puts itself before the newThread of `broker`, which still does the work, or fails. */
    explicit AlertThreads(CMPIBroker& broker, Mode mode = Mode::inTurn)
        : _broker(broker), _former(broker.xft), _mode(mode), _table(*broker.xft), _newThread(broker.xft->newThread) {
        inForce = this;
        _table.newThread = [](CMPIThreadFunc function, void* argument, int detached) {
            return inForce->start({function, argument, detached});
        };
        broker.xft = &_table;
    }

    ~AlertThreads() {
        release();
        waitForAll();
        _broker.xft = _former;
        inForce = nullptr;
    }

    AlertThreads(const AlertThreads&) = delete;
    AlertThreads& operator=(const AlertThreads&) = delete;

    /** Lets held threads begin. */
    void release() {
        const std::lock_guard lock(_mutex);
        _released = true;
        _changed.notify_all();
    }

    void waitForAll() {
        std::unique_lock lock(_mutex);
        _changed.wait(lock, [this] { return _running == 0; });
    }

    /** What newThread was called with so far. */
    [[nodiscard]] std::vector<Start> starts() const {
        const std::lock_guard lock(_mutex);
        return _starts;
    }

    /** What the latest thread function returned; it is to be null. */
    [[nodiscard]] void* result() const {
        const std::lock_guard lock(_mutex);
        return _result;
    }

  private:
    void* start(const Start& start) {
        {
            const std::lock_guard lock(_mutex);
            _starts.push_back(start);
            ++_running;
        }
        auto copied = std::make_unique<Start>(start);
        void* thread = _newThread(run, copied.get(), start.detached);
        if (thread == nullptr) {
            end();
            return nullptr;
        }
        static_cast<void>(copied.release()); // the thread's now
        if (_mode == Mode::inTurn) {
            waitForAll();
        }
        return thread;
    }

    /** Tells of the thread's end, however it ends. */
    struct End {
        ~End() { inForce->end(); }
    };

    static void* run(void* argument) {
        const End end;
        const std::unique_ptr<Start> start(static_cast<Start*>(argument));
        inForce->awaitRelease();
        void* result = start->function(start->argument);
        const std::lock_guard lock(inForce->_mutex);
        return inForce->_result = result;
    }

    void awaitRelease() {
        std::unique_lock lock(_mutex);
        _changed.wait(lock, [this] { return _mode != Mode::held || _released; });
    }

    void end() {
        const std::lock_guard lock(_mutex);
        --_running;
        _changed.notify_all();
    }

    static inline AlertThreads* inForce = nullptr;

    CMPIBroker& _broker;
    const CMPIBrokerExtFT* const _former;
    const Mode _mode;
    CMPIBrokerExtFT _table;
    void* (*_newThread)(CMPIThreadFunc, void*, int);
    mutable std::mutex _mutex; ///< guards what follows
    std::condition_variable _changed;
    std::vector<Start> _starts;
    void* _result = nullptr;
    int _running = 0;
    bool _released = false;
};

} // namespace provider_test
