#include "host/http/Connection.h"

#include "host/http/Roster.h"
#include "host/http/Sockets.h"

#include <algorithm>
#include <cerrno>
#include <utility>

#include <sys/socket.h>

namespace marlo::http {
namespace {

using std::chrono::milliseconds;

constexpr milliseconds never{-1};
/** Of a refused request, what is read so that its sender comes to see why. */
constexpr std::size_t mostDiscarded = std::size_t{64} * 1024 * 1024;
/** When the server stops, those whose last answer has been sent do not use up its patience. */
constexpr milliseconds lingerAtEnd{500};
/** An idle connection keeps no more than this of its memory. */
constexpr std::size_t keptCapacity = std::size_t{4} * 1024;

} // namespace

Connection::Connection(Site& site, Loop& loop, Roster& roster, Descriptor descriptor, std::unique_ptr<Stream> stream,
                       Peer peer, Seats::Seat seat)
    : _site(site),
      _loop(loop),
      _roster(roster),
      _readiness(loop, std::move(descriptor)),
      _stream(std::move(stream)),
      _peer(std::move(peer)),
      _seat(std::move(seat)),
      _parser(site.limits.headBytes) {}

void Connection::start() {
    if (_peer.transport == Transport::tls) {
        enter(State::handshake, _site.limits.headTime);
        shakeHands();
        return;
    }
    enter(State::idle, _site.limits.idleTime);
    awaitInput();
}

void Connection::enter(State state, milliseconds time) {
    _state = state;
    _deadline = time == never ? Clock::time_point::max() : Clock::now() + time;
}

/** TLS may have decrypted more than was asked for: nothing on the descriptor would tell. */
void Connection::awaitInput() {
    if (_state != State::idle && _peer.transport != Transport::local) {
        acknowledgeAtOnce(_readiness.descriptor());
    }
    if (_stream->hasPending()) {
        _loop.post([self = shared_from_this()] { self->onReady(); });
    } else {
        _readiness.awaitReadable(shared_from_this());
    }
}

void Connection::onReady() {
    switch (_state) {
    case State::handshake:
        shakeHands();
        break;
    case State::idle:
    case State::head:
    case State::body:
    case State::draining:
        if (receive()) {
            proceed();
        }
        break;
    case State::sending:
        sendRest();
        break;
    case State::lingering:
        discard();
        break;
    case State::handling:
    case State::postponed:
    case State::delayed:
    case State::closed:
        break;
    }
}

void Connection::shakeHands() {
    switch (_stream->handshake()) {
    case Progress::done:
        _peer.commonName = _stream->commonName();
        enter(State::idle, _site.limits.idleTime);
        awaitInput();
        break;
    case Progress::wantRead:
        _readiness.awaitReadable(shared_from_this());
        break;
    case Progress::wantWrite:
        _readiness.awaitWritable(shared_from_this());
        break;
    case Progress::ended:
    case Progress::failed:
        if (const std::string problem = _stream->problem(); !problem.empty()) {
            _site.log("TLS with " + _peer.toString() + ": " + problem);
        }
        close();
        break;
    }
}

bool Connection::receive() {
    const auto scratch = _loop.scratch();
    const Transfer transfer = _stream->read(scratch.data(), scratch.size());
    switch (transfer.progress) {
    case Progress::done:
        _input.append(scratch.data(), transfer.bytes);
        return true;
    case Progress::wantRead:
        _readiness.awaitReadable(shared_from_this());
        return false;
    case Progress::wantWrite:
        _readiness.awaitWritable(shared_from_this());
        return false;
    case Progress::ended:
        _stream->finish();
        close();
        return false;
    case Progress::failed:
        close();
        return false;
    }
    return false;
}

/** Uses what came. */
void Connection::proceed() {
    try {
        if (_state == State::idle && !_input.empty()) {
            enter(State::head, _site.limits.headTime);
        }
        if (_state == State::head) {
            readHead();
        } else if (_state == State::body) {
            readBody();
        } else if (_state == State::draining) {
            drain();
        } else {
            awaitInput();
        }
    } catch (const Fault& fault) {
        if (_state == State::draining) { // whose answer has been given
            linger();
        } else {
            refuse(fault.status(), fault.what());
        }
    }
}

void Connection::readHead() {
    _input.erase(0, _parser.readHead(_input));
    if (_parser.hasHead()) {
        _id = ++_site.requests;
        submit();
    } else {
        if (_input.empty()) {
            _state = State::idle; // an empty line is no request; its time goes on
        }
        awaitInput();
    }
}

void Connection::readBody() {
    _input.erase(0, _parser.readBody(_input, _body, _site.limits.bodyBytes));
    if (_parser.isDone()) {
        submit();
    } else {
        awaitInput();
    }
}

void Connection::drain() {
    std::string unread;
    _input.erase(0, _parser.readBody(_input, unread, _site.limits.drained));
    if (_parser.isDone()) {
        nextRequest();
    } else {
        awaitInput();
    }
}

void Connection::submit() {
    enter(State::handling, never);
    if (!_site.workers.submit(shared_from_this())) {
        refuse(503, "too many requests are being answered");
    }
}

void Connection::answered() {
    if (_mustReset) {
        reset();
    } else if (!_keepsAlive) {
        linger();
    } else if (!_parser.isDone()) {
        enter(State::draining, _site.limits.bodyTime);
        proceed();
    } else {
        nextRequest();
    }
}

void Connection::nextRequest() {
    _parser.reset();
    _body = std::string();
    _admission.reset();
    _isAdmitted = false;
    _lastAdmission = Clock::time_point::max();
    if (_input.empty() && _input.capacity() > keptCapacity) {
        _input.shrink_to_fit();
    }
    if (_site.isStopping) {
        linger();
        return;
    }
    enter(State::idle, _site.limits.idleTime);
    proceed();
}

void Connection::beginSending() {
    enter(State::sending, never);
    _uptake.emplace(_readiness.descriptor(), Pace(_site.limits.sendTime, _site.limits.sendRate));
    _watched = Clock::now();
}

void Connection::watchSending(Clock::time_point now) {
    _uptake->waited(now - std::exchange(_watched, now));
    if (_uptake->isTooSlow()) {
        ++_site.tooSlow;
        _site.log("dropped " + _peer.toString() + ": it took its answer too slowly");
        reset();
    }
}

void Connection::sendRest() {
    while (_sent < _output.size()) {
        const Transfer transfer = _stream->write(std::string_view(_output).substr(_sent));
        _sent += transfer.bytes;
        _uptake->wrote(transfer.bytes);
        if (transfer.progress == Progress::wantWrite) {
            _readiness.awaitWritable(shared_from_this());
            return;
        }
        if (transfer.progress == Progress::wantRead) {
            _readiness.awaitReadable(shared_from_this());
            return;
        }
        if (transfer.progress != Progress::done) {
            reset();
            return;
        }
    }
    _output = std::string();
    answered();
}

/**
 * Closing a socket with unread input resets the connection, and the last answer may be lost on its way: sending ends,
 * and the rest of what the client sends is read until it ends as well.
 */
void Connection::linger() {
    _stream->finish();
    _input.clear();
    enter(State::lingering,
          _site.isStopping ? std::min(_site.limits.lingerTime, lingerAtEnd) : _site.limits.lingerTime);
    discard();
}

void Connection::discard() {
    const auto scratch = _loop.scratch();
    while (true) {
        const ssize_t count = ::recv(_readiness.descriptor(), scratch.data(), scratch.size(), MSG_DONTWAIT);
        if (count < 0 && (errno == EAGAIN || errno == EINTR)) {
            _readiness.awaitReadable(shared_from_this());
            return;
        }
        _discarded += count > 0 ? static_cast<std::size_t>(count) : 0;
        if (count <= 0 || _discarded > mostDiscarded) {
            close();
            return;
        }
    }
}

void Connection::tick(Clock::time_point now) {
    if (_state == State::sending) {
        watchSending(now);
    }
    if (now < _deadline) {
        return;
    }
    switch (_state) {
    case State::head:
    case State::body:
        refuse(408, "the request did not come in time");
        break;
    case State::delayed:
        beginSending();
        sendRest();
        break;
    case State::postponed:
        submit();
        break;
    case State::idle:
        _stream->finish();
        close();
        break;
    default:
        close();
        break;
    }
}

void Connection::endIfIdle() {
    switch (_state) {
    case State::handshake:
    case State::idle:
    case State::head:
    case State::body:
    case State::draining:
        _stream->finish();
        close();
        break;
    default:
        break;
    }
}

void Connection::cut() {
    _isCut = true;
    if (_state == State::handling) {
        ::shutdown(_readiness.descriptor(), SHUT_RDWR);
    } else {
        close();
    }
}

void Connection::close() {
    if (_state == State::closed) {
        return;
    }
    enter(State::closed, never);
    const auto self = shared_from_this(); // the roster may have been the last to hold it
    _readiness.close();
    _roster.remove(self);
    _seat.reset();
}

/** The client shall not take what it has for the whole of an answer. */
void Connection::reset() {
    const ::linger atOnce{1, 0};
    ::setsockopt(_readiness.descriptor(), SOL_SOCKET, SO_LINGER, &atOnce, sizeof(atOnce));
    close();
}

} // namespace marlo::http
