#include "host/security/Throttle.h"

#include <algorithm>
#include <array>

#include <arpa/inet.h>
#include <netinet/in.h>

namespace marlo::security {

std::string peerKey(const std::string& address) {
    // A scope ("fe80::1%eth0") tells which link the address is of.
    const std::size_t scope = std::min(address.find('%'), address.size());
    in6_addr binary{};
    if (inet_pton(AF_INET6, address.substr(0, scope).c_str(), &binary) != 1) {
        return address;
    }
    std::array<char, INET6_ADDRSTRLEN> text{};
    if (IN6_IS_ADDR_V4MAPPED(&binary)) {
        return inet_ntop(AF_INET, &binary.s6_addr[12], text.data(), text.size());
    }
    std::fill(&binary.s6_addr[8], &binary.s6_addr[8] + 8, std::uint8_t{0});
    return inet_ntop(AF_INET6, &binary, text.data(), text.size()) + address.substr(scope) + "/64";
}

Clock::duration Throttle::shutOut(const std::string& peer, Clock::time_point now) const {
    const std::lock_guard<std::mutex> lock(_mutex);
    const auto found = _entries.find(peer);
    const Clock::duration none{0};
    return found == _entries.end() ? none : std::max(none, found->second.answered - now - _limits.held);
}

Clock::time_point Throttle::fail(const std::string& peer, Clock::time_point now) {
    const std::lock_guard<std::mutex> lock(_mutex);
    Entry& entry = entryOf(peer, now);
    // More of them would not delay longer, only take longer to be forgiven.
    const unsigned former = std::min(failuresOf(entry, now), _limits.doublings);
    entry.failures = former + 1;
    entry.last = now;
    entry.answered = std::max(entry.answered, now) + _firstDelay * (1U << former);
    return entry.answered;
}

unsigned Throttle::failures(const std::string& peer, Clock::time_point now) const {
    const std::lock_guard<std::mutex> lock(_mutex);
    const auto found = _entries.find(peer);
    return found == _entries.end() ? 0 : failuresOf(found->second, now);
}

std::size_t Throttle::peers() const {
    const std::lock_guard<std::mutex> lock(_mutex);
    return _entries.size();
}

unsigned Throttle::failuresOf(const Entry& entry, Clock::time_point now) const {
    const auto forgiven = (now - entry.last) / Clock::duration(_limits.forgiving);
    return forgiven >= entry.failures ? 0 : entry.failures - static_cast<unsigned>(forgiven);
}

Throttle::Entry& Throttle::entryOf(const std::string& peer, Clock::time_point now) {
    if (!_entries.contains(peer)) {
        makeRoom(now);
        _entries.emplace(peer, Entry{0, now, now});
    }
    return _entries.at(peer);
}

void Throttle::makeRoom(Clock::time_point now) {
    if (_entries.size() < _limits.peers) {
        return;
    }
    std::erase_if(_entries, [&](const auto& entry) { return failuresOf(entry.second, now) == 0; });
    if (_entries.size() >= _limits.peers) {
        _entries.erase(std::min_element(_entries.begin(), _entries.end(), [](const auto& one, const auto& other) {
            return one.second.last < other.second.last;
        }));
    }
}

} // namespace marlo::security
