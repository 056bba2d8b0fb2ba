#include "host/security/Credentials.h"

#include "host/schema/Utf8.h"
#include "host/security/Secret.h"

#include <algorithm>
#include <cstdint>
#include <optional>

namespace marlo::security {

namespace {

/** The value of a character of the Base64 alphabet, or -1. */
int base64Value(char character) {
    constexpr std::string_view alphabet = "ABCDEFGHIJKLMNOPQRSTUVWXYZabcdefghijklmnopqrstuvwxyz0123456789+/";
    const std::size_t value = alphabet.find(character);
    return value == std::string_view::npos ? -1 : static_cast<int>(value);
}

std::size_t paddingOf(std::string_view encoded) {
    const std::size_t kept = encoded.find_last_not_of('=');
    return kept == std::string_view::npos ? encoded.size() : encoded.size() - kept - 1;
}

bool decodeBase64(std::string_view encoded, std::string& decoded) {
    const std::size_t padding = paddingOf(encoded);
    if (encoded.empty() || encoded.size() % 4 != 0 || padding > 2) {
        return false;
    }
    encoded.remove_suffix(padding);
    decoded.reserve(encoded.size() / 4 * 3 + 3); // no copy is left behind by growing
    std::uint32_t bits = 0;
    unsigned count = 0;
    for (const char character : encoded) {
        const int value = base64Value(character);
        if (value < 0) {
            return false;
        }
        bits = bits << 6U | static_cast<std::uint32_t>(value);
        count += 6;
        if (count >= 8) {
            count -= 8;
            decoded += static_cast<char>(bits >> count & 0xFFU);
        }
    }
    return (bits & ((1U << count) - 1U)) == 0; // one text has one encoding
}

bool isControl(char32_t codePoint) {
    return codePoint < 0x20 || (codePoint >= 0x7F && codePoint < 0xA0);
}

bool isPlainUtf8(std::string_view text) {
    while (!text.empty()) {
        const std::optional<char32_t> codePoint = takeUtf8(text);
        if (!codePoint || isControl(*codePoint)) {
            return false;
        }
    }
    return true;
}

bool isBasic(std::string_view scheme) {
    constexpr std::string_view basic = "basic";
    return std::equal(scheme.begin(), scheme.end(), basic.begin(), basic.end(), [](char written, char wanted) {
        return (written >= 'A' && written <= 'Z' ? static_cast<char>(written - 'A' + 'a') : written) == wanted;
    });
}

/** Cuts the decoded text at its first colon: a password may hold more of them. */
std::string_view split(std::string_view text, Credentials& credentials) {
    const std::size_t colon = text.find(':');
    if (colon == std::string_view::npos) {
        return "credentials without a colon";
    }
    if (!isPlainUtf8(text)) {
        return "credentials that are no UTF-8 or hold control characters";
    }
    credentials.user = text.substr(0, colon);
    if (credentials.user.empty() || credentials.user.size() > longestUserName) {
        return "a user name that is empty or too long";
    }
    credentials.password = text.substr(colon + 1);
    return credentials.password.empty() ? "an empty password" : "";
}

} // namespace

Credentials::~Credentials() {
    wipe(password);
}

std::string_view readBasic(std::string_view value, Credentials& credentials) {
    if (value.size() > longestAuthorization) {
        return "an Authorization field that is too long";
    }
    const std::size_t schemeEnd = std::min(value.find(' '), value.size());
    if (!isBasic(value.substr(0, schemeEnd))) {
        return "a scheme other than Basic";
    }
    value.remove_prefix(schemeEnd);
    value.remove_prefix(std::min(value.find_first_not_of(' '), value.size()));
    std::string text;
    const std::string_view reason =
        decodeBase64(value, text) ? split(text, credentials) : "credentials that are no Base64";
    wipe(text);
    return reason;
}

} // namespace marlo::security
