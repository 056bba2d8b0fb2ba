#include "agent/change/AdapterSettings.h"

namespace Orv::Agent {

namespace {

using namespace NodeLexicon;

template <typename Value>
std::optional<Value> valueOf(const PropertyMap& properties, Properties property) {
    const auto found = properties.find(property);
    const Value* value = found == properties.end() ? nullptr : std::get_if<Value>(&found->second);
    return value == nullptr ? std::nullopt : std::optional(*value);
}

std::optional<Ipv4Address> addressOf(const PropertyMap& properties, Properties property) {
    const auto text = valueOf<std::string>(properties, property);
    return text ? Ipv4Address::parse(*text) : std::nullopt;
}

std::optional<Ipv4Prefixed> prefixedOf(const PropertyMap& properties) {
    const auto address = addressOf(properties, PROP_IPV4_ADDRESS);
    if (address && properties.find(PROP_IPV4_SUBNET_MASK) == properties.end()) {
        return Ipv4Prefixed{*address, classPrefixLength(*address)};
    }
    const auto mask = addressOf(properties, PROP_IPV4_SUBNET_MASK);
    const auto length = mask ? prefixLengthOf(*mask) : std::nullopt;
    return address && length ? std::optional(Ipv4Prefixed{*address, *length}) : std::nullopt;
}

} // namespace

NameSettings NameSettings::over(const NameSettings& base) const {
    return {domain ? domain : base.domain, servers ? servers : base.servers, suffixes ? suffixes : base.suffixes};
}

AdapterSettings settingsOf(const PropertyMap& properties) {
    const auto leased = static_cast<unsigned int>(AddressMode::leased);
    const bool isLeased = valueOf<unsigned int>(properties, PROP_DHCP_ENABLED) == leased;
    return {Ipv4Settings{isLeased ? AddressMode::leased : AddressMode::fixed, prefixedOf(properties),
                         addressOf(properties, PROP_DEFAULT_GATEWAY)},
            NameSettings{valueOf<std::string>(properties, PROP_DNS_DOMAIN),
                         valueOf<std::vector<std::string>>(properties, PROP_DNS_SERVERS),
                         valueOf<std::vector<std::string>>(properties, PROP_DNS_SUFFIXES)}};
}

} // namespace Orv::Agent
