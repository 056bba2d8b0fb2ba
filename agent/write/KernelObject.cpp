#include "agent/write/KernelObject.h"

#include <algorithm>
#include <array>
#include <cstring>

#include <arpa/inet.h>
#include <libmnl/libmnl.h>

namespace Orv::Agent::Linux {

namespace {

using Bytes = std::span<std::uint8_t>;
using Octets = std::array<std::uint8_t, sizeof(std::uint32_t)>;

constexpr std::uint8_t fullPrefix = 32;

/** One attribute of a row, its header included; empty at the end or where the rest is none. */
Bytes firstOf(Bytes attributes) {
    if (attributes.size() < sizeof(nlattr)) {
        return {};
    }
    const std::size_t length = reinterpret_cast<const nlattr*>(attributes.data())->nla_len;
    return length < sizeof(nlattr) || length > attributes.size() ? Bytes() : attributes.first(length);
}

std::size_t paddedSize(Bytes attribute) {
    return MNL_ALIGN(attribute.size());
}

/** The whole attribute with its header. */
Bytes wholeAttribute(Bytes attributes, std::uint16_t type) {
    for (Bytes one = firstOf(attributes); !one.empty(); one = firstOf(attributes)) {
        if (mnl_attr_get_type(reinterpret_cast<const nlattr*>(one.data())) == type) {
            return one;
        }
        attributes = attributes.subspan(std::min(paddedSize(one), attributes.size()));
    }
    return {};
}

std::uint32_t numberIn(std::span<const std::uint8_t> payload) {
    std::uint32_t number = 0;
    std::memcpy(&number, payload.data(), sizeof number);
    return number;
}

std::uint32_t addressIn(std::span<const std::uint8_t> payload) {
    return payload.size() == sizeof(std::uint32_t) ? ntohl(numberIn(payload)) : 0;
}

Octets octetsOf(std::uint32_t number) {
    Octets octets{};
    std::memcpy(octets.data(), &number, sizeof number);
    return octets;
}

Octets addressOctets(std::uint32_t address) {
    return octetsOf(htonl(address));
}

std::uint32_t maskOfLength(std::uint8_t prefixLength) {
    return prefixLength == 0 ? 0 : ~std::uint32_t{0} << (fullPrefix - std::min(prefixLength, fullPrefix));
}

/** Calls back for each hop of a route through several (RTA_MULTIPATH) with its header and attributes. */
template <typename Callback>
void forEachHop(Bytes hops, Callback callback) {
    while (hops.size() >= sizeof(rtnexthop)) {
        auto* header = reinterpret_cast<rtnexthop*>(hops.data());
        if (header->rtnh_len < sizeof(rtnexthop) || header->rtnh_len > hops.size()) {
            return;
        }
        callback(*header, hops.subspan(sizeof(rtnexthop), header->rtnh_len - sizeof(rtnexthop)));
        hops = hops.subspan(std::min<std::size_t>(RTNH_ALIGN(header->rtnh_len), hops.size()));
    }
}

} // namespace

std::span<std::uint8_t> findAttribute(std::span<std::uint8_t> attributes, std::uint16_t type) {
    const Bytes whole = wholeAttribute(attributes, type);
    return whole.empty() ? whole : whole.subspan(sizeof(nlattr));
}

KernelObject::KernelObject(const nlmsghdr& message, std::size_t headerBytes)
    : _bytes(static_cast<const std::uint8_t*>(mnl_nlmsg_get_payload(&message)),
             static_cast<const std::uint8_t*>(mnl_nlmsg_get_payload(&message)) +
                 std::max<std::size_t>(mnl_nlmsg_get_payload_len(&message), headerBytes)),
      _headerBytes(headerBytes) {}

Bytes KernelObject::attribute(std::uint16_t type) {
    return findAttribute(Bytes(_bytes).subspan(_headerBytes), type);
}

std::span<const std::uint8_t> KernelObject::attribute(std::uint16_t type) const {
    // Looking does not write; the one search serves both.
    return const_cast<KernelObject*>(this)->attribute(type);
}

std::optional<std::uint32_t> KernelObject::number(std::uint16_t type) const {
    const auto payload = attribute(type);
    return payload.size() == sizeof(std::uint32_t) ? std::optional(numberIn(payload)) : std::nullopt;
}

void KernelObject::set(std::uint16_t type, std::span<const std::uint8_t> payload) {
    if (const Bytes present = attribute(type); present.size() == payload.size()) {
        std::copy(payload.begin(), payload.end(), present.begin());
        return;
    }
    remove(type);
    _bytes.resize(MNL_ALIGN(_bytes.size()));
    const nlattr header{static_cast<std::uint16_t>(sizeof(nlattr) + payload.size()), type};
    const auto* begin = reinterpret_cast<const std::uint8_t*>(&header);
    _bytes.insert(_bytes.end(), begin, begin + sizeof header);
    _bytes.insert(_bytes.end(), payload.begin(), payload.end());
    _bytes.resize(MNL_ALIGN(_bytes.size()));
}

void KernelObject::set(std::uint16_t type, std::uint32_t number) {
    set(type, octetsOf(number));
}

void KernelObject::remove(std::uint16_t type) {
    const Bytes attributes = Bytes(_bytes).subspan(_headerBytes);
    const Bytes whole = wholeAttribute(attributes, type);
    if (whole.empty()) {
        return;
    }
    const auto begin = _bytes.begin() + (whole.data() - _bytes.data());
    const std::ptrdiff_t length =
        std::min<std::ptrdiff_t>(static_cast<std::ptrdiff_t>(paddedSize(whole)), _bytes.end() - begin);
    _bytes.erase(begin, begin + length);
}

AddressObject::AddressObject(const nlmsghdr& message) : KernelObject(message, sizeof(ifaddrmsg)) {
    if (const Bytes times = attribute(IFA_CACHEINFO); times.size() == sizeof(ifa_cacheinfo)) {
        auto* lifetimes = reinterpret_cast<ifa_cacheinfo*>(times.data());
        lifetimes->cstamp = 0;
        lifetimes->tstamp = 0;
    }
}

AddressObject::AddressObject(int index, std::uint32_t local, std::uint8_t prefixLength, std::uint32_t broadcast)
    : KernelObject(
          ifaddrmsg{AF_INET, prefixLength, IFA_F_PERMANENT, RT_SCOPE_UNIVERSE, static_cast<std::uint32_t>(index)}) {
    set(IFA_ADDRESS, addressOctets(local));
    set(IFA_LOCAL, addressOctets(local));
    if (broadcast != 0) {
        set(IFA_BROADCAST, addressOctets(broadcast));
    }
}

std::uint32_t AddressObject::local() const {
    return has(IFA_LOCAL) ? addressIn(attribute(IFA_LOCAL)) : addressIn(attribute(IFA_ADDRESS));
}

std::uint32_t AddressObject::peer() const {
    return has(IFA_ADDRESS) ? addressIn(attribute(IFA_ADDRESS)) : addressIn(attribute(IFA_LOCAL));
}

std::uint32_t AddressObject::flags() const {
    return number(IFA_FLAGS).value_or(header<ifaddrmsg>().ifa_flags);
}

bool AddressObject::isSame(const AddressObject& other) const {
    return local() == other.local() && peer() == other.peer() && prefixLength() == other.prefixLength();
}

bool AddressObject::sharesNetwork(const AddressObject& other) const {
    const std::uint32_t mask = maskOfLength(prefixLength());
    return prefixLength() == other.prefixLength() && (peer() & mask) == (other.peer() & mask);
}

void AddressObject::makePermanent() {
    constexpr std::uint32_t forever = 0xffffffff;
    constexpr ifa_cacheinfo lifetimes{forever, forever, 0, 0};
    const auto* begin = reinterpret_cast<const std::uint8_t*>(&lifetimes);
    set(IFA_CACHEINFO, std::span(begin, sizeof lifetimes));
    // What sets up addresses for a while says so here (IFAPROT_*), and might feel entitled to take it away again.
    remove(IFA_PROTO);
}

RouteObject::RouteObject(const nlmsghdr& message) : KernelObject(message, sizeof(rtmsg)) {
    clean();
}

RouteObject::RouteObject(int index, std::uint32_t gateway, std::uint32_t metric)
    : KernelObject(
          rtmsg{AF_INET, 0, 0, 0, RT_TABLE_MAIN, RTPROT_BOOT, RT_SCOPE_UNIVERSE, RTN_UNICAST, RTNH_F_ONLINK}) {
    set(RTA_TABLE, RT_TABLE_MAIN);
    set(RTA_GATEWAY, addressOctets(gateway));
    set(RTA_OIF, static_cast<std::uint32_t>(index));
    if (metric != 0) {
        set(RTA_PRIORITY, metric);
    }
}

void RouteObject::clean() {
    header<rtmsg>().rtm_flags &= RTNH_F_ONLINK;
    remove(RTA_CACHEINFO);
    if (has(RTA_NH_ID)) {
        // A route by a next-hop object names that alone; the rest is the kernel's elaboration.
        for (const std::uint16_t type : {RTA_OIF, RTA_GATEWAY, RTA_VIA, RTA_MULTIPATH}) {
            remove(type);
        }
    }
    forEachHop(attribute(RTA_MULTIPATH), [](rtnexthop& hop, Bytes) { hop.rtnh_flags &= RTNH_F_ONLINK; });
}

bool RouteObject::isDefault() const {
    const auto& message = header<rtmsg>();
    return message.rtm_dst_len == 0 && message.rtm_tos == 0 && message.rtm_type == RTN_UNICAST;
}

std::uint32_t RouteObject::table() const {
    return number(RTA_TABLE).value_or(header<rtmsg>().rtm_table);
}

bool RouteObject::usesInterface(int index) const {
    bool uses = number(RTA_OIF) == static_cast<std::uint32_t>(index);
    forEachHop(const_cast<RouteObject*>(this)->attribute(RTA_MULTIPATH),
               [&](const rtnexthop& hop, Bytes) { uses = uses || hop.rtnh_ifindex == index; });
    return uses;
}

bool RouteObject::usesOthers(int index) const {
    bool others = false;
    forEachHop(const_cast<RouteObject*>(this)->attribute(RTA_MULTIPATH),
               [&](const rtnexthop& hop, Bytes) { others = others || hop.rtnh_ifindex != index; });
    return others;
}

std::optional<std::uint32_t> RouteObject::gateway(int index) const {
    std::optional<std::uint32_t> found;
    if (has(RTA_GATEWAY)) {
        found = addressIn(attribute(RTA_GATEWAY));
    }
    forEachHop(const_cast<RouteObject*>(this)->attribute(RTA_MULTIPATH), [&](const rtnexthop& hop, Bytes inner) {
        if (const Bytes own = findAttribute(inner, RTA_GATEWAY); hop.rtnh_ifindex == index && !own.empty()) {
            found = found ? found : addressIn(own);
        }
    });
    return found;
}

bool RouteObject::setGateway(int index, std::uint32_t gateway) {
    const Octets fresh = addressOctets(gateway);
    if (has(RTA_GATEWAY)) {
        set(RTA_GATEWAY, fresh);
        return true;
    }
    bool done = false;
    forEachHop(attribute(RTA_MULTIPATH), [&](const rtnexthop& hop, Bytes inner) {
        const Bytes own = findAttribute(inner, RTA_GATEWAY);
        if (!done && hop.rtnh_ifindex == index && own.size() == fresh.size()) {
            std::copy(fresh.begin(), fresh.end(), own.begin());
            done = true;
        }
    });
    return done;
}

std::optional<std::uint32_t> RouteObject::source() const {
    return has(RTA_PREFSRC) ? std::optional(addressIn(attribute(RTA_PREFSRC))) : std::nullopt;
}

void RouteObject::setSource(std::uint32_t address) {
    set(RTA_PREFSRC, addressOctets(address));
}

} // namespace Orv::Agent::Linux
