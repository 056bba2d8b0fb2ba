/**
 * @file
 * Texts as they stand in XML 1.0. What XML cannot carry, control characters and bytes that are no UTF-8 among it,
 * becomes U+FFFD.
 */
#pragma once

#include <string>
#include <string_view>

namespace marlo::cimxml {

/** Appends a text so that a parser reads it back exactly, carriage returns too. */
void appendText(std::string& out, std::string_view text);

/** The same for the value of an attribute in double quotes, of which a parser would make spaces of all white space.
 */
void appendAttributeText(std::string& out, std::string_view text);

/** Appends ` NAME="value"`. */
void appendAttribute(std::string& out, std::string_view name, std::string_view value);

} // namespace marlo::cimxml
