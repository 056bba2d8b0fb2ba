/**
 * @file
 * Credentials that were good a moment ago.
 */
#pragma once

#include "host/security/Identity.h"
#include "host/security/Secret.h"

#include <chrono>
#include <cstddef>
#include <mutex>
#include <optional>
#include <string>
#include <unordered_map>

namespace marlo::security {

/**
 * Spares the system's accounts a question per request. Keeps digests, never a password, and each for a short while
 * only: so long a password that has been changed, or an account that has been closed, goes on being good. Any thread.
 */
class PasswordCache {
  public:
    using Time = std::chrono::steady_clock::time_point;
    static constexpr std::chrono::seconds lifetime{30};
    static constexpr std::size_t capacity = 256; ///< users

    /** None unless these very credentials were kept within the lifetime. */
    [[nodiscard]] std::optional<Identity> find(const std::string& user, const Digest& credentials, Time now);
    void keep(const std::string& user, const Digest& credentials, const Identity& identity, Time now);
    void forget(const std::string& user);
    void clear();

  private:
    struct Entry {
        Digest credentials{};
        Identity identity;
        Time end;
    };

    std::mutex _mutex;
    std::unordered_map<std::string, Entry> _entries;
};

} // namespace marlo::security
