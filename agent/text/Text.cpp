#include "agent/text/Text.h"

#include <algorithm>
#include <cstddef>

namespace Orv::Agent {

namespace {

using Byte = unsigned char;

constexpr std::string_view replacement = "\xEF\xBF\xBD";

bool isPlain(char character) {
    return character >= 0x20 && character < 0x7F;
}

/** Lead bytes of well-formed sequences, with what may follow the lead at once (Unicode, table 3-7). */
struct Sequence {
    Byte firstLead;
    Byte lastLead;
    Byte firstSecond;
    Byte lastSecond;
    std::size_t length;
};

constexpr Sequence sequences[] = {
    {0xC2, 0xDF, 0x80, 0xBF, 2}, {0xE0, 0xE0, 0xA0, 0xBF, 3}, {0xE1, 0xEC, 0x80, 0xBF, 3},
    {0xED, 0xED, 0x80, 0x9F, 3}, {0xEE, 0xEF, 0x80, 0xBF, 3}, {0xF0, 0xF0, 0x90, 0xBF, 4},
    {0xF1, 0xF3, 0x80, 0xBF, 4}, {0xF4, 0xF4, 0x80, 0x8F, 4},
};

bool isWithin(char character, Byte first, Byte last) {
    const auto byte = static_cast<Byte>(character);
    return byte >= first && byte <= last;
}

bool startsWith(std::string_view bytes, const Sequence& sequence) {
    return bytes.size() >= sequence.length && isWithin(bytes[0], sequence.firstLead, sequence.lastLead) &&
           isWithin(bytes[1], sequence.firstSecond, sequence.lastSecond) &&
           std::all_of(bytes.begin() + 2, bytes.begin() + static_cast<std::ptrdiff_t>(sequence.length),
                       [](char next) { return isWithin(next, 0x80, 0xBF); });
}

/** Length of the well-formed sequence of two bytes and more that `bytes` starts with, else 0. */
std::size_t sequenceLength(std::string_view bytes) {
    const auto* found = std::find_if(std::begin(sequences), std::end(sequences),
                                     [&](const Sequence& sequence) { return startsWith(bytes, sequence); });
    return found == std::end(sequences) ? 0 : found->length;
}

/** U+0080 to U+009F. */
bool isC1Control(std::string_view sequence) {
    return sequence[0] == '\xC2' && isWithin(sequence[1], 0x80, 0x9F);
}

/** Appends what the first character of `bytes` becomes; returns how many bytes that character took. */
std::size_t appendClean(std::string& text, std::string_view bytes) {
    if (isWithin(bytes[0], 0x00, 0x7F)) {
        text += isPlain(bytes[0]) ? bytes[0] : ' ';
        return 1;
    }
    const std::size_t length = sequenceLength(bytes);
    if (length == 0) {
        text += replacement;
        return 1;
    }
    if (isC1Control(bytes)) {
        text += ' ';
    } else {
        text += bytes.substr(0, length);
    }
    return length;
}

} // namespace

std::string cleanText(std::string_view bytes) {
    const auto plainEnd = std::find_if_not(bytes.begin(), bytes.end(), isPlain);
    std::string text(bytes.begin(), plainEnd);
    bytes.remove_prefix(text.size());
    while (!bytes.empty()) {
        bytes.remove_prefix(appendClean(text, bytes));
    }
    return text;
}

} // namespace Orv::Agent
