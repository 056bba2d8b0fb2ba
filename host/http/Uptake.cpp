#include "host/http/Uptake.h"

#include "host/http/Sockets.h"

namespace marlo::http {

Uptake::Uptake(int descriptor, const Pace& pace)
    : _descriptor(descriptor), _pace(pace), _taken(-static_cast<std::int64_t>(untaken(descriptor))) {}

void Uptake::waited(Pace::Time time) {
    const std::int64_t taken = _written - static_cast<std::int64_t>(untaken(_descriptor));
    const std::int64_t fresh = taken > _taken ? taken - _taken : 0; // a Unix domain socket counts its overhead, too
    _taken += fresh;
    _pace.went(time, static_cast<std::size_t>(fresh));
}

} // namespace marlo::http
