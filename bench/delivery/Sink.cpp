#include "bench/delivery/Sink.h"

#include <array>
#include <stdexcept>
#include <string_view>

#include <arpa/inet.h>
#include <netinet/in.h>
#include <netinet/tcp.h>
#include <sys/socket.h>

namespace marlo::bench {
namespace {

constexpr std::string_view answer = "HTTP/1.1 200 OK\r\nContent-Length: 0\r\n\r\n";
constexpr std::string_view numberBegin = "NAME=\"SequenceNumber\" TYPE=\"sint64\"><VALUE>";
constexpr std::string_view lengthBegin = "Content-Length: ";

/** The length of the request that the text begins with; npos until its head is whole. */
std::size_t requestLength(const std::string& text) {
    const std::size_t end = text.find("\r\n\r\n");
    const std::size_t length = text.find(lengthBegin);
    if (end == std::string::npos || length > end) {
        return std::string::npos;
    }
    return end + 4 + std::stoul(text.substr(length + lengthBegin.size(), 20));
}

} // namespace

Sink::Sink() : _listening(::socket(AF_INET, SOCK_STREAM | SOCK_CLOEXEC, 0)) {
    sockaddr_in address{};
    address.sin_family = AF_INET;
    address.sin_addr.s_addr = htonl(INADDR_LOOPBACK);
    socklen_t size = sizeof(address);
    auto* generic = reinterpret_cast<sockaddr*>(&address);
    if (::bind(_listening.get(), generic, size) != 0 || ::listen(_listening.get(), 8) != 0 ||
        ::getsockname(_listening.get(), generic, &size) != 0) {
        throw std::runtime_error("no listening socket");
    }
    _port = ntohs(address.sin_port);
    _thread = std::thread([this] { listen(); });
}

Sink::~Sink() {
    {
        const std::lock_guard lock(_mutex);
        _isEnding = true;
        ::shutdown(_listening.get(), SHUT_RDWR);
        if (_connection >= 0) {
            ::shutdown(_connection, SHUT_RDWR);
        }
    }
    _thread.join();
}

void Sink::listen() {
    while (true) {
        const http::Descriptor connection(::accept4(_listening.get(), nullptr, nullptr, SOCK_CLOEXEC));
        {
            const std::lock_guard lock(_mutex);
            if (_isEnding) {
                return;
            }
            _connection = connection.get();
        }
        const int on = 1;
        ::setsockopt(connection.get(), IPPROTO_TCP, TCP_NODELAY, &on, sizeof(on));
        serve(connection.get());
        const std::lock_guard lock(_mutex);
        _connection = -1;
    }
}

void Sink::serve(int descriptor) {
    std::array<char, 65536> buffer{};
    std::string text;
    while (true) {
        const ssize_t count = ::recv(descriptor, buffer.data(), buffer.size(), 0);
        if (count <= 0) {
            return;
        }
        text.append(buffer.data(), static_cast<std::size_t>(count));
        if (const std::size_t length = requestLength(text); text.size() >= length) {
            note(text);
            text.erase(0, length);
            ::send(descriptor, answer.data(), answer.size(), MSG_NOSIGNAL);
        }
    }
}

void Sink::note(const std::string& body) {
    const std::size_t place = body.rfind(numberBegin);
    if (place == std::string::npos) {
        return;
    }
    const auto now = Clock::now();
    const std::lock_guard lock(_mutex);
    _arrivals.emplace(std::stoll(body.substr(place + numberBegin.size(), 20)), now);
    _came.notify_all();
}

Clock::time_point Sink::arrivalOf(std::int64_t number) {
    std::unique_lock lock(_mutex);
    if (!_came.wait_for(lock, std::chrono::minutes(1), [&] { return _arrivals.contains(number); })) {
        throw std::runtime_error("indication " + std::to_string(number) + " did not come");
    }
    return _arrivals.at(number);
}

} // namespace marlo::bench
