/**
 * @file
 * What the kernel has in a namespace, kept current message by message.
 */
#pragma once

#include "agent/linux/Messages.h"

#include <array>
#include <map>
#include <set>
#include <utility>
#include <vector>

namespace Orv::Agent::Linux {

/** A default route of an adapter. */
struct DefaultRoute {
    std::uint8_t family = 0;
    std::uint8_t preference = 0; ///< ICMPV6_ROUTER_PREF_*
    std::uint8_t hopFlags = 0;   ///< RTNH_F_*
    std::uint32_t metric = 0;
    IpAddress gateway; ///< of family 0 when there is none

    bool operator==(const DefaultRoute&) const = default;
};

/** The member that carries a bond or a team. */
struct Carrier {
    /** How the member stands to the others. */
    enum class Rank {
        backup,
        first, ///< none has a higher priority, as many as there may be of the same
        named, ///< the one that the bond is told to prefer
    };

    int member = 0; ///< 0 when none carries it, or all do
    Rank rank = Rank::backup;

    bool operator==(const Carrier&) const = default;
};

/** A gateway as the neighbour tables know it. */
using GatewayKey = std::pair<int, IpAddress>;

/**
 * The tables. One thread at a time.
 *
 * Links and addresses follow the kernel's notifications exactly, their order within an interface included. Default
 * routes do not: the kernel withdraws IPv4 routes without a word when an interface goes down or loses its last
 * address, and when the address leaves that they have as their source. So whatever may have touched them marks the
 * routes of that family as stale, and they are read again, which takes the longer the more routes there are of any
 * kind.
 */
class KernelState {
  public:
    using Addresses = std::vector<Address>;
    using DefaultRoutes = std::vector<DefaultRoute>;

    /** Applies a notification. */
    void apply(const Message& message);

    /** Takes one object of a dump of links or addresses; those of an interface come in the kernel's order. */
    void load(const Message& message);

    /** Replaces the default routes of a family by those among `routes`: the whole of its main table. */
    void setRoutes(std::uint8_t family, const std::vector<Route>& routes);

    /** Whether the default routes of AF_INET or AF_INET6 must be read again. True in the beginning. */
    [[nodiscard]] bool routesStale(std::uint8_t family) const;

    /**
     * Gateways between which only their reachability decides: default routes of one adapter and family, equal in
     * metric. Neighbours other than these are not kept.
     */
    [[nodiscard]] const std::set<GatewayKey>& contestedGateways() const { return _contested; }

    /** Whether the kernel has given up reaching a contested gateway. */
    [[nodiscard]] bool isUnreachable(const GatewayKey& gateway) const { return _unreachable.count(gateway) != 0; }

    [[nodiscard]] const std::map<int, Link>& links() const { return _links; }

    /** Whether there is a team, of which only the driver's own messages tell who carries it. */
    [[nodiscard]] bool hasTeams() const { return !_teams.empty(); }

    /** The teams, by index. */
    [[nodiscard]] std::vector<int> teams() const;

    /** What carries the interface, if it is a bond or a team. */
    [[nodiscard]] Carrier carrierOf(const Link& link) const;

    /** In the kernel's order; both families mixed. */
    [[nodiscard]] const Addresses& addressesOf(int index) const;

    /** In the kernel's order; both families mixed. */
    [[nodiscard]] const DefaultRoutes& routesOf(int index) const;

    /** Has these count as changed, too. */
    void markChanged(const std::set<int>& indexes) { _changed.insert(indexes.begin(), indexes.end()); }

    [[nodiscard]] bool hasChanges() const { return !_changed.empty(); }

    /** The interfaces of which anything here has changed since the last call, also those that are gone. */
    std::set<int> takeChanges() { return std::exchange(_changed, {}); }

  private:
    void applyLink(const Change<Link>& change);
    void applyAddress(const Change<Address>& change);
    void applyRoute(const Change<Route>& change);
    void applyNeighbour(const Change<Neighbour>& change);
    void applyTeam(const TeamOptions& options);
    void removeLink(int index);
    [[nodiscard]] bool mayHaveTakenRoutes(const Address& gone) const;
    void findContested();

    void markRoutesStale() { _staleRoutes = {true, true}; }

    /** What TeamOptions have told of a team. */
    struct Team {
        int activePort = 0;
        std::map<int, std::int32_t> priorities; ///< of its ports, by index

        bool operator==(const Team&) const = default;
    };

    std::map<int, Link> _links;
    std::map<int, Team> _teams; ///< an entry for every link of that kind
    std::map<int, Addresses> _addresses;
    std::map<int, DefaultRoutes> _routes;
    std::set<IpAddress> _routeSources; ///< the own addresses that IPv4 default routes prefer
    std::set<GatewayKey> _contested;
    std::set<GatewayKey> _unreachable;
    std::array<bool, 2> _staleRoutes{true, true}; ///< IPv4, IPv6
    std::set<int> _changed;
};

} // namespace Orv::Agent::Linux
