#include "agent/library/SystemIdentifier.h"

#include <algorithm>
#include <array>
#include <fstream>
#include <string_view>

namespace Orv::Agent {

namespace {

constexpr const char* firmwareFile = "/sys/class/dmi/id/product_uuid";
constexpr const char* machineFile = "/etc/machine-id";

/** What firmware writes that was never told its UUID: nothing but zeros, nothing but ones, and a counted pattern. */
constexpr std::array<std::string_view, 3> placeholders{"00000000-0000-0000-0000-000000000000",
                                                       "ffffffff-ffff-ffff-ffff-ffffffffffff",
                                                       "03000200-0400-0500-0006-000700080009"};

std::string firstLine(const std::string& path) {
    std::ifstream file(path);
    std::string line;
    std::getline(file, line);
    return line;
}

bool isHexadecimal(char character) {
    return (character >= '0' && character <= '9') || (character >= 'a' && character <= 'f') ||
           (character >= 'A' && character <= 'F');
}

bool isIdentifier(std::string_view text) {
    return !text.empty() && std::all_of(text.begin(), text.end(),
                                        [](char character) { return isHexadecimal(character) || character == '-'; });
}

bool isPlaceholder(std::string text) {
    std::transform(text.begin(), text.end(), text.begin(), [](char character) {
        return character >= 'A' && character <= 'F' ? static_cast<char>(character - 'A' + 'a') : character;
    });
    return std::find(placeholders.begin(), placeholders.end(), text) != placeholders.end();
}

} // namespace

std::string readSystemIdentifier(const std::string& root) {
    std::string firmware = firstLine(root + firmwareFile);
    if (isIdentifier(firmware) && !isPlaceholder(firmware)) {
        return firmware;
    }
    const std::string machine = firstLine(root + machineFile);
    return isIdentifier(machine) ? machine : std::string();
}

} // namespace Orv::Agent
