#include "agent/linux/KernelState.h"

#include <algorithm>
#include <iterator>

#include <linux/if_addr.h>
#include <linux/neighbour.h>
#include <linux/rtnetlink.h>
#include <net/if.h>
#include <sys/socket.h>

namespace Orv::Agent::Linux {

namespace {

constexpr std::size_t familySlot(std::uint8_t family) {
    return family == AF_INET ? 0 : 1;
}

bool leadsOut(const Route& route) {
    return route.table == RT_TABLE_MAIN && route.type == RTN_UNICAST;
}

bool isSecondary(const Address& address) {
    return address.local.family == AF_INET && (address.flags & IFA_F_SECONDARY) != 0;
}

/** Whether two messages speak of one and the same address of the interface. */
bool isSame(const Address& one, const Address& other) {
    return one.local == other.local && one.peer == other.peer && one.prefixLength == other.prefixLength;
}

/** Where the kernel puts a new address: IPv4 ones go behind the others, IPv6 ones in front. */
void insert(KernelState::Addresses& addresses, const Address& address) {
    addresses.insert(address.local.family == AF_INET6 ? addresses.begin() : addresses.end(), address);
}

/** Those of an interface in both families, or an empty list that outlives the caller. */
template <typename Lists>
const typename Lists::mapped_type& listOf(const Lists& lists, int index) {
    static const typename Lists::mapped_type none;
    const auto found = lists.find(index);
    return found == lists.end() ? none : found->second;
}

} // namespace

void KernelState::apply(const Message& message) {
    struct Visitor {
        KernelState& state;

        void operator()(const std::monostate&) const {}

        void operator()(const Change<Link>& change) const { state.applyLink(change); }

        void operator()(const Change<Address>& change) const { state.applyAddress(change); }

        void operator()(const Change<Route>& change) const { state.applyRoute(change); }

        void operator()(const Change<Neighbour>& change) const { state.applyNeighbour(change); }

        void operator()(const TeamOptions& options) const { state.applyTeam(options); }
    };

    std::visit(Visitor{*this}, message);
}

void KernelState::load(const Message& message) {
    if (const auto* link = std::get_if<Change<Link>>(&message)) {
        applyLink(*link);
    } else if (const auto* address = std::get_if<Change<Address>>(&message)) {
        _addresses[address->object.index].push_back(address->object);
        _changed.insert(address->object.index);
    }
}

void KernelState::applyLink(const Change<Link>& change) {
    if (change.gone) {
        removeLink(change.object.index);
        return;
    }
    Link& link = _links[change.object.index];
    if (link == change.object) {
        return;
    }
    if (((link.flags ^ change.object.flags) & IFF_UP) != 0) {
        markRoutesStale();
    }
    link = change.object;
    if (link.kind == "team") {
        _teams[link.index];
    }
    _changed.insert(link.index);
}

void KernelState::removeLink(int index) {
    _links.erase(index);
    _addresses.erase(index);
    _teams.erase(index);
    markRoutesStale();
    _changed.insert(index);
}

void KernelState::applyAddress(const Change<Address>& change) {
    const Address& address = change.object;
    Addresses& addresses = _addresses[address.index];
    const auto known = std::find_if(addresses.begin(), addresses.end(),
                                    [&](const Address& other) { return isSame(address, other); });
    if (change.gone) {
        if (known == addresses.end()) {
            return;
        }
        addresses.erase(known);
        if (mayHaveTakenRoutes(address)) {
            _staleRoutes.at(familySlot(address.local.family)) = true;
        }
    } else if (known == addresses.end()) {
        insert(addresses, address);
    } else if (*known == address) {
        return;
    } else if (isSecondary(*known) != isSecondary(address)) {
        // A secondary address that is promoted moves behind the primary ones.
        addresses.erase(known);
        insert(addresses, address);
    } else {
        *known = address;
    }
    _changed.insert(address.index);
}

/**
 * Whether default routes may have gone with an address, by what the kernel does without a word: it clears an
 * interface of IPv4 with the last address (fib_disable_ip) and drops the routes of a source that is gone
 * (fib_sync_down_addr). For IPv6 that is not relied on.
 */
bool KernelState::mayHaveTakenRoutes(const Address& gone) const {
    const Addresses& left = addressesOf(gone.index);
    const bool others = std::any_of(
        left.begin(), left.end(), [&](const Address& address) { return address.local.family == gone.local.family; });
    return !others || gone.local.family != AF_INET || _routeSources.count(gone.local) != 0;
}

void KernelState::applyRoute(const Change<Route>& change) {
    const Route& route = change.object;
    if (route.table == RT_TABLE_MAIN) {
        _staleRoutes.at(familySlot(route.family)) = true;
    }
}

bool KernelState::routesStale(std::uint8_t family) const {
    return _staleRoutes.at(familySlot(family));
}

void KernelState::setRoutes(std::uint8_t family, const std::vector<Route>& routes) {
    std::map<int, DefaultRoutes> fresh;
    for (const auto& [index, known] : _routes) {
        std::copy_if(known.begin(), known.end(), std::back_inserter(fresh[index]),
                     [&](const DefaultRoute& route) { return route.family != family; });
    }
    if (family == AF_INET) {
        _routeSources.clear();
    }
    for (const Route& route : routes) {
        if (!leadsOut(route) || route.family != family) {
            continue;
        }
        if (family == AF_INET && route.source.any()) {
            _routeSources.insert(route.source);
        }
        for (const NextHop& hop : route.hops) {
            fresh[hop.index].push_back({family, route.preference, hop.flags, route.metric, hop.gateway});
        }
    }
    for (const auto& [index, list] : fresh) {
        if (list != routesOf(index)) {
            _changed.insert(index);
        }
    }
    std::erase_if(fresh, [](const auto& entry) { return entry.second.empty(); });
    _routes = std::move(fresh);
    _staleRoutes.at(familySlot(family)) = false;
    findContested();
}

void KernelState::findContested() {
    std::set<GatewayKey> contested;
    for (const auto& [index, routes] : _routes) {
        for (const DefaultRoute& route : routes) {
            const bool rivalled = std::any_of(routes.begin(), routes.end(), [&](const DefaultRoute& other) {
                return other.family == route.family && other.metric == route.metric && other.gateway.any() &&
                       other.gateway != route.gateway;
            });
            if (rivalled && route.gateway.any()) {
                contested.emplace(index, route.gateway);
            }
        }
    }
    std::erase_if(_unreachable, [&](const GatewayKey& gateway) { return contested.count(gateway) == 0; });
    _contested = std::move(contested);
}

void KernelState::applyNeighbour(const Change<Neighbour>& change) {
    const GatewayKey gateway(change.object.index, change.object.address);
    if (_contested.count(gateway) == 0) {
        return;
    }
    const bool failed = !change.gone && (change.object.state & NUD_FAILED) != 0;
    const bool changed = failed ? _unreachable.insert(gateway).second : _unreachable.erase(gateway) != 0;
    if (changed) {
        _changed.insert(gateway.first);
    }
}

/** The last words of a team may come after its link is gone, and are none about the next of that index. */
void KernelState::applyTeam(const TeamOptions& options) {
    const auto known = _teams.find(options.index);
    if (known == _teams.end()) {
        return;
    }
    Team team = known->second;
    team.activePort = options.activePort.value_or(team.activePort);
    for (const auto& [port, priority] : options.priorities) {
        if (priority) {
            team.priorities[port] = *priority;
        } else {
            team.priorities.erase(port);
        }
    }
    if (known->second != team) {
        known->second = std::move(team);
        _changed.insert(options.index);
    }
}

std::vector<int> KernelState::teams() const {
    std::vector<int> indexes;
    for (const auto& team : _teams) {
        indexes.push_back(team.first);
    }
    return indexes;
}

Carrier KernelState::carrierOf(const Link& link) const {
    const auto team = _teams.find(link.index);
    if (team == _teams.end()) {
        const bool isNamed = link.activeMember != 0 && link.activeMember == link.primaryMember;
        return {link.activeMember, isNamed ? Carrier::Rank::named : Carrier::Rank::backup};
    }
    const auto& priorities = team->second.priorities;
    const auto active = priorities.find(team->second.activePort);
    if (active == priorities.end()) {
        return {}; // a port that is leaving
    }
    const bool isFirst = std::all_of(priorities.begin(), priorities.end(),
                                     [&](const auto& port) { return port.second <= active->second; });
    return {active->first, isFirst ? Carrier::Rank::first : Carrier::Rank::backup};
}

const KernelState::Addresses& KernelState::addressesOf(int index) const {
    return listOf(_addresses, index);
}

const KernelState::DefaultRoutes& KernelState::routesOf(int index) const {
    return listOf(_routes, index);
}

} // namespace Orv::Agent::Linux
