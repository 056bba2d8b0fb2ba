#include "host/filter/Error.h"

#include <algorithm>

namespace marlo::filter {

namespace {

/** Bytes that go on a character of UTF-8 take no column. */
bool beginsCharacter(char c) {
    return (static_cast<unsigned char>(c) & 0xC0U) != 0x80U;
}

std::string placeOf(std::string_view text, std::size_t offset) {
    const std::string_view before = text.substr(0, std::min(offset, text.size()));
    const auto lines = std::count(before.begin(), before.end(), '\n');
    const std::size_t lineStart = before.rfind('\n') == std::string_view::npos ? 0 : before.rfind('\n') + 1;
    const std::string_view line = before.substr(lineStart);
    const auto columns = std::count_if(line.begin(), line.end(), beginsCharacter);
    return "line " + std::to_string(lines + 1) + ", column " + std::to_string(columns + 1);
}

} // namespace

Error::Error(CMPIrc code, std::string_view text, std::size_t offset, const std::string& reason)
    : std::runtime_error(placeOf(text, offset) + ": " + reason), _code(code), _offset(offset) {}

} // namespace marlo::filter
