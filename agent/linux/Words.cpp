#include "agent/linux/Words.h"

#include <charconv>
#include <system_error>

namespace Orv::Agent::Linux {

namespace {

constexpr std::string_view blanks = " \t\r\v\f";

/** The non-empty pieces between the separators. */
std::vector<std::string_view> pieces(std::string_view text, std::string_view separators) {
    std::vector<std::string_view> found;
    std::size_t begin = text.find_first_not_of(separators);
    while (begin != std::string_view::npos) {
        const std::size_t end = text.find_first_of(separators, begin);
        found.push_back(text.substr(begin, end - begin));
        begin = text.find_first_not_of(separators, end);
    }
    return found;
}

} // namespace

std::vector<std::string_view> linesOf(std::string_view text) {
    return pieces(text, "\n");
}

std::vector<std::string_view> wordsOf(std::string_view line) {
    return pieces(line, blanks);
}

std::string_view trimmed(std::string_view text) {
    const std::size_t begin = text.find_first_not_of(blanks);
    if (begin == std::string_view::npos) {
        return {};
    }
    return text.substr(begin, text.find_last_not_of(blanks) - begin + 1);
}

std::optional<int> positiveNumber(std::string_view text) {
    int number = 0;
    const char* end = text.data() + text.size();
    const auto result = std::from_chars(text.data(), end, number);
    return result.ec == std::errc() && result.ptr == end && number > 0 ? std::optional(number) : std::nullopt;
}

} // namespace Orv::Agent::Linux
