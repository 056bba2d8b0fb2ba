/**
 * @file
 * Tells of subscriptions whose patience is over.
 */
#pragma once

#include "host/delivery/Delivery.h"

#include <condition_variable>
#include <deque>
#include <mutex>
#include <string>
#include <thread>
#include <utility>

namespace marlo::delivery {

/**
 * Calls a handler, one subscription after the other, on a thread of its own: to end a subscription takes the time
 * that a provider takes.
 */
class Policies {
  public:
    Policies(Delivery::PolicyHandler handler, Delivery::Log log);
    ~Policies(); ///< waits for the handler that runs; the rest is left
    Policies(const Policies&) = delete;
    Policies& operator=(const Policies&) = delete;

    /** Any thread. */
    void fire(const std::string& subscription, OnFatalError policy);

  private:
    void run();

    const Delivery::PolicyHandler _handler;
    const Delivery::Log _log;
    std::mutex _mutex; ///< guards all below
    std::condition_variable _changed;
    std::deque<std::pair<std::string, OnFatalError>> _fired;
    bool _isEnding = false;
    std::thread _thread;
};

} // namespace marlo::delivery
