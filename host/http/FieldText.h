/**
 * @file
 * The texts that fields of HTTP are made of: names without case, and lists of tokens (RFC 9110, 5.6).
 */
#pragma once

#include <string_view>
#include <vector>

namespace marlo::http {

/** Compares ASCII letters without case. */
bool equalsIgnoringCase(std::string_view left, std::string_view right);

/** Without spaces and tabs at both ends. */
std::string_view trimmed(std::string_view text);

/** What stands between commas, trimmed; empty elements are left out. */
std::vector<std::string_view> listElements(std::string_view value);

/** Letters, digits and the marks that a method or the name of a field may have. */
bool isTokenCharacter(char character);

} // namespace marlo::http
