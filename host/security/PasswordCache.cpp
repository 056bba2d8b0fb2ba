#include "host/security/PasswordCache.h"

namespace marlo::security {

std::optional<Identity> PasswordCache::find(const std::string& user, const Digest& credentials, Time now) {
    const std::lock_guard<std::mutex> lock(_mutex);
    const auto found = _entries.find(user);
    if (found == _entries.end() || found->second.end <= now || !equal(found->second.credentials, credentials)) {
        return std::nullopt;
    }
    return found->second.identity;
}

void PasswordCache::keep(const std::string& user, const Digest& credentials, const Identity& identity, Time now) {
    const std::lock_guard<std::mutex> lock(_mutex);
    if (_entries.size() >= capacity && !_entries.contains(user)) {
        std::erase_if(_entries, [&](const auto& entry) { return entry.second.end <= now; });
        if (_entries.size() >= capacity) {
            _entries.clear(); // they are asked for once more
        }
    }
    _entries[user] = {credentials, identity, now + lifetime};
}

void PasswordCache::forget(const std::string& user) {
    const std::lock_guard<std::mutex> lock(_mutex);
    _entries.erase(user);
}

void PasswordCache::clear() {
    const std::lock_guard<std::mutex> lock(_mutex);
    _entries.clear();
}

} // namespace marlo::security
