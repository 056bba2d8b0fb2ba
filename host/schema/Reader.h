/**
 * @file
 * MOF files with what they include.
 */
#pragma once

#include "host/schema/Declarations.h"

#include <string>
#include <string_view>
#include <vector>

namespace marlo::mof {

/**
 * All declarations of the *.mof files of directories, one directory after the other, in each in the order of their
 * names. Throws std::runtime_error.
 */
Declarations readDirectories(const std::vector<std::string>& directories);

/** The declarations of one text; what it includes is looked for beside the file that `name` names. */
Declarations readText(std::string_view text, const std::string& name);

} // namespace marlo::mof
