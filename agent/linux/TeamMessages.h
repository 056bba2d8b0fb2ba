/**
 * @file
 * Messages of the generic netlink family "team" (linux/if_team.h): the options of teams. Payloads begin with struct
 * genlmsghdr.
 */
#pragma once

#include "agent/hardware/GenericFamily.h"
#include "agent/linux/Messages.h"

#include <cstdint>

namespace Orv::Agent::Linux {

/** The question for all options of the team with this index; several messages answer it. */
Hardware::NetlinkRequest teamOptionsRequest(std::uint16_t family, int team);

/**
 * Reads TEAM_CMD_OPTIONS_GET, which is the answer as well as the announcement of options that were set, came or went:
 * a TeamOptions, or nothing when it names no team, has none of the options that count here, or is another command.
 * Believes nothing in it, as parseMessage().
 */
Message parseTeamMessage(Hardware::Bytes payload);

} // namespace Orv::Agent::Linux
