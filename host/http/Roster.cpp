#include "host/http/Roster.h"

#include <algorithm>
#include <vector>

namespace marlo::http {
namespace {

using std::chrono::milliseconds;

/** Often enough for the shortest time to be kept to about an eighth. */
milliseconds intervalFor(const Limits& limits) {
    const milliseconds shortest =
        std::min({limits.headTime, limits.bodyTime, limits.idleTime, limits.sendTime, limits.lingerTime});
    return std::clamp(shortest / 8, milliseconds(5), milliseconds(100));
}

} // namespace

Roster::Roster(Loop& loop, const Limits& limits) : _timer(loop), _interval(intervalFor(limits)) {}

void Roster::add(const std::shared_ptr<Connection>& connection) {
    _connections.insert(connection);
    schedule();
}

void Roster::remove(const std::shared_ptr<Connection>& connection) {
    _connections.erase(connection);
}

/** Without connections nothing is due, and the loop sleeps. */
void Roster::schedule() {
    if (!_isScheduled && !_connections.empty()) {
        _isScheduled = true;
        _timer.after(_interval, [this] { tick(); });
    }
}

void Roster::tick() {
    _isScheduled = false;
    const auto now = Connection::Clock::now();
    const std::vector<std::shared_ptr<Connection>> all(_connections.begin(), _connections.end());
    for (const auto& connection : all) { // some leave the set on the way
        connection->tick(now);
    }
    schedule();
}

void Roster::endIdle() {
    const std::vector<std::shared_ptr<Connection>> all(_connections.begin(), _connections.end());
    for (const auto& connection : all) {
        connection->endIfIdle();
    }
}

void Roster::cut() {
    const std::vector<std::shared_ptr<Connection>> all(_connections.begin(), _connections.end());
    for (const auto& connection : all) {
        connection->cut();
    }
}

} // namespace marlo::http
