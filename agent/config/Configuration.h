/**
 * @file
 * The agent's own configuration: which back end, and where the log goes.
 */
#pragma once

#include <string>
#include <vector>

namespace Orv::Agent {

/** Where lines of a channel go and which of them are kept. */
struct ChannelConfiguration {
    int level;                      ///< lines of this level and above are kept
    std::vector<std::string> sinks; ///< "stderr", "syslog", or "file:PATH"; none: the channel is off

    bool operator==(const ChannelConfiguration&) const = default;
};

/** Which manager's configuration files a change of an adapter goes to. */
enum class ManagerChoice { automatic, ifupdown, networkd, none };

/** The whole configuration, with the values that hold when nothing is configured. */
struct Configuration {
    enum class BackEndKind { Linux, File };

    BackEndKind backEnd = BackEndKind::Linux;
    std::string treeFile; ///< the description that the file back end reads
    ChannelConfiguration log{6000, {"stderr"}};
    ChannelConfiguration trace{0, {}};
    std::string control; ///< the FIFO through which the file back end is told to play events; empty: none
    ManagerChoice persistence = ManagerChoice::automatic;

    bool operator==(const Configuration&) const = default;
};

/**
 * Reads the configuration that is in force for this process.
 *
 * The file is the one that ORV_AGENT_CONFIG names, else /etc/marlo/agent.toml; only the latter may be missing. On top
 * of it come, where set: ORV_AGENT_BACKEND ("linux" or "file"), ORV_AGENT_TREE (a path; implies "file"),
 * ORV_AGENT_CONTROL (a path), ORV_AGENT_PERSISTENCE ("auto", "ifupdown", "networkd" or "none"), ORV_AGENT_LOG_LEVEL,
 * ORV_AGENT_LOG_SINKS, ORV_AGENT_TRACE_LEVEL and ORV_AGENT_TRACE_SINKS (sinks separated by commas). The environment
 * is not consulted in a process with raised privileges (secure_getenv).
 *
 * Throws std::runtime_error that names the file, the line, the key (or the variable) and the reason.
 */
Configuration loadConfiguration();

/** Reads one configuration file; the environment is not consulted. Throws as loadConfiguration does. */
Configuration readConfigurationFile(const std::string& path);

} // namespace Orv::Agent
