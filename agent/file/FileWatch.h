/**
 * @file
 * The events of a described host.
 */
#pragma once

#include "agent/tree/BackEnd.h"

#include <memory>
#include <string>

namespace Orv::Agent {

/**
 * Reports the differences between one state of the tree file at `path`, which `backEnd` serves, and the next: when it
 * is closed after writing, or another is renamed onto it. Where `control` names a FIFO, commands play events (see
 * Script.h), too. Throws std::system_error, and std::runtime_error while the file is wrong.
 */
std::unique_ptr<EventWatch> makeFileWatch(BackEnd& backEnd, const std::string& path, const std::string& control,
                                          EventSink& sink);

} // namespace Orv::Agent
