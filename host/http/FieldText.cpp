#include "host/http/FieldText.h"

#include <algorithm>

namespace marlo::http {
namespace {

char lower(char character) {
    return character >= 'A' && character <= 'Z' ? static_cast<char>(character - 'A' + 'a') : character;
}

bool isDigit(char character) {
    return character >= '0' && character <= '9';
}

} // namespace

bool equalsIgnoringCase(std::string_view left, std::string_view right) {
    return left.size() == right.size() && std::equal(left.begin(), left.end(), right.begin(),
                                                     [](char one, char other) { return lower(one) == lower(other); });
}

std::string_view trimmed(std::string_view text) {
    const auto first = text.find_first_not_of(" \t");
    if (first == std::string_view::npos) {
        return {};
    }
    return text.substr(first, text.find_last_not_of(" \t") - first + 1);
}

std::vector<std::string_view> listElements(std::string_view value) {
    std::vector<std::string_view> elements;
    while (!value.empty()) {
        const auto comma = value.find(',');
        const std::string_view element = trimmed(value.substr(0, comma));
        if (!element.empty()) {
            elements.push_back(element);
        }
        value = comma == std::string_view::npos ? std::string_view() : value.substr(comma + 1);
    }
    return elements;
}

bool isTokenCharacter(char character) {
    const char small = lower(character);
    const bool isLetter = small >= 'a' && small <= 'z';
    return isLetter || isDigit(character) ||
           (character != '\0' && std::string_view("!#$%&'*+-.^_`|~").find(character) != std::string_view::npos);
}

} // namespace marlo::http
