#include "tests/delivery/Listener.h"

#include <algorithm>
#include <array>
#include <atomic>
#include <cerrno>
#include <csignal>
#include <stdexcept>

#include <arpa/inet.h>
#include <netinet/in.h>
#include <netinet/tcp.h>
#include <openssl/ssl.h>
#include <sys/socket.h>

namespace marlo::delivery {

/** A connection, with TLS or without. */
class Listener::Stream {
  public:
    Stream(int descriptor, SSL_CTX* tls) : _descriptor(descriptor) {
        if (tls != nullptr) {
            _ssl.reset(SSL_new(tls));
            SSL_set_fd(_ssl.get(), descriptor);
        }
    }

    bool handshake() { return !_ssl || SSL_accept(_ssl.get()) == 1; }

    /** Appends what has come; false when nothing will. */
    bool read(std::string& text) {
        std::array<char, 65536> buffer{};
        const auto count = _ssl ? static_cast<ssize_t>(SSL_read(_ssl.get(), buffer.data(), buffer.size()))
                                : ::recv(_descriptor, buffer.data(), buffer.size(), 0);
        text.append(buffer.data(), count > 0 ? static_cast<std::size_t>(count) : 0);
        return count > 0;
    }

    bool write(std::string_view text) {
        if (_ssl) {
            return text.empty() || SSL_write(_ssl.get(), text.data(), static_cast<int>(text.size())) > 0;
        }
        return ::send(_descriptor, text.data(), text.size(), MSG_NOSIGNAL) == static_cast<ssize_t>(text.size());
    }

  private:
    struct Free {
        void operator()(SSL* ssl) const { SSL_free(ssl); }
    };

    int _descriptor;
    std::unique_ptr<SSL, Free> _ssl;
};

namespace {

/** The number behind a name in a head; 0 where there is none. */
std::size_t lengthOf(const std::string& head) {
    const std::size_t place = head.find("Content-Length: ");
    return place == std::string::npos ? 0 : std::stoul(head.substr(place + 16));
}

std::shared_ptr<SSL_CTX> makeTls(const Listener::Identity& identity) {
    if (identity.certificateFile.empty()) {
        return nullptr;
    }
    std::shared_ptr<SSL_CTX> context(SSL_CTX_new(TLS_server_method()), SSL_CTX_free);
    if (SSL_CTX_use_certificate_chain_file(context.get(), identity.certificateFile.c_str()) != 1 ||
        SSL_CTX_use_PrivateKey_file(context.get(), identity.keyFile.c_str(), SSL_FILETYPE_PEM) != 1) {
        throw std::runtime_error("no identity " + identity.certificateFile);
    }
    return context;
}

} // namespace

std::string Listener::Received::property(const std::string& name) const {
    const std::size_t place = body.find("NAME=\"" + name + "\"");
    const std::size_t begin = place == std::string::npos ? place : body.find("<VALUE>", place);
    return begin == std::string::npos ? "" : body.substr(begin + 7, body.find("</VALUE>", begin) - begin - 7);
}

Listener::Listener(React react, const Identity& identity, bool isEverywhere)
    : _tls(makeTls(identity)), _isEverywhere(isEverywhere), _react(std::move(react)) {
    start();
}

Listener::~Listener() {
    stop();
}

std::string Listener::url(const std::string& host) const {
    return (_tls ? "https://" : "http://") + host + ":" + std::to_string(_port) + "/listen?to=me";
}

void Listener::start() {
    _isStopping = false;
    _listening = http::Descriptor(::socket(AF_INET, SOCK_STREAM | SOCK_CLOEXEC, 0));
    const int on = 1;
    ::setsockopt(_listening.get(), SOL_SOCKET, SO_REUSEADDR, &on, sizeof(on));
    sockaddr_in address{};
    address.sin_family = AF_INET;
    address.sin_port = htons(_port);
    address.sin_addr.s_addr = htonl(_isEverywhere ? INADDR_ANY : INADDR_LOOPBACK);
    socklen_t size = sizeof(address);
    auto* generic = reinterpret_cast<sockaddr*>(&address);
    if (::bind(_listening.get(), generic, size) != 0 || ::listen(_listening.get(), 128) != 0 ||
        ::getsockname(_listening.get(), generic, &size) != 0) {
        throw std::runtime_error("no listening socket");
    }
    _port = ntohs(address.sin_port);
    _acceptor = std::thread([this] { listen(); });
}

void Listener::stop() {
    std::vector<std::thread> threads;
    {
        const std::lock_guard lock(_mutex);
        if (_isStopping) {
            return;
        }
        _isStopping = true;
        ::shutdown(_listening.get(), SHUT_RDWR);
        for (const int descriptor : _open) {
            ::shutdown(descriptor, SHUT_RDWR);
        }
        _came.notify_all();
    }
    _acceptor.join();
    _listening = http::Descriptor();
    {
        const std::lock_guard lock(_mutex);
        threads.swap(_threads);
    }
    for (std::thread& thread : threads) {
        thread.join();
    }
}

void Listener::setReaction(React react) {
    const std::lock_guard lock(_mutex);
    _react = std::move(react);
}

void Listener::listen() {
    while (true) {
        http::Descriptor descriptor(::accept4(_listening.get(), nullptr, nullptr, SOCK_CLOEXEC));
        const std::lock_guard lock(_mutex);
        if (_isStopping) {
            return;
        }
        if (descriptor.get() < 0) {
            continue;
        }
        const int on = 1;
        ::setsockopt(descriptor.get(), IPPROTO_TCP, TCP_NODELAY, &on, sizeof(on));
        _open.push_back(descriptor.get());
        _threads.emplace_back(
            [this, connection = ++_connections, moved = std::make_shared<http::Descriptor>(std::move(descriptor))] {
                serve(std::move(*moved), connection);
            });
    }
}

/** TLS writes to peers that are gone as well: that must not end the process. */
void Listener::serve(http::Descriptor descriptor, int connection) {
    sigset_t signals;
    ::sigemptyset(&signals);
    ::sigaddset(&signals, SIGPIPE);
    ::pthread_sigmask(SIG_BLOCK, &signals, nullptr);
    Stream stream(descriptor.get(), _tls.get());
    bool goesOn = stream.handshake();
    while (goesOn) {
        Received received;
        received.connection = connection;
        if (!receive(stream, received)) {
            break;
        }
        React react;
        {
            const std::lock_guard lock(_mutex);
            react = _react;
            _received.push_back(received);
            _came.notify_all();
        }
        goesOn = send(stream, react(received));
    }
    const std::lock_guard lock(_mutex);
    std::erase(_open, descriptor.get());
}

bool Listener::receive(Stream& stream, Received& received) {
    std::string text;
    std::size_t end = std::string::npos;
    while ((end = text.find("\r\n\r\n")) == std::string::npos || text.size() < end + 4 + lengthOf(text)) {
        if (!stream.read(text)) {
            return false;
        }
    }
    received.time = std::chrono::steady_clock::now();
    received.head = text.substr(0, end + 4);
    received.body = text.substr(end + 4);
    received.context = received.property("SequenceContext");
    const std::string number = received.property("SequenceNumber");
    received.number = number.empty() ? -1 : std::stoll(number);
    return true;
}

bool Listener::send(Stream& stream, const Reaction& reaction) {
    if (reaction.delay.count() != 0) {
        std::unique_lock lock(_mutex);
        _came.wait_for(lock, reaction.delay, [this] { return _isStopping; });
    }
    if (reaction.pace.count() == 0) {
        return stream.write(reaction.bytes) && !reaction.ends;
    }
    for (const char& byte : reaction.bytes) {
        if (!stream.write({&byte, 1})) {
            return false;
        }
        std::this_thread::sleep_for(reaction.pace);
    }
    return !reaction.ends;
}

std::vector<Listener::Received> Listener::received() const {
    const std::lock_guard lock(_mutex);
    return _received;
}

std::vector<std::int64_t> Listener::numbers() const {
    const std::lock_guard lock(_mutex);
    std::vector<std::int64_t> numbers;
    std::ranges::transform(_received, std::back_inserter(numbers), &Received::number);
    return numbers;
}

bool Listener::await(std::size_t count, std::chrono::milliseconds patience) const {
    std::unique_lock lock(_mutex);
    return _came.wait_for(lock, patience, [&] { return _received.size() >= count; });
}

int Listener::connections() const {
    const std::lock_guard lock(_mutex);
    return _connections;
}

Listener::Reaction Listener::answer(unsigned status, const std::string& body, const std::string& fields) {
    return {"HTTP/1.1 " + std::to_string(status) + " Said\r\nContent-Type: application/xml\r\n" + fields +
                "Content-Length: " + std::to_string(body.size()) + "\r\n\r\n" + body,
            false,
            {},
            {}};
}

namespace {

std::string response(const std::string& within) {
    return "<?xml version=\"1.0\" encoding=\"utf-8\"?><CIM CIMVERSION=\"2.0\" DTDVERSION=\"2.0\"><MESSAGE ID=\"1\" "
           "PROTOCOLVERSION=\"1.0\"><SIMPLEEXPRSP><EXPMETHODRESPONSE NAME=\"ExportIndication\">" +
           within + "</EXPMETHODRESPONSE></SIMPLEEXPRSP></MESSAGE></CIM>";
}

} // namespace

Listener::Reaction Listener::accept(const Received& /*received*/) {
    return answer(200, response("<IRETURNVALUE/>"));
}

Listener::Reaction Listener::refuse(const Received& /*received*/) {
    return answer(200, response("<ERROR CODE=\"1\" DESCRIPTION=\"the queue is full\"/>"));
}

} // namespace marlo::delivery
