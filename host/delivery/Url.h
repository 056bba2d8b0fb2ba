/**
 * @file
 * The URL of a listener (RFC 3986).
 */
#pragma once

#include <string>
#include <string_view>

namespace marlo::delivery {

struct Url {
    bool isSecure = false;   ///< https
    std::string host;        ///< a name, or an address; IPv6 without its brackets
    unsigned short port = 0; ///< of the scheme where the URL names none: 80 or 443
    std::string target;      ///< path and query, as they stand; "/" at least
    std::string authority;   ///< host and, where the URL has it, port, as the field Host has them

    /**
     * Throws std::invalid_argument that says what is wrong: another scheme, no host, a port that is none, a user (it
     * would be sent to whoever answers there), a fragment, characters that must be escaped.
     */
    static Url parse(std::string_view text);

    bool operator==(const Url&) const = default;
};

} // namespace marlo::delivery
