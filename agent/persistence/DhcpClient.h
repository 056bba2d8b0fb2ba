/**
 * @file
 * The DHCPv4 client of an interface that ifupdown runs, or anybody by hand.
 */
#pragma once

#include "agent/persistence/Environment.h"

#include <string>
#include <vector>

#include <sys/types.h>

namespace Orv::Agent::Persistence {

/**
 * The arguments of a process, when it is a DHCPv4 client of the interface: dhclient, udhcpc or dhcpcd. Pure.
 * `others` says whether it serves further interfaces.
 */
struct ClientArguments {
    bool isClient = false;
    bool others = false;

    static ClientArguments of(const std::vector<std::string>& arguments, const std::string& interface);
};

/** For any interface; holds nothing but where things are. */
class DhcpClient {
  public:
    explicit DhcpClient(const Environment& environment) : _environment(environment) {}

    /**
     * Ends the clients of the interface in this network namespace by SIGTERM, without a release of the lease: the
     * address may stay in use as a static one. Waits some seconds, then kills. True when there was one. Throws
     * std::runtime_error when one of them serves other interfaces, too; nothing is ended then.
     */
    bool stop(const std::string& interface);

    [[nodiscard]] bool isRunning(const std::string& interface) const;

    /** Whether ifup has configured the interface. */
    [[nodiscard]] bool isUp(const std::string& interface) const;

    /** Runs the first client that is installed as ifup runs it. Throws std::runtime_error when it fails or none is.
     */
    void start(const std::string& interface);

    /** Runs ifup; what counts is that a client runs afterwards, since further stanzas may fail for what is there. */
    void ifup(const std::string& interface);

  private:
    [[nodiscard]] std::vector<pid_t> find(const std::string& interface) const;

    const Environment& _environment;
};

} // namespace Orv::Agent::Persistence
