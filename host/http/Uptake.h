/**
 * @file
 * What a client has taken of its answer.
 */
#pragma once

#include "host/http/Pace.h"

#include <cstddef>
#include <cstdint>

namespace marlo::http {

/**
 * Keeps the pace of one client on a socket. Taken is what its system has acknowledged and not what the own one holds
 * to be sent: of that a socket keeps some MiB, and asks for more only when a third of them is gone. One thread.
 */
class Uptake {
  public:
    /** The descriptor belongs to somebody else. What it holds from before does not count as taken until it is. */
    Uptake(int descriptor, const Pace& pace);

    void wrote(std::size_t bytes) { _written += static_cast<std::int64_t>(bytes); }

    /** The client was waited for so long, since it was last looked at. */
    void waited(Pace::Time time);

    [[nodiscard]] Pace::Time left() const { return _pace.left(); }

    [[nodiscard]] bool isTooSlow() const { return _pace.isTooSlow(); }

  private:
    int _descriptor;
    Pace _pace;
    std::int64_t _written = 0;
    std::int64_t _taken; ///< negative while there is something from before
};

} // namespace marlo::http
