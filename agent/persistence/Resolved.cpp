#include "agent/persistence/Resolved.h"

#include "agent/linux/Resolver.h"
#include "agent/persistence/SystemBus.h"

#include <algorithm>
#include <cstdint>
#include <filesystem>
#include <stdexcept>

#include <arpa/inet.h>
#include <systemd/sd-bus.h>

namespace Orv::Agent::Persistence {

namespace {

constexpr const char* service = "org.freedesktop.resolve1";
constexpr BusObject manager{service, "/org/freedesktop/resolve1", "org.freedesktop.resolve1.Manager"};

/** The address as bytes; the link of a link-local one is the one that is set. */
std::pair<int, std::vector<std::uint8_t>> bytesOf(const std::string& server) {
    std::vector<std::uint8_t> bytes(sizeof(in6_addr));
    const std::string address = server.substr(0, server.find('%'));
    if (inet_pton(AF_INET, address.c_str(), bytes.data()) == 1) {
        bytes.resize(sizeof(in_addr));
        return {AF_INET, bytes};
    }
    if (inet_pton(AF_INET6, address.c_str(), bytes.data()) != 1) {
        throw std::runtime_error(server + " is no address");
    }
    return {AF_INET6, bytes};
}

/** a(iay) */
int appendServers(sd_bus_message* message, int index, const std::vector<std::string>& servers) {
    int result = sd_bus_message_append(message, "i", index);
    result = result < 0 ? result : sd_bus_message_open_container(message, 'a', "(iay)");
    for (const std::string& server : servers) {
        const auto [family, bytes] = bytesOf(server);
        result = result < 0 ? result : sd_bus_message_open_container(message, 'r', "iay");
        result = result < 0 ? result : sd_bus_message_append(message, "i", family);
        result = result < 0 ? result : sd_bus_message_append_array(message, 'y', bytes.data(), bytes.size());
        result = result < 0 ? result : sd_bus_message_close_container(message);
    }
    return result < 0 ? result : sd_bus_message_close_container(message);
}

/** a(sb): the domains, each searched and not only routed to. */
int appendDomains(sd_bus_message* message, int index, const std::vector<std::string>& domains) {
    int result = sd_bus_message_append(message, "i", index);
    result = result < 0 ? result : sd_bus_message_open_container(message, 'a', "(sb)");
    for (const std::string& domain : domains) {
        result = result < 0 ? result : sd_bus_message_append(message, "(sb)", domain.c_str(), 0);
    }
    return result < 0 ? result : sd_bus_message_close_container(message);
}

std::vector<std::string> domainsOf(const NameSettings& whole) {
    std::vector<std::string> domains = whole.suffixes.value_or(std::vector<std::string>());
    if (whole.domain) {
        std::erase(domains, *whole.domain);
        domains.insert(domains.begin(), *whole.domain);
    }
    return domains;
}

} // namespace

FileEdits Resolved::plan(const NameSettings& /*wanted*/) const {
    return {};
}

void Resolved::apply(const InterfaceFacts& interface, const NameSettings& whole) {
    SystemBus bus(_environment.systemBus);
    if (whole.servers) {
        bus.call(manager, "SetLinkDNS",
                 [&](sd_bus_message* message) { return appendServers(message, interface.index, *whole.servers); });
    }
    if (whole.domain || whole.suffixes) {
        bus.call(manager, "SetLinkDomains",
                 [&](sd_bus_message* message) { return appendDomains(message, interface.index, domainsOf(whole)); });
    }
}

bool Resolved::serves(const Environment& environment) {
    std::error_code error;
    const auto target = std::filesystem::weakly_canonical(environment.root + "/etc/resolv.conf", error);
    if (!error && target.string().starts_with(environment.root + "/run/systemd/resolve/")) {
        return true;
    }
    const std::string text = contentOf(environment.root + "/etc/resolv.conf").value_or("");
    const auto servers = Linux::parseResolvConf(text).servers;
    return !servers.empty() && std::all_of(servers.begin(), servers.end(), [](const std::string& server) {
        return server == "127.0.0.53" || server == "127.0.0.54";
    });
}

} // namespace Orv::Agent::Persistence
