#include "agent/change/Resolve.h"

#include "agent/change/Rules.h"

#include <utility>

namespace Orv::Agent {

namespace {

using namespace NodeLexicon;

/** One write, while it is looked at. */
class Write {
  public:
    Write(const std::string& interface, Properties property, const PropertyValue& value,
          const AdapterSettings& inForce, PendingPair pending)
        : _interface(interface),
          _property(property),
          _value(value),
          _ipv4(inForce.ipv4.value_or(Ipv4Settings{})),
          _pending(pending) {}

    Resolution resolve();

  private:
    Resolution mode();
    Resolution addressOrMask();
    Resolution address(Ipv4Address address);
    Resolution mask(std::uint8_t prefixLength);
    Resolution gateway();
    Resolution wantPair(Ipv4Prefixed pair, PendingPair pending);
    [[nodiscard]] Resolution wantNames(NameSettings names) const;

    /** The value as the type that the property has. */
    template <typename Value>
    const Value& typed(const char* expected) const {
        const Value* value = std::get_if<Value>(&_value);
        if (value == nullptr) {
            refuse(std::string("the value must be ") + expected);
        }
        return *value;
    }

    [[noreturn]] void refuse(const std::string& reason) const {
        throw ChangeError(_interface, _property, _value, reason);
    }

    void refuseIf(const std::string& reason) const {
        if (!reason.empty()) {
            refuse(reason);
        }
    }

    void refuseWhileLeased() const {
        if (_ipv4.mode == AddressMode::leased) {
            refuse("the interface gets its address by DHCP; make it static first");
        }
    }

    const std::string& _interface;
    const Properties _property;
    const PropertyValue& _value;
    const Ipv4Settings _ipv4;
    PendingPair _pending;
};

Resolution Write::mode() {
    const unsigned int code = typed<unsigned int>("a number");
    if (code == static_cast<unsigned int>(AddressMode::leased)) {
        return {{Ipv4Settings{AddressMode::leased, {}, {}}, {}}, {}};
    }
    if (code != static_cast<unsigned int>(AddressMode::fixed)) {
        refuse("the mode is 1 for DHCP or 3 for static");
    }
    return {{Ipv4Settings{AddressMode::fixed, _ipv4.address, _ipv4.gateway}, {}}, {true, {}, {}}};
}

Resolution Write::wantPair(Ipv4Prefixed pair, PendingPair pending) {
    const auto gateway = _ipv4.gateway ? _ipv4.gateway : pending.gateway;
    const bool isReached = gateway && whyNotGateway(*gateway, pair).empty();
    // Given back with the next write or never.
    pending.gateway = isReached ? std::nullopt : _ipv4.gateway;
    return {{Ipv4Settings{AddressMode::fixed, pair, isReached ? gateway : std::nullopt}, {}}, pending};
}

Resolution Write::address(Ipv4Address address) {
    refuseIf(whyNotHostAddress(address));
    std::uint8_t prefixLength = _ipv4.address ? _ipv4.address->prefixLength : classPrefixLength(address);
    prefixLength = _pending.prefixLength.value_or(prefixLength);
    refuseIf(whyNotInterfaceAddress({address, prefixLength}));
    return wantPair({address, prefixLength}, {false, {}, _pending.gateway});
}

Resolution Write::mask(std::uint8_t prefixLength) {
    refuseIf(whyNotPrefixLength(prefixLength));
    const std::string unsuited =
        _ipv4.address ? whyNotInterfaceAddress({_ipv4.address->address, prefixLength}) : std::string();
    PendingPair pending = _pending;
    if (!_ipv4.address || (!unsuited.empty() && _pending.isExpected)) {
        pending.prefixLength = prefixLength;
        return {{}, pending};
    }
    refuseIf(unsuited);
    pending.prefixLength.reset();
    return wantPair({_ipv4.address->address, prefixLength}, pending);
}

Resolution Write::addressOrMask() {
    const auto& text = typed<std::string>("a text");
    const auto parsed = Ipv4Address::parse(text);
    if (!parsed) {
        refuse("it is no IPv4 address of four decimal numbers");
    }
    refuseWhileLeased();
    if (const auto prefixLength = prefixLengthOf(*parsed)) {
        return mask(*prefixLength);
    }
    return address(*parsed);
}

Resolution Write::gateway() {
    const auto parsed = Ipv4Address::parse(typed<std::string>("a text"));
    if (!parsed) {
        refuse("it is no IPv4 address of four decimal numbers");
    }
    refuseWhileLeased();
    refuseIf(whyNotGateway(*parsed, _ipv4.address));
    _pending.gateway.reset();
    return {{Ipv4Settings{AddressMode::fixed, _ipv4.address, parsed}, {}}, _pending};
}

Resolution Write::wantNames(NameSettings names) const {
    return {{std::nullopt, std::move(names)}, _pending};
}

Resolution Write::resolve() {
    switch (_property) {
    case PROP_DHCP_ENABLED:
        return mode();
    case PROP_IPV4_ADDRESS:
    case PROP_IPV4_SUBNET_MASK:
        return addressOrMask();
    case PROP_DEFAULT_GATEWAY:
        return gateway();
    case PROP_DNS_DOMAIN: {
        const auto& domain = typed<std::string>("a text");
        refuseIf(whyNotDomain(domain));
        return wantNames({domain, {}, {}});
    }
    case PROP_DNS_SERVERS: {
        const auto& servers = typed<std::vector<std::string>>("a list of texts");
        refuseIf(whyNotNameServers(servers));
        return wantNames({{}, servers, {}});
    }
    case PROP_DNS_SUFFIXES: {
        const auto& suffixes = typed<std::vector<std::string>>("a list of texts");
        refuseIf(whyNotSuffixes(suffixes));
        return wantNames({{}, {}, suffixes});
    }
    default:
        refuse("it can only be read");
    }
}

} // namespace

Resolution resolve(const std::string& interface, NodeLexicon::Properties property, const PropertyValue& value,
                   const AdapterSettings& inForce, const PendingPair& pending) {
    return Write(interface, property, value, inForce, pending).resolve();
}

} // namespace Orv::Agent
