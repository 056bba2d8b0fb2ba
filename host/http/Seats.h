/**
 * @file
 * How many connections there are, in all and of each peer.
 */
#pragma once

#include <chrono>
#include <condition_variable>
#include <cstddef>
#include <map>
#include <mutex>
#include <optional>
#include <string>

namespace marlo::http {

/** Any thread. */
class Seats {
  public:
    /** Keeps a place taken while it exists. */
    class Seat {
      public:
        Seat(Seats& seats, std::string peer);
        ~Seat();
        Seat(Seat&& other) noexcept;
        Seat& operator=(Seat&&) = delete;
        Seat(const Seat&) = delete;
        Seat& operator=(const Seat&) = delete;

      private:
        Seats* _seats;
        std::string _peer;
    };

    Seats(std::size_t limit, std::size_t perPeer) : _limit(limit), _perPeer(perPeer) {}

    /** Nothing where there is none left. */
    std::optional<Seat> take(const std::string& peer);
    [[nodiscard]] std::size_t taken() const;

    /** Whether all had left by then. */
    bool awaitEmpty(std::chrono::milliseconds patience);
    void awaitEmpty();

  private:
    void leave(const std::string& peer);

    const std::size_t _limit;
    const std::size_t _perPeer;
    mutable std::mutex _mutex;
    std::condition_variable _left;
    std::map<std::string, std::size_t> _byPeer;
    std::size_t _taken = 0;
};

} // namespace marlo::http
