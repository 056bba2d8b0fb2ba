/**
 * @file
 * A simulated host: a TOML description of instrumentation nodes and of the network hardware.
 *
 * The format is described in docs/tree-file.md.
 */
#pragma once

#include "agent/hardware/Inventory.h"
#include "agent/tree/Tree.h"

#include <memory>
#include <string>
#include <string_view>

namespace Orv::Agent {

/** What one description holds. */
struct TreeDescription {
    std::shared_ptr<const Tree> tree;
    HardwareInventory hardware;
};

/**
 * Reads a description whole.
 *
 * Throws std::runtime_error with file, line, key and reason when it cannot be read, is not TOML, or has a key or
 * value that does not belong; nothing is returned of a description that is wrong anywhere.
 */
TreeDescription readTreeFile(const std::string& path);

/** The same of a text that has been read already; `file` is how messages name it. */
TreeDescription parseTreeDescription(std::string_view text, const std::string& file);

/** The same, without the hardware. */
std::shared_ptr<const Tree> parseTree(std::string_view text, const std::string& file);

} // namespace Orv::Agent
