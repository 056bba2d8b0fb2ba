/**
 * @file
 * The patterns of LIKE.
 */
#pragma once

#include <optional>
#include <string>
#include <string_view>
#include <utility>
#include <vector>

namespace marlo::filter {

/**
 * A pattern for a whole text. WQL: `%` any characters, `_` one, `[abc]`, `[a-f]` and `[^abc]` one of a set. CQL
 * (DSP0202's basic form and sets): `.` any character, sets as in WQL, and `*` behind any of these or a character for
 * any number of it. A backslash takes the next character as it is.
 *
 * Matching takes at most as many steps as the text has characters times the elements of the pattern.
 */
class Pattern {
  public:
    Pattern() = default;

    static Pattern readWql(std::string_view text) { return read(text, '%', '_'); }

    static Pattern readCql(std::string_view text) { return read(text, '*', '.'); }

    /** Bytes that are no UTF-8 match nothing. */
    [[nodiscard]] bool matches(std::string_view text) const;

  private:
    /** One character of a set of ranges, or of all but those; any number of them where repeated. */
    struct Element {
        std::vector<std::pair<char32_t, char32_t>> ranges;
        bool negated = false;
        bool repeated = false;

        [[nodiscard]] bool accepts(char32_t character) const;
    };

    static Pattern read(std::string_view text, char many, char one);
    static std::optional<Element> readSet(std::string_view& text);
    void skipRepeated(std::vector<bool>& reached) const;

    std::vector<Element> _elements;
};

} // namespace marlo::filter
