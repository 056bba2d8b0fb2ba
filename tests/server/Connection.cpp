#include "tests/server/Connection.h"

#include <array>
#include <string_view>

#include <netinet/in.h>
#include <netinet/tcp.h>
#include <strings.h>
#include <sys/socket.h>
#include <sys/time.h>
#include <unistd.h>

namespace marlo::test {

namespace {

std::string base64(const std::string& text) {
    constexpr std::string_view digits = "ABCDEFGHIJKLMNOPQRSTUVWXYZabcdefghijklmnopqrstuvwxyz0123456789+/";
    std::string result;
    for (std::size_t i = 0; i < text.size(); i += 3) {
        unsigned group = 0;
        for (std::size_t j = 0; j < 3; ++j) {
            group = group << 8U | (i + j < text.size() ? static_cast<unsigned char>(text[i + j]) : 0U);
        }
        for (std::size_t j = 0; j < 4; ++j) {
            result += i + j <= text.size() ? digits[group >> (18 - 6 * j) & 63U] : '=';
        }
    }
    return result;
}

} // namespace

std::string fieldOf(const std::string& head, const std::string& name) {
    for (std::size_t line = head.find("\r\n"); line != std::string::npos; line = head.find("\r\n", line + 2)) {
        const std::size_t begin = line + 2;
        if (::strncasecmp(head.c_str() + begin, (name + ":").c_str(), name.size() + 1) == 0) {
            const std::size_t value = head.find_first_not_of(' ', begin + name.size() + 1);
            return head.substr(value, head.find("\r\n", value) - value);
        }
    }
    return "";
}

Connection::Connection(unsigned short port, const std::string& credentials)
    : _fd(::socket(AF_INET, SOCK_STREAM | SOCK_CLOEXEC, 0)), _authorization(base64(credentials)) {
    sockaddr_in address{};
    address.sin_family = AF_INET;
    address.sin_port = htons(port);
    address.sin_addr.s_addr = htonl(INADDR_LOOPBACK);
    const timeval patience{60, 0};
    ::setsockopt(_fd, SOL_SOCKET, SO_RCVTIMEO, &patience, sizeof patience);
    if (::connect(_fd, reinterpret_cast<const sockaddr*>(&address), sizeof address) != 0) {
        leave(false);
    }
}

Connection::~Connection() {
    leave(false);
}

void Connection::leave(bool rudely) {
    if (_fd >= 0) {
        const linger reset{1, 0};
        if (rudely) {
            ::setsockopt(_fd, SOL_SOCKET, SO_LINGER, &reset, sizeof reset);
        }
        ::close(_fd);
    }
    _fd = -1;
}

bool Connection::send(const std::string& bytes) const {
    return ::send(_fd, bytes.data(), bytes.size(), MSG_NOSIGNAL) == static_cast<ssize_t>(bytes.size());
}

HttpAnswer Connection::call(const std::string& method, const std::string& object, const std::string& body) {
    const std::string head = "POST /cimom HTTP/1.1\r\nHost: localhost\r\nAuthorization: Basic " + _authorization +
                             "\r\nContent-Type: application/xml; charset=utf-8\r\nCIMOperation: MethodCall\r\n"
                             "CIMMethod: " +
                             method + "\r\nCIMObject: " + object +
                             "\r\nContent-Length: " + std::to_string(body.size()) + "\r\n\r\n";
    return send(head + body) ? receive() : HttpAnswer{};
}

bool Connection::readMore() {
    std::array<char, 65536> bytes{};
    const ssize_t count = ::recv(_fd, bytes.data(), bytes.size(), 0);
    if (count <= 0) {
        return false;
    }
    _buffer.append(bytes.data(), static_cast<std::size_t>(count));
    return true;
}

bool Connection::readUntil(std::size_t length) {
    while (_buffer.size() < length) {
        if (!readMore()) {
            return false;
        }
    }
    return true;
}

std::string Connection::readChunks() {
    std::string body;
    for (;;) {
        std::size_t end = 0;
        while ((end = _buffer.find("\r\n")) == std::string::npos) {
            if (!readMore()) {
                return "";
            }
        }
        const std::size_t length = std::stoul(_buffer.substr(0, end), nullptr, 16);
        if (!readUntil(end + 2 + length + 2)) {
            return "";
        }
        body += _buffer.substr(end + 2, length);
        _buffer.erase(0, end + 2 + length + 2);
        if (length == 0) {
            return body;
        }
    }
}

HttpAnswer Connection::receive() {
    std::size_t end = 0;
    while ((end = _buffer.find("\r\n\r\n")) == std::string::npos) {
        if (!readMore()) {
            return {};
        }
    }
    HttpAnswer answer;
    answer.head = _buffer.substr(0, end + 2);
    _buffer.erase(0, end + 4);
    answer.status = static_cast<unsigned>(std::stoul(answer.head.substr(9, 3)));
    if (!fieldOf(answer.head, "Transfer-Encoding").empty()) {
        answer.body = readChunks();
        return answer;
    }
    const std::size_t length = std::stoul("0" + fieldOf(answer.head, "Content-Length"));
    if (!readUntil(length)) {
        return {};
    }
    answer.body = _buffer.substr(0, length);
    _buffer.erase(0, length);
    return answer;
}

} // namespace marlo::test
