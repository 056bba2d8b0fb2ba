/**
 * @file
 * What the host's resolver is told: name servers, suffixes, domain, and the host's own name.
 */
#pragma once

#include "agent/linux/HostFiles.h"

#include <map>
#include <string>
#include <string_view>
#include <vector>

namespace Orv::Agent::Linux {

/** Settings of a resolver; what is empty is not set. Texts are clean. */
struct ResolverSettings {
    static constexpr std::size_t mostServers = 32;
    static constexpr std::size_t mostSuffixes = 64;
    static constexpr std::size_t longestName = 255; ///< octets of a domain name (RFC 1035)

    std::vector<std::string> servers;  ///< addresses in search order; an IPv6 one may end in %INTERFACE
    std::vector<std::string> suffixes; ///< appended in order to names that are not fully qualified
    std::string domain;

    bool operator==(const ResolverSettings&) const = default;
};

/**
 * Reads the format of resolv.conf(5). Of several `domain` and `search` lines the last gives the suffixes, as the
 * manual has it; a `domain` is its own only suffix. Lines that mean nothing, server addresses that are none and names
 * beyond the limits are left out.
 */
ResolverSettings parseResolvConf(std::string_view text);

/**
 * The host's settings from /etc/resolv.conf. Where that only names the local stub of systemd-resolved, the servers
 * behind the stub are taken from the file that systemd-resolved keeps for this purpose.
 */
ResolverSettings readResolvConf(HostFiles& files);

/**
 * Settings that hold for one interface only, by interface index: what systemd-networkd and systemd-resolved keep
 * below /run/systemd. Empty where neither runs.
 */
std::map<int, ResolverSettings> readLinkResolvers(HostFiles& files);

/**
 * The domain of the host: the part of its name (uname(2)) behind the first dot, else that of the first qualified name
 * that /etc/hosts gives the same host. No name server is asked: an answer might take minutes, or be another's.
 */
std::string readHostDomain(HostFiles& files, std::string_view nodeName);

} // namespace Orv::Agent::Linux
