#include "host/model/DateTimeText.h"

#include <array>
#include <chrono>
#include <cstdio>

namespace marlo {

namespace {

using std::chrono::days;
using std::chrono::microseconds;

constexpr std::size_t textLength = 25;
constexpr std::size_t pointAt = 14;
constexpr std::size_t signAt = 21;

bool isDigit(char c) {
    return c >= '0' && c <= '9';
}

/** The digits before the sign, open ones as '0'; nothing when a digit follows an open one or the form is wrong. */
std::optional<std::string> digitsOf(std::string_view text) {
    if (text.size() != textLength || text[pointAt] != '.') {
        return std::nullopt;
    }
    std::string digits;
    bool open = false;
    for (std::size_t i = 0; i < signAt; ++i) {
        if (i == pointAt) {
            continue;
        }
        open = open || text[i] == '*';
        if (open ? text[i] != '*' : !isDigit(text[i])) {
            return std::nullopt;
        }
        digits += open ? '0' : text[i];
    }
    return digits;
}

unsigned field(std::string_view digits, std::size_t at, std::size_t length) {
    unsigned value = 0;
    for (const char c : digits.substr(at, length)) {
        value = value * 10 + static_cast<unsigned>(c - '0');
    }
    return value;
}

/** The hours, minutes, seconds and microseconds, which both forms have at the same place. */
std::optional<microseconds> timeOf(std::string_view digits) {
    const unsigned hour = field(digits, 8, 2);
    const unsigned minute = field(digits, 10, 2);
    const unsigned second = field(digits, 12, 2);
    if (hour > 23 || minute > 59 || second > 59) {
        return std::nullopt;
    }
    return std::chrono::hours(hour) + std::chrono::minutes(minute) + std::chrono::seconds(second) +
           microseconds(field(digits, 14, 6));
}

std::optional<DateTimeValue> readPoint(std::string_view digits, std::string_view text, microseconds time) {
    const bool openDay = text[6] == '*';
    const bool openMonth = text[4] == '*';
    const std::chrono::year_month_day date{std::chrono::year(static_cast<int>(field(digits, 0, 4))),
                                           std::chrono::month(openMonth ? 1U : field(digits, 4, 2)),
                                           std::chrono::day(openDay ? 1U : field(digits, 6, 2))};
    if (!date.ok()) {
        return std::nullopt;
    }
    const std::chrono::minutes offset(static_cast<int>(field(text, signAt + 1, 3)));
    const auto local = std::chrono::sys_days(date).time_since_epoch() + time;
    const microseconds utc = text[signAt] == '+' ? local - offset : local + offset;
    return DateTimeValue{utc.count() < 0 ? 0 : static_cast<std::uint64_t>(utc.count()), false};
}

std::string format(const char* pattern, unsigned a, unsigned b, unsigned c, unsigned d, unsigned e, unsigned f,
                   unsigned g) {
    std::array<char, 128> buffer{};
    static_cast<void>(std::snprintf(buffer.data(), buffer.size(), pattern, a, b, c, d, e, f, g));
    return buffer.data();
}

} // namespace

std::optional<DateTimeValue> readDateTime(std::string_view text) {
    const auto digits = digitsOf(text);
    if (!digits || !isDigit(text[22]) || !isDigit(text[23]) || !isDigit(text[24])) {
        return std::nullopt;
    }
    const auto time = timeOf(*digits);
    if (!time) {
        return std::nullopt;
    }
    if (text[signAt] == '+' || text[signAt] == '-') {
        return readPoint(*digits, text, *time);
    }
    if (text[signAt] != ':' || text.substr(22) != "000") {
        return std::nullopt;
    }
    const microseconds interval = days(field(*digits, 0, 8)) + *time;
    return DateTimeValue{static_cast<std::uint64_t>(interval.count()), true};
}

std::optional<std::string> writeDateTime(const DateTimeValue& value) {
    constexpr std::uint64_t dayLength = 86'400'000'000;
    const std::uint64_t dayCount = value.microseconds / dayLength;
    const std::chrono::hh_mm_ss time{microseconds(value.microseconds % dayLength)};
    const auto hour = static_cast<unsigned>(time.hours().count());
    const auto minute = static_cast<unsigned>(time.minutes().count());
    const auto second = static_cast<unsigned>(time.seconds().count());
    const auto micro = static_cast<unsigned>(time.subseconds().count());
    constexpr std::uint64_t endOfYears = 2'932'897; // days from 1970 to 10000
    if (dayCount >= (value.interval ? 100'000'000 : endOfYears)) {
        return std::nullopt;
    }
    if (value.interval) {
        const auto high = static_cast<unsigned>(dayCount / 10'000);
        return format("%04u%04u%02u%02u%02u.%06u:%03u", high, static_cast<unsigned>(dayCount % 10'000), hour, minute,
                      second, micro, 0);
    }
    const std::chrono::year_month_day date{std::chrono::sys_days(days(dayCount))};
    const auto year = static_cast<unsigned>(static_cast<int>(date.year()));
    return format("%04u%02u%02u%02u%02u%02u.%06u+000", year, static_cast<unsigned>(date.month()),
                  static_cast<unsigned>(date.day()), hour, minute, second, micro);
}

} // namespace marlo
