/**
 * @file
 * How fast a client takes an answer.
 */
#pragma once

#include <algorithm>
#include <chrono>
#include <cstddef>

namespace marlo::http {

/**
 * A client is expected to take `rate` bytes a second, and may fall behind by so much as it would take in `patience`.
 * What it takes beyond does not count for later: at the other end, the system alone takes some MiB at once without
 * anybody reading them. Only time in which the client is waited for counts, not that in which its answer comes about.
 */
class Pace {
  public:
    using Time = std::chrono::nanoseconds;

    /** `rate` is at least 1. */
    Pace(std::chrono::milliseconds patience, std::size_t rate) : _patience(patience), _left(patience), _rate(rate) {}

    /** It was waited for so long, and took so many bytes meanwhile. */
    void went(Time waited, std::size_t taken) {
        constexpr std::size_t billion = 1'000'000'000;
        const std::size_t enough = _rate * static_cast<std::size_t>(_patience.count() / 1000 + 1);
        _left += Time(static_cast<Time::rep>(std::min(taken, enough) * billion / _rate)) - waited;
        _left = std::min(_left, _patience);
    }

    /** How long it may still take nothing; nothing or less: it is too slow. */
    [[nodiscard]] Time left() const { return _left; }

    [[nodiscard]] bool isTooSlow() const { return _left.count() <= 0; }

  private:
    Time _patience;
    Time _left;
    std::size_t _rate;
};

} // namespace marlo::http
