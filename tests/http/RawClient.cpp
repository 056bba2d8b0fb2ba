#include "tests/http/RawClient.h"

#include "host/http/FieldText.h"

#include <array>
#include <cerrno>
#include <cstring>
#include <stdexcept>
#include <system_error>

#include <arpa/inet.h>
#include <netinet/in.h>
#include <poll.h>
#include <sys/socket.h>
#include <sys/un.h>

namespace marlo::http {
namespace {

constexpr std::chrono::milliseconds patienceOfTests{20000};

bool waitFor(int descriptor, short events, std::chrono::milliseconds patience) {
    pollfd waited{descriptor, events, 0};
    return ::poll(&waited, 1, static_cast<int>(patience.count())) > 0;
}

} // namespace

std::string RawClient::Reading::field(const std::string& name) const {
    std::size_t start = head.find("\r\n") + 2;
    while (start < head.size()) {
        const std::size_t end = head.find("\r\n", start);
        const std::string line = head.substr(start, end - start);
        const std::size_t colon = line.find(':');
        if (colon != std::string::npos && equalsIgnoringCase(line.substr(0, colon), name)) {
            return std::string(trimmed(std::string_view(line).substr(colon + 1)));
        }
        start = end + 2;
    }
    return {};
}

RawClient RawClient::connectTo(const Endpoint& endpoint) {
    sockaddr_storage storage{};
    socklen_t size = 0;
    if (endpoint.transport == Transport::local) {
        auto& local = reinterpret_cast<sockaddr_un&>(storage);
        local.sun_family = AF_UNIX;
        std::strncpy(local.sun_path, endpoint.address.c_str(), sizeof(local.sun_path) - 1);
        size = sizeof(local);
    } else if (endpoint.address.find(':') != std::string::npos) {
        auto& six = reinterpret_cast<sockaddr_in6&>(storage);
        six.sin6_family = AF_INET6;
        six.sin6_port = htons(endpoint.port);
        ::inet_pton(AF_INET6, endpoint.address.c_str(), &six.sin6_addr);
        size = sizeof(six);
    } else {
        auto& four = reinterpret_cast<sockaddr_in&>(storage);
        four.sin_family = AF_INET;
        four.sin_port = htons(endpoint.port);
        ::inet_pton(AF_INET, endpoint.address.c_str(), &four.sin_addr);
        size = sizeof(four);
    }
    Descriptor made(::socket(storage.ss_family, SOCK_STREAM | SOCK_CLOEXEC, 0));
    if (::connect(made.get(), reinterpret_cast<sockaddr*>(&storage), size) != 0) {
        return RawClient(Descriptor());
    }
    return RawClient(std::move(made));
}

RawClient RawClient::servedBy(Server& server) {
    std::array<int, 2> ends{};
    if (::socketpair(AF_UNIX, SOCK_STREAM | SOCK_CLOEXEC, 0, ends.data()) != 0) {
        throw std::system_error(errno, std::generic_category(), "socketpair");
    }
    server.serve(ends[0], {Transport::local, "test", 0, std::nullopt, std::nullopt});
    return RawClient(Descriptor(ends[1]));
}

bool RawClient::send(std::string_view bytes) {
    while (!bytes.empty()) {
        const ssize_t sent = ::send(_descriptor.get(), bytes.data(), bytes.size(), MSG_NOSIGNAL | MSG_DONTWAIT);
        if (sent >= 0) {
            bytes.remove_prefix(static_cast<std::size_t>(sent));
        } else if (errno != EAGAIN || !waitFor(_descriptor.get(), POLLOUT, patienceOfTests)) {
            return false;
        }
    }
    return true;
}

bool RawClient::readMore(std::chrono::milliseconds patience) {
    if (!waitFor(_descriptor.get(), POLLIN, patience)) {
        return false;
    }
    std::array<char, 65536> bytes{};
    const ssize_t count = ::recv(_descriptor.get(), bytes.data(), bytes.size(), 0);
    _wasReset = count < 0 && errno == ECONNRESET;
    if (count <= 0) {
        return false;
    }
    _text.append(bytes.data(), static_cast<std::size_t>(count));
    return true;
}

std::size_t RawClient::readUntil(std::string_view mark, std::size_t from) {
    std::size_t found = _text.find(mark, from);
    while (found == std::string::npos && readMore(patienceOfTests)) {
        found = _text.find(mark, from);
    }
    return found;
}

bool RawClient::readChunks(Reading& reading) {
    while (true) {
        const std::size_t end = readUntil("\r\n", 0);
        if (end == std::string::npos) {
            return false;
        }
        const std::size_t size = std::stoul(_text, nullptr, 16);
        _text.erase(0, end + 2);
        if (size == 0) {
            break;
        }
        while (_text.size() < size + 2) {
            if (!readMore(patienceOfTests)) {
                return false;
            }
        }
        reading.body += _text.substr(0, size);
        _text.erase(0, size + 2);
    }
    std::string line;
    do {
        const std::size_t end = readUntil("\r\n", 0);
        if (end == std::string::npos) {
            return false;
        }
        line = _text.substr(0, end);
        reading.trailers += line.empty() ? "" : line + "\n";
        _text.erase(0, end + 2);
    } while (!line.empty());
    return true;
}

RawClient::Reading RawClient::readAnswer(bool toHead) {
    Reading reading;
    const std::size_t end = readUntil("\r\n\r\n", 0);
    if (end == std::string::npos || !_text.starts_with("HTTP/1.1 ")) {
        return reading;
    }
    reading.head = _text.substr(0, end + 4);
    _text.erase(0, end + 4);
    reading.status = static_cast<unsigned>(std::stoul(reading.head.substr(9, 3)));
    if (toHead || reading.status < 200 || reading.status == 204) {
        reading.isWhole = true;
    } else if (reading.field("Transfer-Encoding") == "chunked") {
        reading.isWhole = readChunks(reading);
    } else if (const std::string length = reading.field("Content-Length"); !length.empty()) {
        const std::size_t size = std::stoul(length);
        while (_text.size() < size && readMore(patienceOfTests)) {
        }
        reading.isWhole = _text.size() >= size;
        reading.body = _text.substr(0, size);
        _text.erase(0, size);
    } else {
        reading.body = readToEnd();
        reading.isWhole = !_wasReset;
    }
    return reading;
}

std::string RawClient::readToEnd() {
    while (readMore(patienceOfTests)) {
    }
    return std::exchange(_text, {});
}

std::string RawClient::readSome(std::chrono::milliseconds patience) {
    if (_text.empty()) {
        readMore(patience);
    }
    return std::exchange(_text, {});
}

bool RawClient::isEndedWithin(std::chrono::milliseconds patience) {
    if (!_text.empty() || !waitFor(_descriptor.get(), POLLIN, patience)) {
        return false;
    }
    char byte = 0;
    const ssize_t count = ::recv(_descriptor.get(), &byte, 1, 0);
    _wasReset = count < 0;
    return count <= 0;
}

void RawClient::shutDown() {
    ::shutdown(_descriptor.get(), SHUT_WR);
}

void RawClient::vanish() {
    const linger atOnce{1, 0};
    ::setsockopt(_descriptor.get(), SOL_SOCKET, SO_LINGER, &atOnce, sizeof(atOnce));
    close();
}

} // namespace marlo::http
