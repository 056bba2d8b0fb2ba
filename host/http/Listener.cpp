#include "host/http/Listener.h"

#include "host/http/Sockets.h"

#include <cerrno>
#include <system_error>
#include <utility>

#include <sys/socket.h>
#include <sys/stat.h>

namespace marlo::http {
namespace {

/** Others of the loop are to have their turn between so many connections. */
constexpr int atOnce = 32;
/** How long nothing is accepted when the system has no descriptor or memory left. */
constexpr std::chrono::milliseconds pauseTime{50};

bool isShortage(int error) {
    return error == EMFILE || error == ENFILE || error == ENOBUFS || error == ENOMEM;
}

} // namespace

Listener::Listener(Site& site, Loop& loop, const Endpoint& endpoint, Adopt adopt)
    : _site(site), _endpoint(endpoint), _adopt(std::move(adopt)), _readiness(loop, listenOn(endpoint)), _timer(loop) {
    if (_endpoint.transport != Transport::local) {
        _endpoint.port = portOf(_readiness.descriptor());
        return;
    }

    struct stat file {};

    if (::stat(_endpoint.address.c_str(), &file) == 0) {
        _device = file.st_dev;
        _inode = file.st_ino;
    }
}

Listener::~Listener() {
    removeSocketFile();
}

void Listener::start() {
    _readiness.awaitReadable(shared_from_this());
}

void Listener::onReady() {
    if (_readiness.descriptor() < 0) {
        return;
    }
    for (int count = 0; count < atOnce; ++count) {
        if (!acceptOne()) {
            break;
        }
    }
    if (!_isPaused) {
        _readiness.awaitReadable(shared_from_this());
    }
}

bool Listener::acceptOne() {
    sockaddr_storage address{};
    socklen_t size = sizeof(address);
    Descriptor accepted(::accept4(_readiness.descriptor(), reinterpret_cast<sockaddr*>(&address), // NOLINT: POSIX
                                  &size, SOCK_NONBLOCK | SOCK_CLOEXEC));
    if (accepted.get() < 0) {
        if (isShortage(errno)) {
            pause(errno);
        }
        return errno != EAGAIN && !_isPaused; // anything else befell one connection, which is gone
    }
    if (std::exchange(_isPaused, false)) {
        _site.log("accepting connections again on " + toString(_endpoint));
    }
    ++_site.accepted;
    Peer peer = peerOf(accepted.get(), address, _endpoint.transport);
    _adopt(std::move(accepted), std::move(peer));
    return true;
}

/** Those who wait stay in the socket's backlog. */
void Listener::pause(int error) {
    if (!std::exchange(_isPaused, true)) {
        _site.log("no connections are accepted on " + toString(_endpoint) +
                  " for now: " + std::generic_category().message(error));
    }
    _timer.after(pauseTime, [self = weak_from_this()] {
        if (const auto listener = self.lock()) {
            listener->onReady();
        }
    });
}

void Listener::removeSocketFile() {
    struct stat file {};

    const ino_t own = std::exchange(_inode, 0);
    if (own != 0 && ::lstat(_endpoint.address.c_str(), &file) == 0 && file.st_ino == own && file.st_dev == _device) {
        ::unlink(_endpoint.address.c_str());
    }
}

void Listener::close() {
    _readiness.close();
    removeSocketFile();
}

} // namespace marlo::http
