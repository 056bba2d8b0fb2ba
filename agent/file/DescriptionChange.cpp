#include "agent/file/DescriptionChange.h"

namespace Orv::Agent {

namespace {

using namespace NodeLexicon;

/** Gathers what differs. */
class Comparison {
  public:
    explicit Comparison(const PropertyMap& properties) : _properties(properties) {}

    void number(const char* key, Properties property, unsigned int wanted) {
        compare(key, property, wanted, std::to_string(wanted));
    }

    void text(const char* key, Properties property, const std::string& wanted) {
        compare(key, property, wanted, tomlText(wanted));
    }

    void list(const char* key, Properties property, const std::vector<std::string>& wanted) {
        if (wanted.empty()) {
            none(key, property);
        } else {
            compare(key, property, wanted, tomlList(wanted));
        }
    }

    void none(const char* key, Properties property) {
        if (_properties.find(property) != _properties.end()) {
            edits.push_back({key, std::nullopt});
        }
    }

    std::vector<KeyEdit> edits;

  private:
    void compare(const char* key, Properties property, const PropertyValue& wanted, std::string written) {
        const auto found = _properties.find(property);
        if (found == _properties.end() || found->second != wanted) {
            edits.push_back({key, std::move(written)});
        }
    }

    const PropertyMap& _properties;
};

/** What stands there and is no IPv4 setting stays: an odd text is somebody's own. */
void compareIpv4(Comparison& comparison, const Ipv4Settings& inForce, const Ipv4Settings& wanted) {
    comparison.number("dhcp", PROP_DHCP_ENABLED, static_cast<unsigned int>(wanted.mode));
    if (wanted.address) {
        comparison.text("ipv4_address", PROP_IPV4_ADDRESS, wanted.address->address.text());
        comparison.text("ipv4_subnet_mask", PROP_IPV4_SUBNET_MASK, maskOf(wanted.address->prefixLength).text());
    } else if (inForce.address) {
        comparison.none("ipv4_address", PROP_IPV4_ADDRESS);
        comparison.none("ipv4_subnet_mask", PROP_IPV4_SUBNET_MASK);
    }
    if (wanted.gateway) {
        comparison.text("default_gateway", PROP_DEFAULT_GATEWAY, wanted.gateway->text());
    } else if (inForce.gateway) {
        comparison.none("default_gateway", PROP_DEFAULT_GATEWAY);
    }
}

} // namespace

std::vector<KeyEdit> keyEdits(const PropertyMap& properties, const AdapterSettings& wanted) {
    Comparison comparison(properties);
    if (wanted.ipv4) {
        compareIpv4(comparison, *settingsOf(properties).ipv4, *wanted.ipv4);
    }
    if (wanted.names.domain) {
        comparison.text("dns_domain", PROP_DNS_DOMAIN, *wanted.names.domain);
    }
    if (wanted.names.servers) {
        comparison.list("dns_servers", PROP_DNS_SERVERS, *wanted.names.servers);
    }
    if (wanted.names.suffixes) {
        comparison.list("dns_suffixes", PROP_DNS_SUFFIXES, *wanted.names.suffixes);
    }
    return std::move(comparison.edits);
}

} // namespace Orv::Agent
