#include "agent/hardware/Sysfs.h"

#include <charconv>
#include <fstream>

namespace Orv::Agent::Hardware {

namespace {

std::optional<std::uint16_t> parse(std::string_view digits, int base) {
    std::uint16_t value = 0;
    const char* end = digits.data() + digits.size();
    const auto [stop, error] = std::from_chars(digits.data(), end, value, base);
    if (error != std::errc() || stop != end) {
        return std::nullopt;
    }
    return value;
}

} // namespace

std::optional<std::string> readAttribute(const std::filesystem::path& file) {
    std::ifstream stream(file);
    std::string line;
    if (!std::getline(stream, line)) {
        return std::nullopt;
    }
    const auto first = line.find_first_not_of(" \t\r");
    if (first == std::string::npos) {
        return std::nullopt;
    }
    return line.substr(first, line.find_last_not_of(" \t\r") - first + 1);
}

std::optional<std::uint16_t> readNumber(const std::filesystem::path& file) {
    const auto text = readAttribute(file);
    if (!text) {
        return std::nullopt;
    }
    return text->starts_with("0x") ? parse(std::string_view(*text).substr(2), 16) : parse(*text, 10);
}

std::optional<std::uint16_t> readHexadecimal(const std::filesystem::path& file) {
    const auto text = readAttribute(file);
    return text ? parse(*text, 16) : std::nullopt;
}

std::optional<std::string> readLinkName(const std::filesystem::path& link) {
    std::error_code error;
    const auto target = std::filesystem::read_symlink(link, error);
    if (error || target.filename().empty()) {
        return std::nullopt;
    }
    return target.filename().string();
}

} // namespace Orv::Agent::Hardware
