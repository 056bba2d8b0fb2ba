#include "tests/linux/IpReport.h"

#include <array>
#include <limits>
#include <nlohmann/json.hpp>

namespace Orv::Test {

using namespace NodeLexicon;
using PropertyMap = Report::mapped_type;
using Json = nlohmann::json;

namespace {

constexpr std::array kernelKnown{PROP_IPV4_ADDRESS, PROP_IPV4_SUBNET_MASK, PROP_IPV6_ADDRESS, PROP_DEFAULT_GATEWAY,
                                 PROP_NODE_STRING,  PROP_MAC_ADDRESS,      PROP_STATUS};

bool contains(const Json& flags, const char* flag) {
    return std::find(flags.begin(), flags.end(), flag) != flags.end();
}

std::string mask(unsigned length) {
    std::string text;
    for (unsigned octet = 0; octet < 4; ++octet) {
        const unsigned bits = length > 8 * octet ? std::min(8U, length - 8 * octet) : 0;
        text += (octet == 0 ? "" : ".") + std::to_string(256U - (1U << (8U - bits)));
    }
    return text;
}

unsigned int status(const Json& link) {
    if (!contains(link["flags"], "UP")) {
        return 5;
    }
    const std::string state = link["operstate"];
    const bool unknownButRunning = state == "UNKNOWN" && contains(link["flags"], "LOWER_UP");
    return state == "UP" || unknownButRunning ? 1 : 12;
}

/** The first address of a family for which `accept` holds. */
template <typename Accept>
const Json* firstAddress(const Json& link, const char* family, Accept accept) {
    for (const Json& address : link["addr_info"]) {
        if (address.value("family", "") == family && accept(address)) {
            return &address;
        }
    }
    return nullptr;
}

void addAddresses(const Json& link, PropertyMap& properties) {
    const auto inScope = [](const char* scope) {
        return [=](const Json& address) { return address["scope"] == scope && !address.value("secondary", false); };
    };
    const auto best = [&](const char* family) {
        const Json* global = firstAddress(link, family, inScope("global"));
        return global != nullptr ? global : firstAddress(link, family, inScope("link"));
    };
    if (const Json* ipv4 = best("inet")) {
        properties[PROP_IPV4_ADDRESS] = (*ipv4)["local"].get<std::string>();
        properties[PROP_IPV4_SUBNET_MASK] = mask((*ipv4)["prefixlen"]);
    }
    if (const Json* ipv6 = best("inet6")) {
        properties[PROP_IPV6_ADDRESS] = (*ipv6)["local"].get<std::string>();
    }
}

/** Gateways by interface: of the lowest metric, the first of several. */
std::map<std::string, std::string> gateways(const Json& routes) {
    std::map<std::string, std::string> found;
    std::map<std::string, unsigned> metrics;
    const auto consider = [&](const Json& hop, unsigned metric) {
        const std::string device = hop.value("dev", "");
        if (metrics.count(device) == 0 || metric < metrics[device]) {
            metrics[device] = metric;
            found[device] = hop.value("gateway", "");
        }
    };
    for (const Json& route : routes) {
        if (route.value("dst", "") != "default" || route.value("type", "unicast") != "unicast") {
            continue;
        }
        const unsigned metric = route.value("metric", 0U);
        if (route.contains("nexthops")) {
            for (const Json& hop : route["nexthops"]) {
                consider(hop, metric);
            }
        } else {
            consider(route, metric);
        }
    }
    return found;
}

Json parse(const Namespace& space, const std::string& arguments) {
    const std::string output = space.ip("-j " + arguments);
    return output.find_first_not_of(" \n") == std::string::npos ? Json::array() : Json::parse(output);
}

} // namespace

Report ipReport(const Namespace& space) {
    auto gateway = gateways(parse(space, "-4 route show table main"));
    const auto gateway6 = gateways(parse(space, "-6 route show table main"));
    Report report;
    for (const Json& link : parse(space, "addr")) {
        if (link.value("link_type", "") == "loopback") {
            continue;
        }
        const std::string name = link["ifname"];
        PropertyMap& properties = report[name];
        properties[PROP_NODE_STRING] = name;
        properties[PROP_STATUS] = status(link);
        // A bridge without ports has an address of zeros, which is none; a tunnel's is shorter.
        const std::string address = link.value("address", "");
        if (address.size() == 17 && address != "00:00:00:00:00:00") {
            properties[PROP_MAC_ADDRESS] = address;
        }
        addAddresses(link, properties);
        const auto other = gateway6.find(name);
        if (!gateway[name].empty()) {
            properties[PROP_DEFAULT_GATEWAY] = gateway[name];
        } else if (other != gateway6.end() && !other->second.empty()) {
            properties[PROP_DEFAULT_GATEWAY] = other->second;
        }
    }
    return report;
}

Report kernelProperties(const Agent::Tree& tree) {
    Report report;
    for (const auto& node : tree.nodesOfType(NODE_NETWORK_ADAPTER)) {
        PropertyMap& properties = report[node->description];
        for (const Properties property : kernelKnown) {
            if (const auto found = node->properties.find(property); found != node->properties.end()) {
                properties.insert(*found);
            }
        }
    }
    return report;
}

std::string toText(const Report& report) {
    std::string text;
    for (const auto& [name, properties] : report) {
        text += name + ":";
        for (const auto& [property, value] : properties) {
            const auto* string = std::get_if<std::string>(&value);
            text += " " + std::to_string(property) + "=" +
                    (string != nullptr ? *string : std::to_string(std::get<unsigned int>(value)));
        }
        text += "\n";
    }
    return text;
}

} // namespace Orv::Test
