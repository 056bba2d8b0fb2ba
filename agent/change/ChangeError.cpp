#include "agent/change/ChangeError.h"

#include "agent/text/Text.h"

#include <algorithm>

namespace Orv::Agent {

namespace {

using namespace NodeLexicon;

struct PropertyName {
    Properties property;
    const char* name;
};

constexpr PropertyName names[] = {
    {PROP_DHCP_ENABLED, "DHCPEnabled"},
    {PROP_IPV4_ADDRESS, "IPv4Address"},
    {PROP_IPV4_SUBNET_MASK, "SubnetMask"},
    {PROP_IPV6_ADDRESS, "IPv6Address"},
    {PROP_DNS_SERVERS, "DNSServerSearchOrder"},
    {PROP_DNS_HOSTNAME, "DNSHostName"},
    {PROP_DNS_DOMAIN, "DNSDomain"},
    {PROP_DNS_SUFFIXES, "DNSDomainSuffixSearchOrder"},
    {PROP_DEFAULT_GATEWAY, "DefaultIPGateway"},
    {PROP_MAC_ADDRESS, "MACAddress"},
    {PROP_STATUS, "Status"},
};

/** A client may send kilobytes; a message is one line for people. */
constexpr std::size_t longestText = 100;
constexpr std::size_t mostElements = 8;

std::string quoted(const std::string& text) {
    const bool isLong = text.size() > longestText;
    return '"' + cleanText(std::string_view(text).substr(0, longestText)) + (isLong ? "...\"" : "\"");
}

std::string shownList(const std::vector<std::string>& list) {
    std::string text;
    for (std::size_t index = 0; index < std::min(list.size(), mostElements); ++index) {
        text += (index == 0 ? "" : ", ") + quoted(list[index]);
    }
    return '[' + text + (list.size() > mostElements ? ", ...]" : "]");
}

} // namespace

std::string propertyName(Properties property) {
    const auto* const found = std::find_if(std::begin(names), std::end(names),
                                           [&](const PropertyName& name) { return name.property == property; });
    return found == std::end(names) ? "property " + std::to_string(property) : found->name;
}

std::string shownValue(const PropertyValue& value) {
    if (const auto* number = std::get_if<unsigned int>(&value)) {
        return std::to_string(*number);
    }
    const auto* text = std::get_if<std::string>(&value);
    return text != nullptr ? quoted(*text) : shownList(std::get<std::vector<std::string>>(value));
}

ChangeError::ChangeError(const std::string& interface, Properties property, const PropertyValue& value,
                         const std::string& reason)
    : std::runtime_error(cleanText(interface) + ": " + propertyName(property) + " cannot be set to " +
                         shownValue(value) + ": " + reason) {}

} // namespace Orv::Agent
