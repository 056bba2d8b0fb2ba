/**
 * @file
 * The SIOCETHTOOL requests, for kernels and interfaces that ethtool netlink does not serve.
 */
#pragma once

#include "agent/hardware/LinkModes.h"

#include <cstdint>
#include <optional>
#include <span>
#include <string>
#include <vector>

struct ethtool_link_settings;

namespace Orv::Agent::Hardware {

/** Settings from a filled ETHTOOL_GLINKSETTINGS and its first bitmap. */
LinkSettings settingsFrom(const ethtool_link_settings& settings, std::span<const std::uint32_t> supported);

/** A socket for these requests. One request at a time per interface; any thread. */
class EthtoolIoctl {
  public:
    /** Throws std::system_error when there is no socket to be had. */
    EthtoolIoctl();
    ~EthtoolIoctl();
    EthtoolIoctl(const EthtoolIoctl&) = delete;
    EthtoolIoctl& operator=(const EthtoolIoctl&) = delete;

    /** Settings of an interface; none when its driver has none, or when it vanished. */
    [[nodiscard]] std::optional<LinkSettings> linkSettings(const std::string& interface) const;

    /** The permanent address; empty when there is none, or when the interface vanished. */
    [[nodiscard]] std::vector<std::uint8_t> permanentAddress(const std::string& interface) const;

  private:
    bool request(const std::string& interface, void* command) const;

    int _socket;
};

} // namespace Orv::Agent::Hardware
