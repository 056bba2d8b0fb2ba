#include "host/delivery/Url.h"

#include "host/model/Instance.h"

#include <algorithm>
#include <charconv>
#include <stdexcept>
#include <string>

#include <arpa/inet.h>
#include <netinet/in.h>

namespace marlo::delivery {
namespace {

[[noreturn]] void refuse(std::string_view url, const std::string& reason) {
    throw std::invalid_argument("\"" + std::string(url) + "\" is no URL of a listener: " + reason);
}

bool isNameCharacter(char letter) {
    return (letter >= 'a' && letter <= 'z') || (letter >= 'A' && letter <= 'Z') || (letter >= '0' && letter <= '9') ||
           letter == '-' || letter == '.' || letter == '_';
}

/** Printable and allowed as it stands (RFC 3986, section 2); nothing that could end a line of the request. */
bool isUrlCharacter(char letter) {
    return letter > ' ' && letter <= '~' && std::string_view("\"<>\\^`{|}").find(letter) == std::string_view::npos;
}

bool isIpv6(const std::string& text) {
    in6_addr address{};
    return ::inet_pton(AF_INET6, text.c_str(), &address) == 1;
}

unsigned short readPort(std::string_view url, std::string_view text) {
    unsigned port = 0;
    const auto [end, error] = std::from_chars(text.data(), text.data() + text.size(), port);
    if (error != std::errc() || end != text.data() + text.size() || port == 0 || port > 65535) {
        refuse(url, "\"" + std::string(text) + "\" is no port");
    }
    return static_cast<unsigned short>(port);
}

/** Returns the scheme's length with "://". */
std::size_t readScheme(std::string_view text, Url& url) {
    const std::size_t mark = text.find("://");
    const std::string_view scheme = text.substr(0, mark == std::string_view::npos ? 0 : mark);
    if (!equalNames(scheme, "http") && !equalNames(scheme, "https")) {
        refuse(text, "it begins with neither http:// nor https://");
    }
    url.isSecure = scheme.size() == 5;
    url.port = url.isSecure ? 443 : 80;
    return mark + 3;
}

void readAuthority(std::string_view text, Url& url) {
    const std::string_view authority = url.authority;
    if (authority.find('@') != std::string_view::npos) {
        refuse(text, "a user cannot be named in it");
    }
    std::size_t end = std::min(authority.find(':'), authority.size());
    if (authority.starts_with('[')) {
        const std::size_t bracket = authority.find(']');
        url.host = authority.substr(1, bracket - 1);
        if (bracket == std::string_view::npos || !isIpv6(url.host)) {
            refuse(text, "\"" + url.host + "\" is no address");
        }
        end = bracket + 1;
    } else {
        url.host = authority.substr(0, end);
        if (url.host.empty() || !std::ranges::all_of(url.host, isNameCharacter)) {
            refuse(text, "\"" + url.host + "\" is no host");
        }
    }
    if (end < authority.size()) {
        if (authority[end] != ':') {
            refuse(text, "a port is expected behind the host");
        }
        url.port = readPort(text, authority.substr(end + 1));
    }
}

} // namespace

Url Url::parse(std::string_view text) {
    Url url;
    if (!std::ranges::all_of(text, isUrlCharacter)) {
        refuse(text, "it has characters that must be escaped");
    }
    if (text.find('#') != std::string_view::npos) {
        refuse(text, "a listener is never told of a fragment");
    }
    const std::size_t begin = readScheme(text, url);
    const std::size_t path = std::min(text.find_first_of("/?", begin), text.size());
    url.authority = text.substr(begin, path - begin);
    url.target = text.substr(path);
    if (!url.target.starts_with('/')) {
        url.target.insert(0, 1, '/');
    }
    readAuthority(text, url);
    return url;
}

} // namespace marlo::delivery
