/**
 * @file
 * Cutting the lines of configuration files.
 */
#pragma once

#include <optional>
#include <string_view>
#include <vector>

namespace Orv::Agent::Linux {

/** The lines of a text without their ends; a last line needs none. */
std::vector<std::string_view> linesOf(std::string_view text);

/** The words of a line, which blanks and tabs separate. */
std::vector<std::string_view> wordsOf(std::string_view line);

/** The text without blanks, tabs and carriage returns at its ends. */
std::string_view trimmed(std::string_view text);

/** The number that a text of decimal digits is; none when it is not one above 0. */
std::optional<int> positiveNumber(std::string_view text);

} // namespace Orv::Agent::Linux
