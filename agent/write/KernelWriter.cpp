#include "agent/write/KernelWriter.h"

#include "agent/linux/Selection.h"
#include "agent/write/AddressPlan.h"

#include <algorithm>
#include <array>
#include <cerrno>
#include <system_error>
#include <utility>

#include <libmnl/libmnl.h>
#include <linux/netlink.h>

namespace Orv::Agent::Linux {

namespace {

/** So often a dump that other changes disturbed is repeated before what it brought is taken. */
constexpr int dumpAttempts = 3;

/** A dump request of one header and a few attributes. */
template <typename Header>
class DumpRequest {
  public:
    explicit DumpRequest(std::uint16_t type) {
        nlmsghdr* message = mnl_nlmsg_put_header(_buffer.data());
        message->nlmsg_type = type;
        _header = static_cast<Header*>(mnl_nlmsg_put_extra_header(message, sizeof(Header)));
    }

    Header& header() { return *_header; }

    nlmsghdr& message() { return *reinterpret_cast<nlmsghdr*>(_buffer.data()); }

  private:
    alignas(nlmsghdr) std::array<char, 128> _buffer{};
    Header* _header;
};

void dump(RequestSocket& requests, nlmsghdr& request, const char* what, const MessageHandler& handler,
          const std::function<void()>& begin) {
    auto outcome = RequestSocket::Dump::interrupted;
    for (int attempt = 0; attempt < dumpAttempts && outcome == RequestSocket::Dump::interrupted; ++attempt) {
        begin();
        try {
            outcome = requests.dump(request, what, handler);
        } catch (const std::system_error& error) {
            // A table comes into being with its first entry.
            if (error.code().value() != ENOENT) {
                throw;
            }
            return;
        }
    }
}

bool isOf(const Address& address, int index) {
    return address.index == index && address.local.family == AF_INET;
}

std::vector<AddressObject> readAddresses(RequestSocket& requests, int index) {
    DumpRequest<ifaddrmsg> request(RTM_GETADDR);
    request.header().ifa_family = AF_INET;
    request.header().ifa_index = static_cast<std::uint32_t>(index);
    std::vector<AddressObject> addresses;
    const auto take = [&](const nlmsghdr& message) {
        const Message parsed = parseMessage(message);
        if (const auto* address = std::get_if<Change<Address>>(&parsed); address && isOf(address->object, index)) {
            addresses.emplace_back(message);
        }
    };
    dump(requests, request.message(), "reading the addresses of an interface", take, [&] { addresses.clear(); });
    return addresses;
}

/** Those that `accept` takes, of one interface or, with index 0, of the whole main table. */
template <typename Accept>
std::vector<RouteObject> readRoutes(RequestSocket& requests, int index, Accept accept) {
    DumpRequest<rtmsg> request(RTM_GETROUTE);
    request.header().rtm_family = AF_INET;
    // Of the others the local table has two for each address of the host, made by the kernel.
    request.header().rtm_type = RTN_UNICAST;
    if (index != 0) {
        mnl_attr_put_u32(&request.message(), RTA_OIF, static_cast<std::uint32_t>(index));
    } else {
        request.header().rtm_table = RT_TABLE_MAIN;
    }
    std::vector<RouteObject> routes;
    const auto take = [&](const nlmsghdr& message) {
        const bool readable =
            message.nlmsg_type == RTM_NEWROUTE && mnl_nlmsg_get_payload_len(&message) >= sizeof(rtmsg);
        const auto* header = static_cast<const rtmsg*>(mnl_nlmsg_get_payload(&message));
        const bool counts = readable && header->rtm_type == RTN_UNICAST && header->rtm_protocol != RTPROT_KERNEL;
        if (counts && (header->rtm_flags & RTM_F_CLONED) == 0) {
            if (RouteObject route(message); accept(route)) {
                routes.push_back(std::move(route));
            }
        }
    };
    dump(requests, request.message(), "reading the routes of an interface", take, [&] { routes.clear(); });
    return routes;
}

Address asAddress(const AddressObject& object, int index) {
    Address address;
    address.index = index;
    address.prefixLength = object.prefixLength();
    address.scope = object.scope();
    address.flags = object.flags();
    address.local.family = AF_INET;
    return address;
}

std::string shown(const std::optional<std::uint32_t>& gateway) {
    return gateway ? Ipv4Address{*gateway}.text() : "none";
}

void add(ChangeBatch& batch, std::uint16_t flags, const RouteObject& route, int index) {
    batch.add(RTM_NEWROUTE, static_cast<std::uint16_t>(NLM_F_CREATE | flags), route,
              route.isDefault() ? "setting the gateway " + shown(route.gateway(index)) : "putting back a route");
}

void remove(ChangeBatch& batch, const RouteObject& route, int index) {
    batch.add(RTM_DELROUTE, 0, route, "removing the gateway " + shown(route.gateway(index)));
}

bool contains(const std::vector<RouteObject>& routes, const RouteObject& route) {
    return std::find(routes.begin(), routes.end(), route) != routes.end();
}

[[noreturn]] void fail(const Refusal& refusal) {
    throw std::system_error(refusal.error, std::generic_category(), refusal.text);
}

/** Whether the same addresses come in the same order, with the same terms. */
bool sameAddresses(const std::vector<AddressObject>& one, const std::vector<AddressObject>& other) {
    return std::equal(one.begin(), one.end(), other.begin(), other.end(),
                      [](const AddressObject& left, const AddressObject& right) {
                          return left.isSame(right) && left.isPermanent() == right.isPermanent();
                      });
}

/** What the default route of the interface becomes: the present one with another gateway, or a new one. */
RouteObject defaultBy(Ipv4Address gateway, const RouteObject* present, int index) {
    if (present != nullptr) {
        if (RouteObject route = *present; route.setGateway(index, gateway.number)) {
            return route;
        }
    }
    return {index, gateway.number, present != nullptr ? present->metric() : 0};
}

/** The address that routes no longer may have as their source, when there is one to take its place. */
std::optional<std::uint32_t> formerSource(const InterfaceTables& before, const Ipv4Settings& wanted) {
    const auto place = reportedAddress(before);
    if (!place || !wanted.address) {
        return std::nullopt;
    }
    const std::uint32_t old = before.addresses[*place].local();
    return old == wanted.address->address.number ? std::nullopt : std::optional(old);
}

} // namespace

std::optional<std::size_t> reportedAddress(const InterfaceTables& tables) {
    KernelState::Addresses addresses;
    for (const AddressObject& object : tables.addresses) {
        addresses.push_back(asAddress(object, tables.index));
    }
    const Address* reported = reportedIpv4(addresses);
    return reported == nullptr ? std::nullopt : std::optional<std::size_t>(reported - addresses.data());
}

std::optional<std::size_t> reportedDefault(const InterfaceTables& tables) {
    std::optional<std::size_t> best;
    for (std::size_t place = 0; place < tables.routes.size(); ++place) {
        const RouteObject& route = tables.routes[place];
        const bool counts = route.isDefault() && route.table() == RT_TABLE_MAIN;
        if (counts && (!best || route.metric() < tables.routes[*best].metric())) {
            best = place;
        }
    }
    return best;
}

InterfaceTables KernelWriter::read(int index) {
    const std::lock_guard lock(_mutex);
    return {index, readAddresses(_requests, index), readRoutes(_requests, index, [index](const RouteObject& route) {
                return route.usesInterface(index) || route.has(RTA_NH_ID);
            })};
}

void KernelWriter::apply(ChangeBatch batch, std::initializer_list<int> tolerated) {
    const std::lock_guard lock(_mutex);
    for (const Refusal& refusal : _changes.apply(std::move(batch))) {
        if (std::find(tolerated.begin(), tolerated.end(), refusal.error) == tolerated.end()) {
            fail(refusal);
        }
    }
}

/** Whether another interface has a default route that the kernel cannot tell from this one by its metric. */
bool KernelWriter::sharesDefault(const RouteObject& route, int index) {
    const std::lock_guard lock(_mutex);
    return !readRoutes(_requests, 0, [&](const RouteObject& other) {
                return other.isDefault() && other.table() == RT_TABLE_MAIN && other.metric() == route.metric() &&
                       !other.usesInterface(index);
            }).empty();
}

InterfaceTables KernelWriter::write(const InterfaceTables& before, const Ipv4Settings& wanted, Leases leases) {
    AddressPlan plan = planAddress(before, wanted.address, leases == Leases::leave);
    InterfaceTables expected{before.index, plan.result, before.routes};
    const auto old = formerSource(before, wanted);
    for (RouteObject& route : expected.routes) {
        if (old && route.source() == old) {
            route.setSource(wanted.address->address.number);
        }
    }
    const auto place = reportedDefault(expected);
    RouteObject* present = place ? &expected.routes[*place] : nullptr;
    const std::optional<std::uint32_t> gateway = present ? present->gateway(before.index) : std::nullopt;
    if (wanted.gateway && gateway != wanted.gateway->number) {
        const RouteObject fresh = defaultBy(*wanted.gateway, present, before.index);
        // In place, unless the kernel would take the other interface's route for the one that is meant.
        const bool inPlace = present != nullptr && !sharesDefault(fresh, before.index);
        add(plan.steps, inPlace ? NLM_F_REPLACE : NLM_F_APPEND, fresh, before.index);
        if (present != nullptr && !inPlace) {
            remove(plan.steps, before.routes[*place], before.index);
        }
        if (present != nullptr) {
            *present = fresh;
        }
    } else if (!wanted.gateway && gateway) {
        remove(plan.steps, before.routes[*place], before.index);
        expected.routes.erase(expected.routes.begin() + static_cast<std::ptrdiff_t>(*place));
    }
    // Whatever is to be removed may be gone by itself, as a default route with the old address.
    apply(std::move(plan.steps), {ESRCH, EADDRNOTAVAIL});
    // While there is an address, the kernel drops the routes alone whose source is one that leaves.
    const bool mayHaveLost =
        !plan.isGapless || std::any_of(before.routes.begin(), before.routes.end(),
                                       [](const RouteObject& route) { return !!route.source(); });
    if (mayHaveLost && !expected.addresses.empty()) {
        putBackRoutes(expected, read(before.index), old);
    }
    return expected;
}

/** With `formerSource`, routes from that address go: in tables other than the main one the kernel leaves them. */
void KernelWriter::putBackRoutes(const InterfaceTables& wanted, const InterfaceTables& present,
                                 std::optional<std::uint32_t> formerSource) {
    ChangeBatch stale;
    for (const RouteObject& route : present.routes) {
        if (formerSource && route.source() == formerSource) {
            stale.add(RTM_DELROUTE, 0, route, "removing a route from the former address");
        }
    }
    apply(std::move(stale), {ESRCH});
    ChangeBatch missing;
    std::vector<RouteObject> routes;
    for (const RouteObject& route : wanted.routes) {
        if (!contains(present.routes, route)) {
            routes.push_back(route);
            add(missing, NLM_F_APPEND, route, wanted.index);
        }
    }
    const std::lock_guard lock(_mutex);
    ChangeBatch onLink;
    for (const Refusal& refusal : _changes.apply(std::move(missing))) {
        if (refusal.error == ENETUNREACH) {
            // The kernel looks at a gateway when a route is made and never again: one whose network the interface has
            // left stays. It must not look now either.
            routes[refusal.place].assumeOnLink();
            add(onLink, NLM_F_APPEND, routes[refusal.place], wanted.index);
        } else if (refusal.error != EEXIST) {
            fail(refusal);
        }
    }
    for (const Refusal& refusal : _changes.apply(std::move(onLink))) {
        fail(refusal);
    }
}

void KernelWriter::welcomeLease(const InterfaceTables& wanted) {
    const InterfaceTables present = read(wanted.index);
    AddressPlan plan = planLeaseFirst(present);
    for (const AddressObject& address : wanted.addresses) {
        const bool there = std::any_of(present.addresses.begin(), present.addresses.end(),
                                       [&](const AddressObject& one) { return one.isSame(address); });
        if (!there) {
            plan.steps.add(RTM_NEWADDR, NLM_F_CREATE, address, "putting back an address");
        }
    }
    apply(std::move(plan.steps), {EEXIST, EADDRNOTAVAIL});
    const InterfaceTables now = read(wanted.index);
    // Of the two, the client's routes come first.
    putBackRoutes(present, now, std::nullopt);
    putBackRoutes(wanted, now, std::nullopt);
}

void KernelWriter::restore(const InterfaceTables& before) {
    const InterfaceTables present = read(before.index);
    ChangeBatch steps;
    for (const RouteObject& route : present.routes) {
        if (route.isDefault() && !contains(before.routes, route)) {
            remove(steps, route, before.index);
        }
    }
    if (!sameAddresses(present.addresses, before.addresses)) {
        std::for_each(present.addresses.rbegin(), present.addresses.rend(), [&steps](const AddressObject& address) {
            steps.add(RTM_DELADDR, 0, address, "removing an address again");
        });
        for (const AddressObject& address : before.addresses) {
            steps.add(RTM_NEWADDR, NLM_F_CREATE | NLM_F_REPLACE, address, "putting back an address");
        }
    }
    apply(std::move(steps), {ESRCH, EADDRNOTAVAIL});
    putBackRoutes(before, read(before.index), std::nullopt);
}

} // namespace Orv::Agent::Linux
