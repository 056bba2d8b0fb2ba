/**
 * @file
 * The connections of a loop.
 */
#pragma once

#include "host/http/Connection.h"

#include <memory>
#include <unordered_set>

namespace marlo::http {

/** Keeps connections alive, and looks from time to time for those that take too long. In the hands of the loop. */
class Roster {
  public:
    Roster(Loop& loop, const Limits& limits);

    void add(const std::shared_ptr<Connection>& connection);
    void remove(const std::shared_ptr<Connection>& connection);

    void endIdle();
    void cut();

  private:
    void schedule();
    void tick();

    Timer _timer;
    std::chrono::milliseconds _interval;
    bool _isScheduled = false;
    std::unordered_set<std::shared_ptr<Connection>> _connections;
};

} // namespace marlo::http
