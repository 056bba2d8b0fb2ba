/**
 * @file
 * CIM values and objects as people read them.
 */
#pragma once

#include "host/model/Instance.h"

#include <cstddef>
#include <string>
#include <string_view>
#include <vector>

namespace marlo::cli {

/** The text with every control character and every byte that is no UTF-8 replaced: it cannot steer a terminal. */
std::string makePrintable(std::string_view text);

/** Columns that a printable text takes in a terminal. */
std::size_t displayWidth(std::string_view text);

/** The length in bytes of the longest beginning of a text that takes at most so many columns; at least a character.
 */
std::size_t fittingLength(std::string_view text, std::size_t width);

/** A value in the notation of MOF: texts in quotes with escapes, arrays in braces, NULL. */
std::string showValue(const Value& value);

/** A value without quotes, an element of an array as if alone: for tables. */
std::string showPlainly(const Value& value);

/** A value as the lines of a table's cell, an array's elements below each other; "-" for nothing. */
std::vector<std::string> showInCell(const Value& value);

/** The object path, then a line for each property, names and values aligned. */
std::string showInstance(const Instance& instance);

} // namespace marlo::cli
