/**
 * @file
 * The thread that talks to listeners.
 */
#pragma once

#include "host/delivery/LookUps.h"
#include "host/delivery/Trust.h"

#include <chrono>
#include <functional>
#include <memory>
#include <thread>

namespace marlo::delivery {

/** Runs what is due, one thing after the other, on one thread from `start` to `stop`. */
class Network {
  public:
    Network();
    ~Network();
    Network(const Network&) = delete;
    Network& operator=(const Network&) = delete;

    void start();
    /** Runs what has been posted before, and nothing more. Once, and only after `start`. */
    void stop();
    /** Has it run on the thread. Any thread. */
    void post(std::function<void()> what);

    LookUps& lookUps() { return *_lookUps; }

    Trust& trust() { return _trust; }

    /** What the library that does it all has; for the sources that use it. */
    struct Asio;

    Asio& asio() { return *_asio; }

  private:
    std::unique_ptr<Asio> _asio;
    Trust _trust;
    std::unique_ptr<LookUps> _lookUps;
    std::thread _thread;
};

/** On the network's thread only. */
class Timer {
  public:
    explicit Timer(Network& network);
    ~Timer();
    Timer(const Timer&) = delete;
    Timer& operator=(const Timer&) = delete;

    /** Runs `what` once, this much later, in place of what was to be run before. */
    void after(std::chrono::milliseconds delay, std::function<void()> what);
    void cancel();

  private:
    struct Asio;

    std::unique_ptr<Asio> _asio;
};

} // namespace marlo::delivery
