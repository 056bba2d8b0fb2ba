/**
 * @file
 * A change of one file, planned and not yet made.
 */
#pragma once

#include <optional>
#include <string>
#include <vector>

#include <sys/types.h>

namespace Orv::Agent::Persistence {

struct FileEdit {
    std::string path;                  ///< as this process opens it: any root is part of it
    std::optional<std::string> before; ///< the whole content the plan was made for; none: there was no file
    std::optional<std::string> after;  ///< the whole content wanted; none: no file
    mode_t mode = 0644;                ///< of a file that comes into being; others keep theirs

    bool operator==(const FileEdit&) const = default;
};

using FileEdits = std::vector<FileEdit>;

/** The whole content of a file; none when there is no such file. Throws std::system_error when it cannot be read. */
std::optional<std::string> contentOf(const std::string& path);

} // namespace Orv::Agent::Persistence
