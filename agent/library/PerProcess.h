/**
 * @file
 * Objects of which every process has one of its own.
 */
#pragma once

#include <atomic>
#include <memory>
#include <mutex>

namespace Orv::Agent {

/**
 * One object, made by the first who asks and never destroyed: threads may use it until the process ends, whatever
 * static objects are gone by then. A process that is forked makes one of its own, for it has neither the threads of
 * its parent's object, nor may it read from the parent's sockets. For static variables.
 */
template <typename Object>
class PerProcess {
  public:
    /** What there is, else what `make` gives, a unique_ptr; throws what that throws. Costs one atomic read mostly. */
    template <typename Make>
    Object& get(Make make) {
        if (Object* present = _object.load(std::memory_order_acquire)) {
            return *present;
        }
        const std::lock_guard lock(_mutex);
        if (Object* present = _object.load(std::memory_order_acquire)) {
            return *present;
        }
        Object* made = make().release();
        _object.store(made, std::memory_order_release);
        return *made;
    }

    /** The three parts of a fork, see pthread_atfork(3). */
    void beforeFork() { _mutex.lock(); }

    void inParent() { _mutex.unlock(); }

    void inChild() {
        _object.store(nullptr, std::memory_order_release);
        _mutex.unlock();
    }

  private:
    std::mutex _mutex; ///< held while the object is made
    std::atomic<Object*> _object{nullptr};
};

} // namespace Orv::Agent
