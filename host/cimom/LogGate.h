/**
 * @file
 * The way to a log that ends before those who write to it.
 */
#pragma once

#include <functional>
#include <shared_mutex>
#include <string>

namespace marlo {

/** Passes lines on, from any thread, until it is closed. */
class LogGate {
  public:
    using Log = std::function<void(const std::string& line)>;

    explicit LogGate(Log log) : _log(std::move(log)) {}

    void write(const std::string& line);

    /** Waits for lines that are being written; later ones are dropped. Not to be called by the log itself. */
    void close();

  private:
    Log _log;
    std::shared_mutex _mutex; ///< guards _log; the log itself is called by many at once
};

} // namespace marlo
