#include "agent/linux/KernelReader.h"

#include <algorithm>
#include <array>
#include <iterator>
#include <system_error>
#include <utility>

#include <libmnl/libmnl.h>
#include <linux/neighbour.h>
#include <linux/rtnetlink.h>
#include <sys/socket.h>

namespace Orv::Agent::Linux {

namespace {

/** So often a dump that changes disturbed is repeated before what it brought is taken, and read again later. */
constexpr int dumpAttempts = 3;

/** A request under construction, in a buffer with room for a few attributes. */
class Request {
  public:
    template <typename Header>
    Header& begin(std::uint16_t type) {
        nlmsghdr* message = mnl_nlmsg_put_header(_buffer.data());
        message->nlmsg_type = type;
        return *static_cast<Header*>(mnl_nlmsg_put_extra_header(message, sizeof(Header)));
    }

    nlmsghdr& message() { return *reinterpret_cast<nlmsghdr*>(_buffer.data()); }

  private:
    alignas(nlmsghdr) std::array<char, 256> _buffer{};
};

Request linkRequest() {
    Request request;
    request.begin<ifinfomsg>(RTM_GETLINK).ifi_family = AF_UNSPEC;
    // Counters are the dear part of a link message, and nobody reads them here.
    mnl_attr_put_u32(&request.message(), IFLA_EXT_MASK, RTEXT_FILTER_SKIP_STATS);
    return request;
}

Request addressRequest() {
    Request request;
    request.begin<ifaddrmsg>(RTM_GETADDR).ifa_family = AF_UNSPEC;
    return request;
}

Request routeRequest(std::uint8_t family) {
    Request request;
    auto& header = request.begin<rtmsg>(RTM_GETROUTE);
    header.rtm_family = family;
    header.rtm_table = RT_TABLE_MAIN;
    return request;
}

Request neighbourRequest(const GatewayKey& gateway) {
    Request request;
    auto& header = request.begin<ndmsg>(RTM_GETNEIGH);
    header.ndm_family = gateway.second.family;
    header.ndm_ifindex = gateway.first;
    mnl_attr_put(&request.message(), NDA_DST, addressLength(gateway.second.family), gateway.second.bytes.data());
    return request;
}

} // namespace

KernelReader::KernelReader(int receiveBytes) : _notifications(receiveBytes), _teams(receiveBytes) {
    _notifications.ignoreOtherRoutes();
    for (const int group :
         {RTNLGRP_LINK, RTNLGRP_IPV4_IFADDR, RTNLGRP_IPV6_IFADDR, RTNLGRP_IPV4_ROUTE, RTNLGRP_IPV6_ROUTE}) {
        _notifications.subscribe(group);
    }
    _sources.add(_notifications.descriptor());
    if (_teams.descriptor() >= 0) {
        _sources.add(_teams.descriptor());
    }
    update();
}

const KernelState& KernelReader::follow() {
    if (!drain()) {
        readAll();
    }
    watchTeams();
    return _state;
}

const KernelState& KernelReader::update() {
    follow();
    for (const std::uint8_t family : addressFamilies) {
        if (_state.routesStale(family)) {
            readRoutes(family);
        }
    }
    watchNeighbours();
    return _state;
}

void KernelReader::step() {
    if (_step && _state.hasChanges()) {
        _step(_state);
    }
}

/** Applies what waits. False when the tables are not to be relied on. */
bool KernelReader::drain(const std::function<void(const Message&)>& alsoTo) {
    const bool complete = std::exchange(_complete, false);
    const auto apply = [&](const Message& message) {
        if (alsoTo) {
            alsoTo(message);
        }
        _state.apply(message);
        step();
    };
    // Received before the links' messages and applied behind them: those that were sent first have come by then.
    std::vector<Message> ofTeams;
    const auto teams = _teams.drain([&](const Message& message) { ofTeams.push_back(message); });
    const auto links = _notifications.drain([&](const nlmsghdr& message) { apply(parseMessage(message)); });
    std::for_each(ofTeams.begin(), ofTeams.end(), apply);
    _complete =
        complete && teams == NotificationSocket::Drain::complete && links == NotificationSocket::Drain::complete;
    return _complete;
}

void KernelReader::readAll() {
    bool undisturbed = false;
    for (int attempt = 0; attempt < dumpAttempts && !undisturbed; ++attempt) {
        KernelState fresh;
        undisturbed = readTables(fresh);
        // What was announced while the dumps ran may be newer or older than what they show; applied in order, the
        // announcements lead to the present either way. Applied to the old tables as well, they make the steps that
        // they are, and not those from a present back into a past; the old tables then lack nothing but what was
        // lost, which the exchange of the two brings in one step.
        _complete = true;
        undisturbed = drain([&](const Message& message) { fresh.apply(message); }) && undisturbed;
        fresh.markChanged(_state.takeChanges());
        for (const auto& known : _state.links()) {
            fresh.markChanged({known.first});
        }
        _state = std::move(fresh);
        _knownGateways.clear();
        step();
    }
    _complete = undisturbed;
    ++_fullReads;
}

/** True when the dumps show one state of the kernel. */
bool KernelReader::readTables(KernelState& state) {
    const auto load = [&](const nlmsghdr& message) { state.load(parseMessage(message)); };
    Request links = linkRequest();
    Request addresses = addressRequest();
    const auto linkDump = _requests.dump(links.message(), "reading the links", load);
    const auto addressDump = _requests.dump(addresses.message(), "reading the addresses", load);
    readTeams(state);
    return linkDump == RequestSocket::Dump::consistent && addressDump == RequestSocket::Dump::consistent;
}

/** A team that vanishes meanwhile says nothing, which is how its link's end finds it. */
void KernelReader::readTeams(KernelState& state) {
    for (const int team : state.teams()) {
        _teams.read(team, [&](const Message& message) { state.apply(message); });
    }
    _teamsRead = state.hasTeams();
}

/** The first team there is brings its driver with it; of those that come later the driver then tells everything. */
void KernelReader::watchTeams() {
    if (!_state.hasTeams()) {
        _teamsRead = false;
    } else if (!_teamsRead) {
        readTeams(_state);
        step();
    }
}

void KernelReader::readRoutes(std::uint8_t family) {
    std::vector<Route> routes;
    const auto collect = [&](const nlmsghdr& message) {
        const Message parsed = parseMessage(message);
        if (const auto* route = std::get_if<Change<Route>>(&parsed)) {
            routes.push_back(route->object);
        }
    };
    auto dump = RequestSocket::Dump::interrupted;
    for (int attempt = 0; attempt < dumpAttempts && dump == RequestSocket::Dump::interrupted; ++attempt) {
        routes.clear();
        Request request = routeRequest(family);
        try {
            dump = _requests.dump(request.message(), "reading the routes", collect);
        } catch (const std::system_error& error) {
            // A namespace has no main table before its first route, and a kernel without IPv6 has no such routes.
            const int code = error.code().value();
            if (code != ENOENT && code != EOPNOTSUPP && code != EAFNOSUPPORT) {
                throw;
            }
            dump = RequestSocket::Dump::consistent;
        }
    }
    _state.setRoutes(family, routes);
    if (dump == RequestSocket::Dump::interrupted) {
        _complete = false;
    }
}

void KernelReader::watchNeighbours() {
    const std::set<GatewayKey>& contested = _state.contestedGateways();
    if (contested == _knownGateways) {
        return;
    }
    if (!_neighboursSubscribed) {
        _notifications.subscribe(RTNLGRP_NEIGH);
        _neighboursSubscribed = true;
    }
    for (const GatewayKey& gateway : contested) {
        if (_knownGateways.count(gateway) == 0) {
            readNeighbour(gateway);
        }
    }
    _knownGateways = contested;
}

void KernelReader::readNeighbour(const GatewayKey& gateway) {
    Request request = neighbourRequest(gateway);
    try {
        _requests.get(request.message(), "reading a neighbour",
                      [this](const nlmsghdr& message) { _state.apply(parseMessage(message)); });
    } catch (const std::system_error& error) {
        // No entry, an interface that has just gone, or a kernel before 5.0, which answers no such question:
        // nothing is known against the gateway.
        const int code = error.code().value();
        if (code != ENOENT && code != ENODEV && code != EOPNOTSUPP && code != EINVAL) {
            throw;
        }
    }
}

} // namespace Orv::Agent::Linux
