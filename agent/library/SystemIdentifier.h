/**
 * @file
 * What tells this system from every other.
 */
#pragma once

#include <string>

namespace Orv::Agent {

/**
 * The UUID of the firmware (SMBIOS, type 1) where it may be read and means something, else the machine id of the
 * operating system (machine-id(5)); empty when there is neither. Files are read below `root`, empty for the host
 * itself.
 */
std::string readSystemIdentifier(const std::string& root);

} // namespace Orv::Agent
