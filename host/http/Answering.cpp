// What a connection does on a worker, and what becomes of it back in the loop.
#include "host/http/Connection.h"

#include <exception>
#include <utility>

namespace marlo::http {
namespace {

constexpr std::string_view goOn = "HTTP/1.1 100 Continue\r\n\r\n";

/** The handler is asked again after this, or when the next look at all connections is due. */
constexpr std::chrono::milliseconds postponement{20};

bool bringsBody(const std::string& method) {
    return method == "POST" || method == "M-POST" || method == "PUT" || method == "PATCH";
}

} // namespace

Terms Connection::terms(bool keepsAlive) {
    Terms terms;
    terms.gathered = _site.limits.gathered;
    terms.sendTime = _site.limits.sendTime;
    terms.sendRate = _site.limits.sendRate;
    terms.holdTime = _site.limits.holdTime;
    terms.longestHold = _site.limits.longestHold;
    terms.stepAside = [this] { return _site.workers.stepAside(*this); };
    terms.keepsAlive = keepsAlive && !_site.isStopping;
    if (_parser.hasHead()) {
        terms.version = _parser.head().version;
        terms.isHead = _parser.head().method == "HEAD";
        terms.keepsAlive = terms.keepsAlive && _parser.framing().keepsAlive;
        terms.takesTrailers = _parser.framing().takesTrailers;
    }
    return terms;
}

void Connection::run() {
    if (_isCut || (!_isAdmitted && !admit())) {
        return;
    }
    if (!_parser.isDone()) {
        try {
            _input.erase(0, _parser.readBody(_input, _body, _site.limits.bodyBytes));
        } catch (const Fault& fault) {
            _fault = fault;
            _outcome = Outcome::faulty;
            return;
        }
    }
    if (_parser.isDone()) {
        handle();
    } else {
        _outcome = Outcome::bodyWanted;
    }
}

/** False when the request was refused, or its admission put off. */
bool Connection::admit() {
    std::optional<Answer> refusal;
    try {
        refusal = _site.handler.admit(_parser.head(), _peer, _admission);
        if (!refusal) {
            refusal = objection();
        }
    } catch (const std::exception& error) {
        Reply reply(*_stream, _readiness.descriptor(), _isCut, terms(mayDrain()));
        answerError(reply, error.what());
        conclude(reply);
        return false;
    }
    if (refusal && refusal->isForNow && mayPostpone()) {
        _outcome = Outcome::postponed;
        return false;
    }
    if (refusal && refusal->isForNow) {
        _site.log("request " + std::to_string(_id) + " of " + _peer.toString() +
                  ": nobody could say in time who asks");
    }
    if (refusal) {
        sendRefusal(std::move(*refusal));
        return false;
    }
    _isAdmitted = true;
    return true;
}

/** The request waits with its connection, and without a worker. */
bool Connection::mayPostpone() {
    const Clock::time_point now = Clock::now();
    if (_lastAdmission == Clock::time_point::max()) {
        _lastAdmission = now + _site.limits.admissionTime;
    }
    return now < _lastAdmission && !_site.isStopping;
}

/** What is wrong with a request that would otherwise be welcome. */
std::optional<Answer> Connection::objection() const {
    const Framing& framing = _parser.framing();
    if (framing.hasUnknownExpectation) {
        return _site.handler.refuse(417, "the only expectation known here is 100-continue");
    }
    if (!framing.isChunked && !framing.hasLength && bringsBody(_parser.head().method)) {
        return _site.handler.refuse(411, "the length of the body is missing");
    }
    if (framing.length > _site.limits.bodyBytes) {
        return _site.handler.refuse(413,
                                    "the body is longer than " + std::to_string(_site.limits.bodyBytes) + " bytes");
    }
    return std::nullopt;
}

/**
 * Whether the connection can go on without the body being wanted. Whoever waits for "100 Continue" sends it or not:
 * the next bytes could be either.
 */
bool Connection::mayDrain() const {
    const Framing& framing = _parser.framing();
    return _parser.isDone() || (!framing.expectsContinue && framing.length <= _site.limits.drained);
}

void Connection::sendRefusal(Answer&& refusal) {
    Reply reply(*_stream, _readiness.descriptor(), _isCut, terms(mayDrain()));
    try {
        reply.send(std::move(refusal));
    } catch (const std::exception&) { // an answer that is not complete ends the connection
    }
    conclude(reply);
}

void Connection::handle() {
    Reply reply(*_stream, _readiness.descriptor(), _isCut, terms(true));
    try {
        Request request{_id, _peer, std::move(_parser.head()), std::move(_body), std::move(_admission)};
        _site.handler.handle(std::move(request), reply);
        if (!reply.isComplete()) {
            answerError(reply, "the handler ended without an answer");
        }
    } catch (const ClientGone&) { // which the reply remembers
    } catch (const std::exception& error) {
        answerError(reply, error.what());
    } catch (...) {
        answerError(reply, "something was thrown that is no exception");
    }
    conclude(reply);
}

void Connection::answerError(Reply& reply, const std::string& reason) {
    _site.log("request " + std::to_string(_id) + " of " + _peer.toString() + ": " + reason);
    if (reply.isComplete()) {
        return;
    }
    try {
        reply.fail(_site.handler.refuse(500, "an error within the server"), {});
    } catch (const std::exception&) { // an answer that is not complete ends the connection
    }
}

void Connection::conclude(Reply& reply) {
    _outcome = Outcome::answered;
    _output = reply.takeRest();
    _sent = 0;
    _delay = reply.delay();
    _keepsAlive = reply.keepsAlive();
    _mustReset = reply.isBroken() || !reply.isComplete();
    _site.tooSlow += reply.wasTooSlow() ? 1 : 0;
}

void Connection::done() {
    if (_isCut) {
        close();
        return;
    }
    switch (_outcome) {
    case Outcome::bodyWanted:
        if (_parser.framing().expectsContinue && _body.empty()) {
            _stream->write(goOn); // if it is not taken the client goes on without it, or goes
        }
        enter(State::body, _site.limits.bodyTime);
        awaitInput();
        break;
    case Outcome::postponed:
        enter(State::postponed, postponement);
        break;
    case Outcome::faulty:
        refuse(_fault->status(), _fault->what());
        break;
    case Outcome::answered:
        if (_mustReset || _output.empty()) {
            answered();
        } else if (_delay.count() > 0) {
            enter(State::delayed, _delay);
        } else {
            beginSending();
            _readiness.awaitWritable(shared_from_this());
        }
        break;
    }
}

/** In the loop: the connection ends with this. */
void Connection::refuse(unsigned status, const std::string& reason) {
    Reply reply(*_stream, _readiness.descriptor(), _isCut, terms(false));
    try {
        reply.send(_site.handler.refuse(status, reason));
    } catch (const std::exception& error) {
        _site.log("refusing " + _peer.toString() + ": " + error.what());
    }
    conclude(reply);
    _keepsAlive = false;
    done();
}

} // namespace marlo::http
