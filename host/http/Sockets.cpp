#include "host/http/Sockets.h"

#include <array>
#include <cerrno>
#include <cstring>
#include <stdexcept>
#include <system_error>

#include <arpa/inet.h>
#include <linux/sockios.h>
#include <netinet/in.h>
#include <netinet/tcp.h>
#include <sys/ioctl.h>
#include <sys/stat.h>
#include <sys/un.h>

namespace marlo::http {
namespace {

/** An address of any family, as the system calls take it. */
struct Address {
    sockaddr_storage storage{};
    socklen_t length = 0;

    [[nodiscard]] const sockaddr* get() const { return reinterpret_cast<const sockaddr*>(&storage); } // NOLINT: POSIX
};

/** The system's structures of addresses are one another's beginnings. */
template <typename Structure>
Structure& as(sockaddr_storage& storage) {
    return reinterpret_cast<Structure&>(storage); // NOLINT: as POSIX means it
}

template <typename Structure>
const Structure& as(const sockaddr_storage& storage) {
    return reinterpret_cast<const Structure&>(storage); // NOLINT: as POSIX means it
}

[[noreturn]] void fail(const Endpoint& endpoint, const std::string& reason) {
    throw std::runtime_error("cannot listen on " + toString(endpoint) + ": " + reason);
}

[[noreturn]] void failWithError(const Endpoint& endpoint) {
    fail(endpoint, std::generic_category().message(errno));
}

void setOption(int descriptor, int level, int name, int value) {
    ::setsockopt(descriptor, level, name, &value, sizeof(value));
}

Address internetAddress(const Endpoint& endpoint) {
    Address address;
    auto& four = as<sockaddr_in>(address.storage);
    auto& six = as<sockaddr_in6>(address.storage);
    if (::inet_pton(AF_INET, endpoint.address.c_str(), &four.sin_addr) == 1) {
        four.sin_family = AF_INET;
        four.sin_port = htons(endpoint.port);
        address.length = sizeof(sockaddr_in);
    } else if (::inet_pton(AF_INET6, endpoint.address.c_str(), &six.sin6_addr) == 1) {
        six.sin6_family = AF_INET6;
        six.sin6_port = htons(endpoint.port);
        address.length = sizeof(sockaddr_in6);
    } else {
        fail(endpoint, "not a numeric address");
    }
    return address;
}

Address localAddress(const Endpoint& endpoint) {
    Address address;
    auto& local = as<sockaddr_un>(address.storage);
    if (endpoint.address.empty() || endpoint.address.size() >= sizeof(local.sun_path)) {
        fail(endpoint, "a path has between 1 and " + std::to_string(sizeof(local.sun_path) - 1) + " bytes");
    }
    local.sun_family = AF_UNIX;
    std::memcpy(local.sun_path, endpoint.address.data(), endpoint.address.size());
    address.length = sizeof(sockaddr_un);
    return address;
}

Descriptor makeSocket(const Endpoint& endpoint, int family) {
    Descriptor made(::socket(family, SOCK_STREAM | SOCK_NONBLOCK | SOCK_CLOEXEC, 0));
    if (made.get() < 0) {
        failWithError(endpoint);
    }
    return made;
}

/** Whoever ended without removing its socket leaves a file that only stands in the way. */
void removeStale(const Endpoint& endpoint, const Address& address) {
    struct stat file {};

    if (::lstat(endpoint.address.c_str(), &file) != 0) {
        return;
    }
    if (!S_ISSOCK(file.st_mode)) {
        fail(endpoint, "there is a file that is no socket");
    }
    const Descriptor probe = makeSocket(endpoint, AF_UNIX);
    if (::connect(probe.get(), address.get(), address.length) == 0 || errno != ECONNREFUSED) {
        fail(endpoint, "somebody listens there already");
    }
    ::unlink(endpoint.address.c_str());
}

void bindAndListen(const Endpoint& endpoint, int descriptor, const Address& address) {
    if (::bind(descriptor, address.get(), address.length) != 0 || ::listen(descriptor, SOMAXCONN) != 0) {
        failWithError(endpoint);
    }
}

Descriptor listenLocally(const Endpoint& endpoint) {
    const Address address = localAddress(endpoint);
    removeStale(endpoint, address);
    Descriptor made = makeSocket(endpoint, AF_UNIX);
    bindAndListen(endpoint, made.get(), address);
    if (::chmod(endpoint.address.c_str(), endpoint.mode) != 0) {
        failWithError(endpoint);
    }
    return made;
}

Peer localPeer(int descriptor) {
    Peer peer{Transport::local, "local", 0, std::nullopt, std::nullopt};
    ucred credentials{};
    socklen_t size = sizeof(credentials);
    if (::getsockopt(descriptor, SOL_SOCKET, SO_PEERCRED, &credentials, &size) == 0) {
        peer.userId = credentials.uid;
    }
    return peer;
}

} // namespace

std::string toString(const Endpoint& endpoint) {
    if (endpoint.transport == Transport::local) {
        return endpoint.address;
    }
    const Peer peer{endpoint.transport, endpoint.address, endpoint.port, std::nullopt, std::nullopt};
    return peer.toString();
}

Descriptor listenOn(const Endpoint& endpoint) {
    if (endpoint.transport == Transport::local) {
        return listenLocally(endpoint);
    }
    const Address address = internetAddress(endpoint);
    const int family = address.storage.ss_family;
    Descriptor made = makeSocket(endpoint, family);
    setOption(made.get(), SOL_SOCKET, SO_REUSEADDR, 1);
    if (family == AF_INET6) { // so that no client of IPv4 comes under an address of IPv6
        setOption(made.get(), IPPROTO_IPV6, IPV6_V6ONLY, 1);
    }
    bindAndListen(endpoint, made.get(), address);
    return made;
}

unsigned short portOf(int descriptor) {
    sockaddr_storage storage{};
    socklen_t size = sizeof(storage);
    ::getsockname(descriptor, reinterpret_cast<sockaddr*>(&storage), &size); // NOLINT: as POSIX means it
    return static_cast<unsigned short>(peerOf(descriptor, storage, Transport::tcp).port);
}

Peer peerOf(int descriptor, const sockaddr_storage& address, Transport transport) {
    if (transport == Transport::local) {
        return localPeer(descriptor);
    }
    Peer peer{transport, "", 0, std::nullopt, std::nullopt};
    std::array<char, INET6_ADDRSTRLEN> text{};
    if (address.ss_family == AF_INET) {
        const auto& four = as<sockaddr_in>(address);
        ::inet_ntop(AF_INET, &four.sin_addr, text.data(), text.size());
        peer.port = ntohs(four.sin_port);
    } else if (address.ss_family == AF_INET6) {
        const auto& six = as<sockaddr_in6>(address);
        ::inet_ntop(AF_INET6, &six.sin6_addr, text.data(), text.size());
        peer.port = ntohs(six.sin6_port);
    }
    peer.address = text.data();
    return peer;
}

std::size_t untaken(int descriptor) {
    int bytes = 0;
    return ::ioctl(descriptor, SIOCOUTQ, &bytes) == 0 && bytes > 0 ? static_cast<std::size_t>(bytes) : 0;
}

void sendAtOnce(int descriptor) {
    setOption(descriptor, IPPROTO_TCP, TCP_NODELAY, 1);
}

void acknowledgeAtOnce(int descriptor) {
    setOption(descriptor, IPPROTO_TCP, TCP_QUICKACK, 1);
}

} // namespace marlo::http
