/**
 * @file
 * Changing keys of one adapter in the text of a description, with all else left as it stands.
 */
#pragma once

#include <cstddef>
#include <optional>
#include <string>
#include <string_view>
#include <vector>

namespace Orv::Agent {

/** What a key shall be. */
struct KeyEdit {
    std::string key;
    std::optional<std::string> value; ///< as TOML; none: the key shall be absent
};

/** A text as a TOML string: in quotes, with what needs it escaped. */
std::string tomlText(std::string_view text);

/** Texts as a TOML array of strings. */
std::string tomlList(const std::vector<std::string>& texts);

/**
 * The text with these keys changed in the adapter of this number, counted from 0 in the order of the file. A value is
 * replaced where it stands, a new key follows the last one of its table, and a key that goes takes its line along
 * unless a comment stays on it. Only an inline table is written anew as a whole; it cannot have comments.
 *
 * Throws std::runtime_error, as parseToml does, when the text is no TOML, and when there is no such adapter.
 */
std::string editAdapter(std::string_view text, const std::string& file, std::size_t number,
                        const std::vector<KeyEdit>& edits);

} // namespace Orv::Agent
