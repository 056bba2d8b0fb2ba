/**
 * @file
 * What a fuzz target does when something that always holds does not.
 */
#pragma once

#include <cstdint>
#include <cstdio>
#include <cstdlib>
#include <string_view>

namespace marlo::fuzz {

/** Ends the process, saying what did not hold. */
inline void require(bool holds, const char* what) {
    if (!holds) {
        (void)std::fprintf(stderr, "does not hold: %s\n", what);
        std::abort();
    }
}

inline std::string_view textOf(const std::uint8_t* data, std::size_t size) {
    return {reinterpret_cast<const char*>(data), size}; // NOLINT: libFuzzer hands bytes over
}

} // namespace marlo::fuzz
