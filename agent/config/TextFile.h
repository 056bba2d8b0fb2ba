/**
 * @file
 * Reading a small file whole, and telling whether it has changed since.
 */
#pragma once

#include <cstdint>
#include <string>

#include <sys/types.h>

namespace Orv::Agent {

/** What tells one state of a file from another. Times are in nanoseconds since the epoch. */
struct FileStamp {
    dev_t device = 0;
    ino_t inode = 0;
    off_t size = 0;
    std::int64_t modified = 0;
    std::int64_t changed = 0;

    bool operator==(const FileStamp&) const = default;
};

/** A file as it was at one moment. */
struct TextFile {
    std::string text;
    FileStamp stamp;

    /**
     * False when the file was written so shortly before it was read that the next write could leave the same stamp:
     * the kernel's file times advance in steps of some milliseconds only.
     */
    bool settled = false;
};

/** The stamp of the file at `path`. Throws std::system_error that names it. */
FileStamp stampOf(const std::string& path);

/**
 * Reads a regular file. A write while it is read starts the reading again, so the text is that of one state of the
 * file. Throws std::system_error that names the file; its code is ENOENT's when there is none.
 */
TextFile readTextFile(const std::string& path);

} // namespace Orv::Agent
