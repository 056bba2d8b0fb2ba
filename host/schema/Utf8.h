/**
 * @file
 * UTF-8 (RFC 3629) to and from code points.
 */
#pragma once

#include <optional>
#include <string>
#include <string_view>

namespace marlo {

/** Appends a code point; one that is no Unicode scalar value becomes U+FFFD. */
void appendUtf8(std::string& text, char32_t codePoint);

/**
 * Takes the first code point off a text. None when the text is empty or begins with bytes that are no UTF-8 (an
 * overlong form, a surrogate, a cut sequence); the text is then left as it is.
 */
std::optional<char32_t> takeUtf8(std::string_view& text);

} // namespace marlo
