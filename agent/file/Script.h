/**
 * @file
 * The commands that play events on a described host.
 */
#pragma once

#include "agent/events/Event.h"

#include <string_view>
#include <vector>

namespace Orv::Agent {

/** More events than this in one command are refused: they wait in memory to be handed over. */
constexpr unsigned int longestBurst = 1'000'000;

/**
 * The events that one command line asks for; empty for an empty line and one that begins with '#':
 *
 *     status NAME CODE    one with this status
 *     flap NAME           two: 12, then 1
 *     burst NAME COUNT    COUNT of them: 12, 1, 12, 1, ...
 *     failover NAME       one with status 32
 *     failback NAME       one with status 33
 *
 * NAME is the identity of an adapter of `tree`, which stays as it is. Throws std::runtime_error that says what is
 * wrong with the line.
 */
std::vector<Event> play(std::string_view line, const Tree& tree);

} // namespace Orv::Agent
