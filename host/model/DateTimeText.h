/**
 * @file
 * The text form of CIM date-times and intervals (DSP0004): `yyyymmddhhmmss.mmmmmmsutc`, `ddddddddhhmmss.mmmmmm:000`.
 */
#pragma once

#include <cstdint>
#include <optional>
#include <string>
#include <string_view>

namespace marlo {

struct DateTimeValue {
    std::uint64_t microseconds = 0; ///< since 1970-01-01T00:00:00Z, or of the interval
    bool interval = false;
};

/**
 * Reads a text of 25 characters; nothing when it is none. Digits that an asterisk leaves open, at the end of the
 * part before the sign, count as their smallest value. A time before 1970 counts as 1970.
 */
std::optional<DateTimeValue> readDateTime(std::string_view text);

/** Date-times come out in UTC. Nothing for what the text form cannot hold (years above 9999, days of 9 digits). */
std::optional<std::string> writeDateTime(const DateTimeValue& value);

} // namespace marlo
