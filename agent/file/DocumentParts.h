/**
 * @file
 * A large TOML document in parts that can be parsed one after the other.
 */
#pragma once

#include <cstddef>
#include <string_view>
#include <vector>

namespace Orv::Agent {

struct DocumentPart {
    std::string_view text;
    std::size_t firstLine; ///< counted from 1 in the whole document
};

/**
 * Cuts a document before every some-hundredth line that starts with the header of a top-level array of tables, such
 * as
 * `[[adapter]]`. The first part ends before the first such line, so that the others hold nothing but such tables and
 * what follows them.
 *
 * A line like that within a string or a list of several lines is taken for a header, too; the part before it is no
 * TOML then, for its string or list is open at the end. So parts that are TOML each were cut in the right places.
 */
std::vector<DocumentPart> cutDocument(std::string_view text);

} // namespace Orv::Agent
