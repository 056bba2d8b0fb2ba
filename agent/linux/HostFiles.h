/**
 * @file
 * Reading the host's configuration files, and noticing when they change.
 */
#pragma once

#include "agent/config/TextFile.h"

#include <map>
#include <optional>
#include <string>
#include <utility>
#include <vector>

namespace Orv::Agent::Linux {

/** The path of a file in a directory. */
std::string pathIn(std::string directory, const std::string& name);

/**
 * Reads files below a root and remembers what they looked like, so that one round of stat calls tells whether reading
 * them again would bring anything new. Paths are absolute, as the host has them. One thread at a time; nothing throws
 * but memory: what cannot be read counts as absent.
 */
class HostFiles {
  public:
    /** What people write is smaller than this: a larger file counts as absent, further entries are left out. */
    static constexpr std::size_t largestFile = 256UL * 1024;
    static constexpr std::size_t mostEntries = 4096;

    explicit HostFiles(std::string root) : _root(std::move(root)) {}

    /** The content of a regular file; nothing when it cannot be read. */
    std::optional<std::string> read(const std::string& path);

    /** As read(), without remembering the file; empty when it cannot be read. */
    [[nodiscard]] std::string peek(const std::string& path) const;

    /** The names in a directory, sorted, without "." and ".."; empty when it cannot be read. */
    std::vector<std::string> list(const std::string& path);

    /** The paths that a shell pattern matches, sorted. */
    std::vector<std::string> expand(const std::string& pattern);

    /** Whether the path is an empty file or a device, which is how a file of lower priority is masked. */
    bool isMask(const std::string& path);

    /** Whether anything that was asked for since forget() may be different now. */
    [[nodiscard]] bool changed() const;

    /** Begins a new reading. */
    void forget() { _seen.clear(); }

  private:
    /** What a path was like when it was first asked for. */
    struct Sight {
        std::optional<FileStamp> stamp; ///< none when there was nothing
        bool settled = true;            ///< last changed long enough ago that the next change must show in the stamp
    };

    std::optional<FileStamp> look(const std::string& path);

    std::string _root;
    std::map<std::string, Sight> _seen; ///< by path, the root included
};

} // namespace Orv::Agent::Linux
