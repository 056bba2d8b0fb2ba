#include "host/cimxml/Escape.h"

#include "host/schema/Utf8.h"

#include <array>

namespace marlo::cimxml {

namespace {

constexpr std::string_view replacement = "\xEF\xBF\xBD";

/** True for the bytes that stand for themselves. */
using PlainBytes = std::array<bool, 256>;

constexpr PlainBytes plainBytes(std::string_view others) {
    PlainBytes plain{};
    for (std::size_t byte = 0x20; byte < 0x80; ++byte) {
        plain[byte] = true;
    }
    plain['\t'] = plain['\n'] = true;
    for (const char other : others) {
        plain[static_cast<unsigned char>(other)] = false;
    }
    return plain;
}

constexpr PlainBytes plainInText = plainBytes("&<>\r");
constexpr PlainBytes plainInAttributes = plainBytes("&<>\r\"\t\n");

std::string_view escapeOf(char c) {
    switch (c) {
    case '&':
        return "&amp;";
    case '<':
        return "&lt;";
    case '>':
        return "&gt;";
    case '"':
        return "&quot;";
    case '\t':
        return "&#9;";
    case '\n':
        return "&#10;";
    case '\r':
        return "&#13;";
    default:
        return replacement;
    }
}

/** Takes the first character off, which is not plain. */
void appendSpecial(std::string& out, std::string_view& text) {
    const std::string_view before = text;
    const auto codePoint = takeUtf8(text);
    if (codePoint && *codePoint >= 0x80 && *codePoint != 0xFFFE && *codePoint != 0xFFFF) {
        out += before.substr(0, before.size() - text.size());
        return;
    }
    out += escapeOf(codePoint && *codePoint < 0x80 ? before.front() : '\0');
    if (!codePoint) {
        text.remove_prefix(1);
    }
}

void append(std::string& out, std::string_view text, const PlainBytes& plain) {
    while (!text.empty()) {
        std::size_t length = 0;
        while (length < text.size() && plain[static_cast<unsigned char>(text[length])]) {
            ++length;
        }
        out.append(text.data(), length);
        text.remove_prefix(length);
        if (!text.empty()) {
            appendSpecial(out, text);
        }
    }
}

} // namespace

void appendText(std::string& out, std::string_view text) {
    append(out, text, plainInText);
}

void appendAttributeText(std::string& out, std::string_view text) {
    append(out, text, plainInAttributes);
}

void appendAttribute(std::string& out, std::string_view name, std::string_view value) {
    out += ' ';
    out += name;
    out += "=\"";
    appendAttributeText(out, value);
    out += '"';
}

} // namespace marlo::cimxml
