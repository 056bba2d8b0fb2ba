/**
 * @file
 * Basic credentials (RFC 7617) as they stand in an Authorization field.
 */
#pragma once

#include <cstddef>
#include <string>
#include <string_view>

namespace marlo::security {

/** Longest value of an Authorization field that is looked at. */
inline constexpr std::size_t longestAuthorization = 2048;
/** Longest user name: what useradd(8) takes is far below. */
inline constexpr std::size_t longestUserName = 256;

/** A name and a password that is wiped with it; neither is empty once they have been read. */
struct Credentials {
    Credentials() = default;
    ~Credentials();
    Credentials(const Credentials&) = delete;
    Credentials& operator=(const Credentials&) = delete;

    std::string user;
    std::string password;
};

/**
 * Reads the value of an Authorization field: the scheme Basic in any case, spaces, and strict Base64 (RFC 4648,
 * padded, no spare bits) of a name, a colon and a password in UTF-8 without control characters. Returns what is
 * wrong, for a log, or an empty text. The user is set as far as it could be read.
 */
std::string_view readBasic(std::string_view value, Credentials& credentials);

} // namespace marlo::security
