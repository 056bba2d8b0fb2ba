#include "host/schema/Utf8.h"

#include <array>
#include <cstddef>

namespace marlo {

namespace {

constexpr char32_t Replacement = 0xFFFD;
constexpr char32_t LastCodePoint = 0x10FFFF;
/** The least code point that needs a sequence of so many bytes: anything below it is an overlong form. */
constexpr std::array<char32_t, 5> LeastOfLength = {0, 0, 0x80, 0x800, 0x10000};

bool isScalarValue(char32_t codePoint) {
    return codePoint <= LastCodePoint && (codePoint < 0xD800 || codePoint > 0xDFFF);
}

/** Length of the sequence that a byte begins; 0 for a byte that begins none. */
std::size_t sequenceLength(unsigned char lead) {
    if (lead < 0x80) {
        return 1;
    }
    if (lead < 0xC2) {
        return 0;
    }
    return lead < 0xE0 ? 2 : lead < 0xF0 ? 3 : lead < 0xF5 ? 4 : 0;
}

} // namespace

void appendUtf8(std::string& text, char32_t codePoint) {
    const char32_t c = isScalarValue(codePoint) ? codePoint : Replacement;
    const auto put = [&text](char32_t byte) { text.push_back(static_cast<char>(byte)); };
    const auto tail = [&](unsigned shift) { put(0x80 | ((c >> shift) & 0x3F)); };
    if (c < 0x80) {
        put(c);
    } else if (c < 0x800) {
        put(0xC0 | (c >> 6));
        tail(0);
    } else if (c < 0x10000) {
        put(0xE0 | (c >> 12));
        tail(6);
        tail(0);
    } else {
        put(0xF0 | (c >> 18));
        tail(12);
        tail(6);
        tail(0);
    }
}

std::optional<char32_t> takeUtf8(std::string_view& text) {
    if (text.empty()) {
        return std::nullopt;
    }
    const auto lead = static_cast<unsigned char>(text.front());
    const std::size_t length = sequenceLength(lead);
    if (length == 0 || length > text.size()) {
        return std::nullopt;
    }
    char32_t codePoint = length == 1 ? lead : lead & (0xFFU >> (length + 1));
    for (std::size_t i = 1; i < length; ++i) {
        const auto byte = static_cast<unsigned char>(text[i]);
        if ((byte & 0xC0) != 0x80) {
            return std::nullopt;
        }
        codePoint = (codePoint << 6) | (byte & 0x3F);
    }
    if (!isScalarValue(codePoint) || codePoint < LeastOfLength[length]) {
        return std::nullopt;
    }
    text.remove_prefix(length);
    return codePoint;
}

} // namespace marlo
