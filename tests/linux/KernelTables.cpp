#include "tests/linux/KernelTables.h"

#include <algorithm>
#include <nlohmann/json.hpp>

namespace Orv::Test {

using Json = nlohmann::json;

namespace {

Json parse(const std::string& text) {
    return text.find_first_not_of(" \n") == std::string::npos ? Json::array() : Json::parse(text);
}

/** " KEY VALUE" of a member that is there. */
std::string part(const Json& object, const char* member, const std::string& shown) {
    const auto found = object.find(member);
    if (found == object.end()) {
        return {};
    }
    return " " + shown + " " + (found->is_string() ? found->get<std::string>() : found->dump());
}

std::string addressLine(const Json& address, const std::string& interface) {
    std::string line = address["local"].get<std::string>() + "/" + address["prefixlen"].dump();
    line += part(address, "address", "peer") + part(address, "broadcast", "brd");
    for (const char* flag : {"secondary", "dynamic", "noprefixroute"}) {
        line += address.value(flag, false) ? std::string(" ") + flag : "";
    }
    line += address["scope"] == "global" ? "" : " " + address["scope"].get<std::string>();
    return line + (address.value("label", "") == interface ? "" : part(address, "label", "label"));
}

std::string routeLine(const Json& route) {
    std::string line = route["dst"].get<std::string>() + part(route, "gateway", "via");
    for (const Json& hop : route.value("nexthops", Json::array())) {
        line += " [" + hop["dev"].get<std::string>() + part(hop, "gateway", "via") + "]";
    }
    line += part(route, "prefsrc", "src") + part(route, "metric", "metric");
    line += route.value("table", "main") == "main" ? "" : part(route, "table", "table");
    line += route.value("protocol", "boot") == "boot" ? "" : part(route, "protocol", "proto");
    for (const Json& metrics : route.value("metrics", Json::array())) {
        line += part(metrics, "mtu", "mtu");
    }
    return line;
}

} // namespace

Lines addressLines(const Namespace& space, const std::string& interface) {
    Lines lines;
    for (const Json& link : parse(space.ip("-j -4 addr show dev " + interface))) {
        for (const Json& address : link.value("addr_info", Json::array())) {
            lines.push_back(addressLine(address, interface));
        }
    }
    return lines;
}

void addIpv6(const Namespace& space, const std::string& interface, const std::string& address) {
    space.ip("addr add " + address + "/64 dev " + interface);
    // Duplicate detection ends in its own time, and the route to oneself comes last.
    space.shell("for i in $(seq 100); do ip -6 addr show dev " + interface +
                " | grep -q tentative || { [ $(ip -6 -o addr show dev " + interface +
                " | wc -l) = $(ip -6 route show table local type local dev " + interface +
                " | wc -l) ] && exit 0; }; sleep 0.05; done; exit 1");
}

std::string ipv6Addresses(const Namespace& space, const std::string& interface) {
    return space.ip("-j -6 addr show dev " + interface);
}

Lines routeLines(const Namespace& space, const std::string& interface) {
    Lines lines;
    for (const Json& route : parse(space.ip("-j -4 -d route show table all"))) {
        const std::string text = route.dump();
        const bool ours = text.find("\"dev\":\"" + interface + "\"") != std::string::npos;
        if (ours && route.value("protocol", "boot") != "kernel") {
            lines.push_back(routeLine(route));
        }
    }
    std::sort(lines.begin(), lines.end());
    return lines;
}

} // namespace Orv::Test
