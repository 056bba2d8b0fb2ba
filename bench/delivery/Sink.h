/**
 * @file
 * A listener that keeps up, and when each indication came to it.
 */
#pragma once

#include "host/http/Descriptor.h"

#include <chrono>
#include <condition_variable>
#include <cstdint>
#include <map>
#include <mutex>
#include <string>
#include <thread>

namespace marlo::bench {

using Clock = std::chrono::steady_clock;

/** Takes one connection after the other. */
class Sink {
  public:
    Sink();
    ~Sink();
    Sink(const Sink&) = delete;
    Sink& operator=(const Sink&) = delete;

    [[nodiscard]] std::string url() const { return "http://127.0.0.1:" + std::to_string(_port) + "/"; }

    /** When the last byte of a SequenceNumber was read; waits for it, and throws std::runtime_error after a minute.
     */
    Clock::time_point arrivalOf(std::int64_t number);

  private:
    void listen();
    void serve(int descriptor);
    void note(const std::string& body);

    unsigned short _port = 0;
    http::Descriptor _listening;
    std::mutex _mutex; ///< guards all below
    std::condition_variable _came;
    std::map<std::int64_t, Clock::time_point> _arrivals;
    int _connection = -1;
    bool _isEnding = false;
    std::thread _thread;
};

} // namespace marlo::bench
