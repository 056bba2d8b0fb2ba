/**
 * @file
 * Signals that are read instead of acted upon.
 */
#pragma once

#include <csignal>
#include <initializer_list>
#include <optional>

namespace marlo::server {

/** Blocked for the calling thread, and for those that it starts, while this lives. */
class Signals {
  public:
    /** Throws std::system_error where there is no descriptor to be had. */
    explicit Signals(std::initializer_list<int> numbers);
    ~Signals();
    Signals(const Signals&) = delete;
    Signals& operator=(const Signals&) = delete;

    /** For poll: readable when a signal has come. */
    [[nodiscard]] int descriptor() const { return _descriptor; }

    /** The number of a signal that has come, once. */
    [[nodiscard]] std::optional<int> take() const;

  private:
    sigset_t _before{};
    int _descriptor = -1;
};

} // namespace marlo::server
