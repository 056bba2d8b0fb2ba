#include "host/server/Endpoints.h"

#include <cerrno>
#include <charconv>
#include <cstring>
#include <stdexcept>
#include <utility>

#include <arpa/inet.h>
#include <netinet/in.h>
#include <sys/socket.h>
#include <sys/un.h>
#include <unistd.h>

namespace marlo::server {

namespace {

/** A socket that is closed when it goes. */
class Socket {
  public:
    explicit Socket(int family) : _fd(::socket(family, SOCK_STREAM | SOCK_CLOEXEC, 0)) {}

    ~Socket() {
        if (_fd >= 0) {
            ::close(_fd);
        }
    }

    Socket(const Socket&) = delete;
    Socket& operator=(const Socket&) = delete;

    [[nodiscard]] int get() const { return _fd; }

  private:
    int _fd;
};

/** A socket address of any family with its length. */
struct SocketAddress {
    sockaddr_storage storage{};
    socklen_t length = 0;

    [[nodiscard]] const sockaddr* get() const { return reinterpret_cast<const sockaddr*>(&storage); }
};

SocketAddress internetAddress(const http::Endpoint& endpoint) {
    SocketAddress address;
    auto* const four = reinterpret_cast<sockaddr_in*>(&address.storage);
    auto* const six = reinterpret_cast<sockaddr_in6*>(&address.storage);
    if (::inet_pton(AF_INET, endpoint.address.c_str(), &four->sin_addr) == 1) {
        four->sin_family = AF_INET;
        four->sin_port = htons(endpoint.port);
        address.length = sizeof *four;
    } else if (::inet_pton(AF_INET6, endpoint.address.c_str(), &six->sin6_addr) == 1) {
        six->sin6_family = AF_INET6;
        six->sin6_port = htons(endpoint.port);
        address.length = sizeof *six;
    }
    return address;
}

/** 0, or why it cannot be bound. */
int tryToBind(const http::Endpoint& endpoint) {
    const SocketAddress address = internetAddress(endpoint);
    const Socket socket(address.storage.ss_family);
    const int on = 1;
    ::setsockopt(socket.get(), SOL_SOCKET, SO_REUSEADDR, &on,
                 sizeof on); // else what lately ended would be in the way
    const bool bound = socket.get() >= 0 && ::bind(socket.get(), address.get(), address.length) == 0;
    return bound ? 0 : errno;
}

bool answers(const std::string& path) {
    sockaddr_un address{};
    if (path.size() >= sizeof address.sun_path) {
        return false;
    }
    address.sun_family = AF_UNIX;
    path.copy(address.sun_path, path.size());
    const Socket socket(AF_UNIX);
    return ::connect(socket.get(), reinterpret_cast<const sockaddr*>(&address), sizeof address) == 0;
}

std::pair<std::string, std::string> splitPort(const std::string& text) {
    const std::size_t colon = text.rfind(':');
    const bool bracketed = text.starts_with('[');
    if (colon == std::string::npos || (bracketed && (colon == 0 || text[colon - 1] != ']')) ||
        (!bracketed && text.find(':') != colon)) {
        throw std::invalid_argument(R"(expected an address and a port, "127.0.0.1:5988" or "[::1]:5988", found ")" +
                                    text + '"');
    }
    const std::string address = bracketed ? text.substr(1, colon - 2) : text.substr(0, colon);
    return {address, text.substr(colon + 1)};
}

unsigned short parsePort(const std::string& text) {
    unsigned short port = 0;
    const auto [end, error] = std::from_chars(text.data(), text.data() + text.size(), port);
    if (text.empty() || error != std::errc() || end != text.data() + text.size()) {
        throw std::invalid_argument("expected a port from 0 to 65535, found \"" + text + '"');
    }
    return port;
}

} // namespace

http::Endpoint parseEndpoint(const std::string& text, http::Transport transport) {
    const auto [address, port] = splitPort(text);
    http::Endpoint endpoint{transport, address, parsePort(port)};
    const bool isSix = internetAddress(endpoint).storage.ss_family == AF_INET6;
    if (internetAddress(endpoint).length == 0 || isSix != text.starts_with('[')) {
        throw std::invalid_argument("expected a numeric address, found \"" + text + '"');
    }
    if (transport == http::Transport::tcp && !isLoopback(address)) {
        throw std::invalid_argument(text +
                                    " is beyond loopback, where passwords go by TLS only: list it under https");
    }
    return endpoint;
}

bool isLoopback(const std::string& address) {
    in_addr four{};
    if (::inet_pton(AF_INET, address.c_str(), &four) == 1) {
        constexpr unsigned topByte = 24;
        constexpr unsigned loopbackNetwork = 127;
        return ntohl(four.s_addr) >> topByte == loopbackNetwork;
    }
    in6_addr six{};
    return ::inet_pton(AF_INET6, address.c_str(), &six) == 1 && std::memcmp(&six, &in6addr_loopback, sizeof six) == 0;
}

std::string nameOf(http::Transport transport) {
    return transport == http::Transport::tls ? "https" : transport == http::Transport::tcp ? "http" : "local";
}

std::string toString(const http::Endpoint& endpoint) {
    if (endpoint.transport == http::Transport::local) {
        return endpoint.address;
    }
    const bool isSix = endpoint.address.find(':') != std::string::npos;
    return (isSix ? '[' + endpoint.address + ']' : endpoint.address) + ':' + std::to_string(endpoint.port);
}

std::vector<http::Endpoint> loopbackEndpoints(http::Transport transport) {
    const unsigned short port = transport == http::Transport::tls ? HttpsPort : HttpPort;
    std::vector<http::Endpoint> endpoints{{transport, "127.0.0.1", port}};
    if (tryToBind({transport, "::1", 0}) == 0) {
        endpoints.push_back({transport, "::1", port});
    }
    return endpoints;
}

bool isBusy(const http::Endpoint& endpoint) {
    return endpoint.transport == http::Transport::local ? answers(endpoint.address)
                                                        : tryToBind(endpoint) == EADDRINUSE;
}

} // namespace marlo::server
