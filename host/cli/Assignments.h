/**
 * @file
 * "Name=value" as it stands on a command line.
 */
#pragma once

#include "host/model/Instance.h"

#include <functional>
#include <string>
#include <string_view>
#include <vector>

namespace marlo::cli {

/** The type of what has that name; CMPI_null for a name that is unknown. */
using TypeOfName = std::function<CMPIType(std::string_view name)>;

/**
 * Reads words of the form Name=value. Arrays are given as a list with commas, by repeating the name, or both;
 * `Name=` is an empty text or an array of no elements. A text that is not of the type, and the value of an unknown
 * name, become texts: what is wrong with them is for the object manager to say. Throws UsageError for a word without
 * a name or without "=", and for one value that is given twice.
 */
std::vector<NamedValue> readAssignments(const std::vector<std::string>& words, const TypeOfName& typeOf);

} // namespace marlo::cli
