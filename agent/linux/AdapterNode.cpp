#include "agent/linux/AdapterNode.h"

#include "agent/linux/Selection.h"
#include "agent/text/Text.h"

#include <linux/if_addr.h>
#include <linux/if_arp.h>

namespace Orv::Agent::Linux {

namespace {

using namespace NodeLexicon;

constexpr unsigned int supportsIpv4 = 1;
constexpr unsigned int supportsIpv6 = 2;

void set(PropertyMap& properties, Properties property, std::string text) {
    if (!text.empty()) {
        properties.emplace(property, std::move(text));
    }
}

void set(PropertyMap& properties, Properties property, std::vector<std::string> list) {
    if (!list.empty()) {
        properties.emplace(property, std::move(list));
    }
}

void set(PropertyMap& properties, Properties property, unsigned int number) {
    properties.emplace(property, number);
}

std::optional<AddressMode> modeOf(const InterfaceFacts& facts, const Address* ipv4,
                                  const HostConfiguration& configuration) {
    if (ipv4 != nullptr && (ipv4->flags & IFA_F_PERMANENT) == 0) {
        return AddressMode::leased;
    }
    const std::optional<AddressMode> configured = configuration.modeOf(facts);
    return configured || ipv4 == nullptr ? configured : AddressMode::fixed;
}

void setAddresses(PropertyMap& properties, const Address* ipv4, const Address* ipv6) {
    if (ipv4 != nullptr) {
        set(properties, PROP_IPV4_ADDRESS, ipv4->local.text());
        set(properties, PROP_IPV4_SUBNET_MASK, maskText(ipv4->prefixLength));
    }
    if (ipv6 != nullptr) {
        set(properties, PROP_IPV6_ADDRESS, ipv6->local.text());
    }
    const unsigned int support = (ipv4 != nullptr ? supportsIpv4 : 0) | (ipv6 != nullptr ? supportsIpv6 : 0);
    if (support != 0) {
        set(properties, PROP_IP_SUPPORT, support);
    }
}

void setResolver(PropertyMap& properties, ResolverSettings settings, const std::string& hostName) {
    set(properties, PROP_DNS_SERVERS, std::move(settings.servers));
    set(properties, PROP_DNS_SUFFIXES, std::move(settings.suffixes));
    set(properties, PROP_DNS_DOMAIN, std::move(settings.domain));
    set(properties, PROP_DNS_HOSTNAME, hostName);
}

} // namespace

InterfaceFacts factsOf(const Link& link, const std::vector<std::uint8_t>& permanentAddress) {
    return {link.index,
            link.name,
            hardwareAddressText(link.address).value_or(""),
            hardwareAddressText(permanentAddress).value_or(""),
            link.kind,
            link.hardwareType == ARPHRD_ETHER};
}

PropertyMap adapterProperties(const Link& link, const std::vector<std::uint8_t>& permanentAddress,
                              const KernelState& state, const HostConfiguration& configuration) {
    const KernelState::Addresses& addresses = state.addressesOf(link.index);
    const Address* ipv4 = reportedIpv4(addresses);
    const Address* ipv6 = reportedIpv6(addresses);
    PropertyMap properties;
    set(properties, PROP_NODE_STRING, cleanText(link.name));
    set(properties, PROP_STATUS, static_cast<unsigned int>(statusOf(link)));
    set(properties, PROP_MAC_ADDRESS, hardwareAddressText(link.address).value_or(""));
    setAddresses(properties, ipv4, ipv6);
    if (const auto gateway = gatewayOf(state, link.index)) {
        set(properties, PROP_DEFAULT_GATEWAY, gateway->text());
    }
    if (const auto mode = modeOf(factsOf(link, permanentAddress), ipv4, configuration)) {
        set(properties, PROP_DHCP_ENABLED, static_cast<unsigned int>(*mode));
    }
    setResolver(properties, configuration.resolverOf(link.index), configuration.hostName());
    return properties;
}

} // namespace Orv::Agent::Linux
