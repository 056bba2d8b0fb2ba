#include "agent/linux/Resolver.h"

#include "agent/linux/Words.h"
#include "agent/text/Text.h"

#include <algorithm>
#include <array>
#include <optional>

#include <arpa/inet.h>

namespace Orv::Agent::Linux {

namespace {

constexpr const char* resolvConf = "/etc/resolv.conf";
constexpr const char* serversBehindStub = "/run/systemd/resolve/resolv.conf";
constexpr const char* networkdLinks = "/run/systemd/netif/links";
constexpr const char* resolvedLinks = "/run/systemd/resolve/netif";

/** Whether the text is an address; an IPv6 one may name its interface behind a percent sign. */
bool isAddress(std::string_view text) {
    const std::string address(text.substr(0, text.find('%')));
    in6_addr parsed{};
    return inet_pton(AF_INET6, address.c_str(), &parsed) == 1 ||
           (address.size() == text.size() && inet_pton(AF_INET, address.c_str(), &parsed) == 1);
}

/**
 * A server without what systemd writes round it: brackets, a port ("9.9.9.9:53", "[2620:fe::fe]:53") and, behind '#',
 * the name of its certificate. An interface behind '%' stays.
 */
std::string_view bareServer(std::string_view text) {
    text = text.substr(0, text.find('#'));
    if (text.starts_with('[')) {
        return text.substr(1, text.find(']') - 1);
    }
    const bool onePort = std::count(text.begin(), text.end(), ':') == 1;
    return onePort ? text.substr(0, text.find(':')) : text;
}

void addServer(ResolverSettings& settings, std::string_view text) {
    if (settings.servers.size() < ResolverSettings::mostServers && isAddress(text)) {
        settings.servers.push_back(cleanText(text));
    }
}

void addSuffix(ResolverSettings& settings, std::string_view text) {
    // "." appends nothing, "~" marks a domain that only steers where a question goes.
    if (settings.suffixes.size() < ResolverSettings::mostSuffixes && text != "." && !text.starts_with('~') &&
        text.size() <= ResolverSettings::longestName) {
        settings.suffixes.push_back(cleanText(text));
    }
}

void readResolvLine(std::string_view line, ResolverSettings& settings) {
    const std::vector<std::string_view> words = wordsOf(line);
    // A keyword stands at the beginning of its line and has a value.
    if (words.size() < 2 || words.front().data() != line.data()) {
        return;
    }
    if (words[0] == "nameserver") {
        addServer(settings, words[1]);
    } else if (words[0] == "domain" && words[1].size() <= ResolverSettings::longestName) {
        settings.domain = cleanText(words[1]);
        settings.suffixes = {settings.domain};
    } else if (words[0] == "search") {
        settings.suffixes.clear();
        std::for_each(words.begin() + 1, words.end(), [&](std::string_view word) { addSuffix(settings, word); });
    }
}

/** Whether the settings only point at the stub of systemd-resolved. */
bool isStub(const ResolverSettings& settings) {
    constexpr std::array<std::string_view, 2> stubs{"127.0.0.53", "127.0.0.54"};
    return !settings.servers.empty() &&
           std::all_of(settings.servers.begin(), settings.servers.end(), [&](const std::string& server) {
               return std::find(stubs.begin(), stubs.end(), server) != stubs.end();
           });
}

/** Reads one file of variable assignments about an interface. */
ResolverSettings parseLinkState(std::string_view text) {
    ResolverSettings settings;
    for (const std::string_view line : linesOf(text)) {
        const std::size_t equals = line.find('=');
        if (equals == std::string_view::npos) {
            continue;
        }
        const std::string_view key = line.substr(0, equals);
        for (const std::string_view word : wordsOf(line.substr(equals + 1))) {
            if (key == "DNS" || key == "SERVERS") {
                addServer(settings, bareServer(word));
            } else if (key == "DOMAINS") {
                addSuffix(settings, word);
            }
        }
    }
    settings.domain = settings.suffixes.empty() ? std::string() : settings.suffixes.front();
    return settings;
}

} // namespace

ResolverSettings parseResolvConf(std::string_view text) {
    ResolverSettings settings;
    for (const std::string_view line : linesOf(text)) {
        readResolvLine(line, settings);
    }
    return settings;
}

ResolverSettings readResolvConf(HostFiles& files) {
    ResolverSettings settings = parseResolvConf(files.read(resolvConf).value_or(""));
    if (isStub(settings)) {
        const ResolverSettings behind = parseResolvConf(files.read(serversBehindStub).value_or(""));
        if (!behind.servers.empty()) {
            settings.servers = behind.servers;
        }
    }
    return settings;
}

std::map<int, ResolverSettings> readLinkResolvers(HostFiles& files) {
    std::map<int, ResolverSettings> settings;
    // Both services replace a file whole when it changes, which shows in its directory: the files themselves, one per
    // interface, need not be looked at. What is set by hand for systemd-resolved stands above networkd's.
    for (const std::string directory : {networkdLinks, resolvedLinks}) {
        for (const std::string& name : files.list(directory)) {
            const std::optional<int> index = positiveNumber(name);
            ResolverSettings link = index ? parseLinkState(files.peek(pathIn(directory, name))) : ResolverSettings();
            if (link != ResolverSettings()) {
                settings[*index] = std::move(link);
            }
        }
    }
    return settings;
}

std::string readHostDomain(HostFiles& files, std::string_view nodeName) {
    if (const std::size_t dot = nodeName.find('.'); dot != std::string_view::npos) {
        return cleanText(nodeName.substr(dot + 1));
    }
    const std::string hosts = files.read("/etc/hosts").value_or("");
    for (const std::string_view line : linesOf(hosts)) {
        const std::vector<std::string_view> names = wordsOf(line.substr(0, line.find('#')));
        if (names.size() < 2 || std::find(names.begin() + 1, names.end(), nodeName) == names.end()) {
            continue;
        }
        for (auto name = names.begin() + 1; name != names.end(); ++name) {
            const std::size_t dot = name->find('.');
            if (name->substr(0, dot) == nodeName && dot != std::string_view::npos && dot + 1 < name->size()) {
                return cleanText(name->substr(dot + 1));
            }
        }
    }
    return {};
}

} // namespace Orv::Agent::Linux
