#include "host/http/Seats.h"

#include <utility>

namespace marlo::http {

Seats::Seat::Seat(Seats& seats, std::string peer) : _seats(&seats), _peer(std::move(peer)) {}

Seats::Seat::~Seat() {
    if (_seats != nullptr) {
        _seats->leave(_peer);
    }
}

Seats::Seat::Seat(Seat&& other) noexcept
    : _seats(std::exchange(other._seats, nullptr)), _peer(std::move(other._peer)) {}

std::optional<Seats::Seat> Seats::take(const std::string& peer) {
    const std::lock_guard lock(_mutex);
    if (_taken >= _limit) {
        return std::nullopt;
    }
    const auto [place, isNew] = _byPeer.try_emplace(peer, 0);
    if (place->second >= _perPeer) {
        if (isNew) {
            _byPeer.erase(place);
        }
        return std::nullopt;
    }
    ++place->second;
    ++_taken;
    return Seat(*this, peer);
}

std::size_t Seats::taken() const {
    const std::lock_guard lock(_mutex);
    return _taken;
}

void Seats::leave(const std::string& peer) {
    const std::lock_guard lock(_mutex);
    --_taken;
    const auto place = _byPeer.find(peer);
    if (--place->second == 0) {
        _byPeer.erase(place);
    }
    if (_taken == 0) {
        _left.notify_all();
    }
}

bool Seats::awaitEmpty(std::chrono::milliseconds patience) {
    std::unique_lock lock(_mutex);
    return _left.wait_for(lock, patience, [this] { return _taken == 0; });
}

void Seats::awaitEmpty() {
    std::unique_lock lock(_mutex);
    _left.wait(lock, [this] { return _taken == 0; });
}

} // namespace marlo::http
