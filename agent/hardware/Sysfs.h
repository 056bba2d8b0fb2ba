/**
 * @file
 * Reading attributes of sysfs: one value per file, gone with its device at any time.
 */
#pragma once

#include <cstdint>
#include <filesystem>
#include <optional>
#include <string>

namespace Orv::Agent::Hardware {

/** The first line of a file as it stands there, without surrounding blanks; none when unreadable or blank. */
std::optional<std::string> readAttribute(const std::filesystem::path& file);

/** A number in decimal, or in hexadecimal after "0x"; none when unreadable, no number or out of 16 bits. */
std::optional<std::uint16_t> readNumber(const std::filesystem::path& file);

/** A number in hexadecimal without a mark, as the USB identifiers are; none when unreadable or no number. */
std::optional<std::uint16_t> readHexadecimal(const std::filesystem::path& file);

/** The last name of a symbolic link's target: the driver, the subsystem; none when there is no such link. */
std::optional<std::string> readLinkName(const std::filesystem::path& link);

} // namespace Orv::Agent::Hardware
