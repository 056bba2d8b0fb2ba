/**
 * @file
 * An object manager that is subscribed to every indication of the adapters, and what has come of it.
 */
#pragma once

#include "host/cimom/ObjectManager.h"

#include <chrono>
#include <condition_variable>
#include <cstddef>
#include <filesystem>
#include <memory>
#include <mutex>
#include <string>

namespace marlo::bench {

using Clock = std::chrono::steady_clock;

/** One at a time. */
class Subscriber {
  public:
    /** Subscribes: the agent begins to monitor. */
    Subscriber();
    ~Subscriber();
    Subscriber(const Subscriber&) = delete;
    Subscriber& operator=(const Subscriber&) = delete;

    /**
     * Waits until so many deliveries have returned in all, and gives the time of the latest. Throws when none returns
     * for ten seconds.
     */
    Clock::time_point await(std::size_t count);

    [[nodiscard]] std::size_t count() const;

    /** Throws unless the indications so far were "Offline" and "Online" of eth0 in turn, beginning with the former.
     */
    void expectAlternation() const;

    /** A delivery has returned. */
    void delivered();

  private:
    void receive(const Instance& indication);

    std::filesystem::path _registrations;
    mutable std::mutex _mutex; ///< guards what follows but the last
    std::condition_variable _changed;
    std::size_t _delivered = 0;
    std::size_t _received = 0;
    std::size_t _outOfTurn = 0;
    Clock::time_point _latest;
    std::unique_ptr<ObjectManager> _manager;
};

} // namespace marlo::bench
