/**
 * @file
 * Interfaces in a network namespace of this process's own, one of which goes up and down, and a witness of when the
 * kernel told of it.
 */
#pragma once

#include <atomic>
#include <chrono>
#include <cstdint>
#include <thread>

namespace marlo::bench {

/** Moves this process, which has one thread, into a new network namespace with so many interfaces. Needs root. */
void makeNamespace(int interfaces);

/**
 * Takes the first interface of the namespace up and down. A thread of the highest priority listens to the same
 * notifications as the agent does, and notes when each is there to be read.
 */
class Flips {
  public:
    Flips();
    ~Flips();
    Flips(const Flips&) = delete;
    Flips& operator=(const Flips&) = delete;

    /** Takes the interface up or down and returns when the kernel's notification of that was there. */
    std::chrono::steady_clock::time_point flip(bool up);

    /** Returns when nothing has been notified for two seconds: duplicate address detection takes its time. */
    void waitUntilQuiet() const;

  private:
    void witness();
    void note(const char* bytes, std::size_t length);

    int _index;
    int _requests = -1;
    int _notifications = -1;
    std::atomic<int> _wanted = -1; ///< 1 up, 0 down, -1 nothing
    std::atomic<std::int64_t> _seen = 0;
    std::atomic<std::int64_t> _last = 0; ///< of any notification
    std::atomic<bool> _stop = false;
    std::thread _witness;
};

} // namespace marlo::bench
