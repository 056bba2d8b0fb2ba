/**
 * @file
 * Everything that the host's files say about its network, read again when they change.
 */
#pragma once

#include "agent/linux/AddressMode.h"
#include "agent/linux/HostFiles.h"
#include "agent/linux/Resolver.h"

#include <map>
#include <optional>
#include <string>

namespace Orv::Agent::Linux {

/** One thread at a time. Nothing throws but memory. */
class HostConfiguration {
  public:
    /** Reads below `root`, which is empty for the host itself. */
    explicit HostConfiguration(const std::string& root) : _files(root) {}

    /**
     * Brings the contents to the present; true when they differ from before, as after the first call. Costs one stat
     * for each file that there is or might be, a few dozen, however many interfaces there are.
     */
    bool refresh();

    /** The host's name up to the first dot. */
    [[nodiscard]] const std::string& hostName() const { return _content.hostName; }

    /**
     * The resolver's settings for an interface: its own where it has some, else the host's. The domain, where the
     * resolver is not told one, is the host's, else the first suffix.
     */
    [[nodiscard]] ResolverSettings resolverOf(int index) const;

    /**
     * How the interface is configured to get its IPv4 address: by ifupdown's files where they name it, else by
     * systemd-networkd.
     */
    [[nodiscard]] std::optional<AddressMode> modeOf(const InterfaceFacts& interface) const;

  private:
    struct Content {
        std::string hostName;
        std::string hostDomain;
        ResolverSettings resolver;
        std::map<int, ResolverSettings> linkResolvers;
        std::map<std::string, AddressMode> ifupdown;
        Networkd networkd;

        bool operator==(const Content&) const = default;
    };

    HostFiles _files;
    std::string _nodeName;
    bool _isRead = false;
    Content _content;
};

} // namespace Orv::Agent::Linux
