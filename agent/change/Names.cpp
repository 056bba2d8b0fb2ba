#include "agent/change/Rules.h"

#include <algorithm>
#include <array>
#include <optional>

#include <arpa/inet.h>
#include <net/if.h>
#include <netinet/in.h>

namespace Orv::Agent {

namespace {

constexpr std::size_t longestName = 253; ///< octets in dotted form (RFC 1035, RFC 1123)
constexpr std::size_t longestLabel = 63;
constexpr std::string_view lowerLetters = "abcdefghijklmnopqrstuvwxyz";
constexpr std::string_view digits = "0123456789";

/** ASCII alone, whatever the locale. */
char lowerCase(char letter) {
    return letter >= 'A' && letter <= 'Z' ? static_cast<char>(letter - 'A' + 'a') : letter;
}

std::string lowerCase(std::string text) {
    std::transform(text.begin(), text.end(), text.begin(), [](char letter) { return lowerCase(letter); });
    return text;
}

bool isLetterOrDigit(char character) {
    return lowerLetters.find(lowerCase(character)) != std::string_view::npos ||
           digits.find(character) != std::string_view::npos;
}

std::string whyNotLabel(std::string_view label) {
    if (label.empty()) {
        return "a label of the name is empty";
    }
    if (label.size() > longestLabel) {
        return "a label of the name is longer than 63 octets";
    }
    if (label.starts_with('-') || label.ends_with('-')) {
        return "a label of the name begins or ends with a hyphen";
    }
    const bool fits = std::all_of(label.begin(), label.end(),
                                  [](char character) { return character == '-' || isLetterOrDigit(character); });
    return fits ? "" : "a name has letters, digits and hyphens between its dots, and nothing else";
}

bool isIpv6Text(std::string_view text) {
    return text.find_first_not_of("0123456789abcdefABCDEF:.") == std::string_view::npos;
}

bool isZone(std::string_view zone) {
    return !zone.empty() && zone.size() < IF_NAMESIZE && std::all_of(zone.begin(), zone.end(), [](char character) {
        return isLetterOrDigit(character) || std::string_view("._-").find(character) != std::string_view::npos;
    });
}

/** A name server as the value that it is, so that two spellings of one address are seen to be the same. */
struct Server {
    std::optional<in6_addr> address; ///< IPv4 as mapped
    std::string zone;
    std::string reason; ///< why it is none
};

Server refused(const std::string& reason) {
    return {std::nullopt, {}, reason};
}

Server ipv4Server(Ipv4Address address) {
    const bool isLoopback = address.number >> 24U == 127;
    std::string reason = isLoopback ? "" : whyNotHostAddress(address);
    if (!reason.empty()) {
        return refused(reason);
    }
    in6_addr mapped{};
    mapped.s6_addr[10] = 0xFF;
    mapped.s6_addr[11] = 0xFF;
    for (unsigned byte = 0; byte < 4; ++byte) {
        mapped.s6_addr[12 + byte] = static_cast<std::uint8_t>(address.number >> (24U - 8U * byte));
    }
    return {mapped, {}, {}};
}

Server ipv6Server(std::string_view text) {
    const std::size_t percent = text.find('%');
    const bool hasZone = percent != std::string_view::npos;
    const std::string address(text.substr(0, percent));
    const std::string zone(hasZone ? text.substr(percent + 1) : "");
    in6_addr parsed{};
    if (!isIpv6Text(address) || inet_pton(AF_INET6, address.c_str(), &parsed) != 1) {
        return refused("is no IPv4 or IPv6 address");
    }
    if (IN6_IS_ADDR_MULTICAST(&parsed) || IN6_IS_ADDR_UNSPECIFIED(&parsed)) {
        return refused("is no address of a host");
    }
    if (bool(IN6_IS_ADDR_LINKLOCAL(&parsed)) != hasZone || (hasZone && !isZone(zone))) {
        return refused("needs its interface behind a percent sign if it is link-local, and only then");
    }
    return {parsed, zone, {}};
}

Server serverOf(const std::string& text) {
    const auto ipv4 = Ipv4Address::parse(text);
    return ipv4 ? ipv4Server(*ipv4) : ipv6Server(text);
}

bool isSame(const Server& left, const Server& right) {
    return IN6_ARE_ADDR_EQUAL(&*left.address, &*right.address) && left.zone == right.zone;
}

std::string tooMany(std::size_t most, std::size_t count, const char* what) {
    return "the resolver reads " + std::to_string(most) + " " + what + ", not " + std::to_string(count);
}

std::string ordinal(std::size_t index) {
    return "number " + std::to_string(index + 1);
}

} // namespace

std::string whyNotDomain(std::string_view name) {
    if (name.size() > longestName) {
        return "the name is longer than 253 octets";
    }
    std::string_view label;
    for (std::size_t start = 0; start <= name.size(); start += label.size() + 1) {
        label = name.substr(start, name.find('.', start) - start);
        if (std::string reason = whyNotLabel(label); !reason.empty()) {
            return reason;
        }
    }
    const bool isNumber = label.find_first_not_of(digits) == std::string_view::npos;
    return isNumber ? "the last label of a name is not a number" : "";
}

std::string whyNotNameServers(const std::vector<std::string>& servers) {
    if (servers.size() > mostNameServers) {
        return tooMany(mostNameServers, servers.size(), "name servers");
    }
    std::vector<Server> known;
    for (const std::string& text : servers) {
        Server server = serverOf(text);
        if (!server.address) {
            return ordinal(known.size()) + " " + server.reason;
        }
        if (std::any_of(known.begin(), known.end(), [&](const Server& other) { return isSame(server, other); })) {
            return ordinal(known.size()) + " is there twice";
        }
        known.push_back(std::move(server));
    }
    return {};
}

std::string whyNotSuffixes(const std::vector<std::string>& suffixes) {
    if (suffixes.size() > mostSearchSuffixes) {
        return tooMany(mostSearchSuffixes, suffixes.size(), "suffixes");
    }
    std::vector<std::string> known;
    for (const std::string& suffix : suffixes) {
        if (const std::string reason = whyNotDomain(suffix); !reason.empty()) {
            return ordinal(known.size()) + ": " + reason;
        }
        std::string name = lowerCase(suffix);
        if (std::find(known.begin(), known.end(), name) != known.end()) {
            return ordinal(known.size()) + " is there twice";
        }
        known.push_back(std::move(name));
    }
    return {};
}

} // namespace Orv::Agent
