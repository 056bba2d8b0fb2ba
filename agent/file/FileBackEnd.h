/**
 * @file
 * The back end that is a description of a host.
 */
#pragma once

#include "agent/tree/BackEnd.h"

#include <memory>
#include <string>

namespace Orv::Agent {

/**
 * A back end over the description at `path` (see TreeFile.h). The file is first read for the first snapshot, and read
 * again when it has changed. A snapshot throws std::runtime_error, as readTreeFile does, while the file is missing or
 * wrong: an older state of it is never served in its place.
 *
 * A property is written by the rules of agent/change, into the file, which is replaced whole; comments and all other
 * keys stay. `control` is the path of the FIFO that plays events (see FileWatch.h); empty for none.
 */
std::unique_ptr<BackEnd> makeFileBackEnd(const std::string& path, std::string control = {});

} // namespace Orv::Agent
