/**
 * @file
 * What the values of fields are made of (RFC 9110), and percent-encoding (RFC 3986).
 */
#pragma once

#include <optional>
#include <string>
#include <string_view>
#include <vector>

namespace marlo::wbem {

std::string_view trimmed(std::string_view text);

/** The parts between a separator, trimmed; one within double quotes separates nothing. */
std::vector<std::string_view> split(std::string_view text, char separator);

/** The value of `name=value` or `name="value"`; nothing where the part is of another name. */
std::optional<std::string_view> parameter(std::string_view part, std::string_view name);

/** A text with its %XX escapes resolved; nothing where one is broken. */
std::optional<std::string> percentDecoded(std::string_view text);

/** A text for a field: what is not printable ASCII, and the percent sign, as %XX. */
std::string percentEncoded(std::string_view text);

} // namespace marlo::wbem
