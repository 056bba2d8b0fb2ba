/**
 * @file
 * MOF files with what they include.
 */
#pragma once

#include "host/schema/Declarations.h"

#include <string>
#include <string_view>

namespace marlo::mof {

/** All declarations of the *.mof files of a directory, in the order of their names. Throws std::runtime_error. */
Declarations readDirectory(const std::string& directory);

/** The declarations of one text; what it includes is looked for beside the file that `name` names. */
Declarations readText(std::string_view text, const std::string& name);

} // namespace marlo::mof
