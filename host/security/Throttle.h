/**
 * @file
 * Slowing down those who guess passwords.
 */
#pragma once

#include <chrono>
#include <cstddef>
#include <mutex>
#include <string>
#include <unordered_map>

namespace marlo::security {

using Clock = std::chrono::steady_clock;

struct ThrottleLimits {
    std::size_t peers = 1024; ///< that are remembered; the one whose failure is longest ago is forgotten first
    unsigned doublings = 3;   ///< of the first failure's delay
    std::chrono::seconds forgiving{60}; ///< one failure is forgiven after so long without another
    std::chrono::seconds held{30};      ///< with an answer due later than this a peer has failed too often
};

/**
 * Who is one peer, by its numeric address: an IPv4 address, also where it is written as IPv6, or the first half of an
 * IPv6 address, since whoever has one has all that share it (RFC 4291, 2.5.4). Anything else is taken as it is.
 */
std::string peerKey(const std::string& address);

/**
 * The failures of peers. The answers to one peer's failures come one after the other, each with its own delay: who
 * guesses over many connections gets no further than over one. Any thread; nothing waits here.
 */
class Throttle {
  public:
    explicit Throttle(std::chrono::milliseconds firstDelay, const ThrottleLimits& limits = {})
        : _firstDelay(firstDelay), _limits(limits) {}

    /**
     * How long what a peer brings is not to be looked at, since the answers to its failures pile up: else it would
     * see at once which of its guesses was right. Zero: it may try.
     */
    [[nodiscard]] Clock::duration shutOut(const std::string& peer, Clock::time_point now) const;

    /** Counts a failure and says when it is to be answered. */
    Clock::time_point fail(const std::string& peer, Clock::time_point now);

    /** Failures that are not forgiven yet. */
    [[nodiscard]] unsigned failures(const std::string& peer, Clock::time_point now) const;
    [[nodiscard]] std::size_t peers() const;

  private:
    struct Entry {
        unsigned failures = 0;
        Clock::time_point last;
        Clock::time_point answered; ///< when the last one is
    };

    [[nodiscard]] unsigned failuresOf(const Entry& entry, Clock::time_point now) const;
    Entry& entryOf(const std::string& peer, Clock::time_point now);
    void makeRoom(Clock::time_point now);

    const std::chrono::milliseconds _firstDelay;
    const ThrottleLimits _limits;
    mutable std::mutex _mutex;
    std::unordered_map<std::string, Entry> _entries;
};

} // namespace marlo::security
