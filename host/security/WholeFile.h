/**
 * @file
 * Files that are written whole or not at all.
 */
#pragma once

#include <string>
#include <string_view>

#include <sys/types.h>

namespace marlo::security {

/**
 * Writes a file so that at every moment, a kill and a loss of power included, it is whole as before or whole as
 * wanted: a temporary file beside it that nobody else may read, onto the disk, and over its name by rename(2). Throws
 * std::system_error that names the file, and leaves nothing behind.
 */
void writeWhole(const std::string& path, std::string_view content, mode_t mode);

/** Makes a directory, and those above it, for the owner alone. One that is there stays as it is. */
void makeDirectory(const std::string& path);

/** Reads a regular file of limited size whole. Throws std::system_error that names the file. */
std::string readWhole(const std::string& path);

} // namespace marlo::security
