/**
 * @file
 * Changing pieces of a text with all else left byte for byte.
 */
#pragma once

#include <cstddef>
#include <string>
#include <string_view>
#include <vector>

namespace Orv::Agent {

/** Replacements in one text, gathered in any order. They must not overlap. */
class TextEdit {
  public:
    /** What stands from `begin` up to `end` becomes `text`; at one place, in the order of the calls. */
    void replace(std::size_t begin, std::size_t end, std::string text) {
        _splices.push_back({begin, end, std::move(text)});
    }

    void insert(std::size_t place, std::string text) { replace(place, place, std::move(text)); }

    void remove(std::size_t begin, std::size_t end) { replace(begin, end, {}); }

    /** The text for which the replacements were gathered, with them made. */
    [[nodiscard]] std::string applied(std::string_view text) const;

  private:
    struct Splice {
        std::size_t begin;
        std::size_t end;
        std::string text;
    };

    std::vector<Splice> _splices;
};

} // namespace Orv::Agent
