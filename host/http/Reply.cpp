#include "host/http/Reply.h"

#include <algorithm>
#include <stdexcept>
#include <utility>

#include <poll.h>

namespace marlo::http {
namespace {

/** Often enough to see what goes on, and seldom enough to cost nothing. */
constexpr Pace::Time glance = std::chrono::seconds(1);

} // namespace

Reply::Reply(Stream& stream, int descriptor, const std::atomic<bool>& isCut, Terms terms)
    : _stream(stream), _descriptor(descriptor), _isCut(isCut), _terms(std::move(terms)) {}

void Reply::require(bool isInOrder) const {
    if (!isInOrder) {
        throw std::logic_error("an answer is sent whole, or begun, written and finished");
    }
}

void Reply::giveUp(const char* why) {
    _isBroken = true;
    _stage = Stage::complete;
    throw ClientGone(why);
}

void Reply::drop(const char* why) {
    _wasTooSlow = true;
    giveUp(why);
}

void Reply::send(Answer&& answer) {
    require(_stage == Stage::fresh);
    _terms.keepsAlive = _terms.keepsAlive && !answer.close;
    _delay = answer.delay;
    sendWhole(answer.status, answer.fields, answer.body);
}

void Reply::begin(unsigned status, Fields&& fields) {
    require(_stage == Stage::fresh);
    _status = status;
    _fields = std::move(fields);
    _stage = Stage::gathering;
}

void Reply::write(std::string_view piece) {
    require(_stage == Stage::gathering || _stage == Stage::streaming);
    while (!piece.empty()) {
        const std::size_t room = _terms.gathered - _gathered.size();
        _gathered.append(piece.substr(0, room));
        piece.remove_prefix(std::min(room, piece.size()));
        if (_gathered.size() == _terms.gathered) {
            sendPiece();
        }
    }
}

void Reply::finish() {
    require(_stage == Stage::gathering || _stage == Stage::streaming);
    if (_stage == Stage::gathering) {
        // With its length known, an answer is not chunked and has no trailers to announce.
        std::erase_if(_fields, [](const Field& field) { return field.name == "Trailer"; });
        sendWhole(_status, _fields, _gathered);
        return;
    }
    if (!_terms.isHead && _terms.version >= 11) {
        appendChunk(_rest, _gathered);
        appendLastChunk(_rest, {});
    } else if (!_terms.isHead) {
        _rest = std::move(_gathered);
    }
    sendLast();
}

void Reply::fail(Answer&& instead, Fields&& trailers) {
    require(_stage != Stage::complete);
    if (_stage != Stage::streaming) {
        _stage = Stage::fresh;
        send(std::move(instead));
        return;
    }
    _terms.keepsAlive = false;
    if (!_terms.takesTrailers || _terms.version < 11 || _terms.isHead) {
        _isBroken = true;
        _stage = Stage::complete;
        return;
    }
    appendChunk(_rest, _gathered);
    appendLastChunk(_rest, trailers);
    sendLast();
}

void Reply::sendWhole(unsigned status, const Fields& fields, std::string_view body) {
    _rest.reserve(body.size() + 512);
    appendHead(_rest, status, fields, {Ending::Body::length, body.size(), _terms.version, _terms.keepsAlive});
    if (!_terms.isHead && mayHaveBody(status)) {
        _rest.append(body);
    }
    sendLast();
}

/** The head goes out together with the first piece. */
void Reply::sendPiece() {
    const bool isChunked = _terms.version >= 11;
    std::string text;
    text.reserve(_gathered.size() + 512);
    if (_stage == Stage::gathering) {
        _stage = Stage::streaming;
        _terms.keepsAlive = _terms.keepsAlive && isChunked;
        const auto body = isChunked ? Ending::Body::chunks : Ending::Body::connection;
        appendHead(text, _status, _fields, {body, 0, _terms.version, _terms.keepsAlive});
    }
    if (!_terms.isHead && isChunked) {
        appendChunk(text, _gathered);
    } else if (!_terms.isHead) {
        text.append(_gathered);
    }
    _gathered.clear();
    sendNow(text);
}

void Reply::sendNow(std::string_view bytes) {
    if (!_uptake) {
        _uptake.emplace(_descriptor, Pace(_terms.sendTime, _terms.sendRate));
    }
    while (!bytes.empty()) {
        if (_isCut) {
            giveUp("the server stops");
        }
        const Transfer transfer = _stream.write(bytes);
        bytes.remove_prefix(transfer.bytes);
        _uptake->wrote(transfer.bytes);
        if (transfer.progress == Progress::failed || transfer.progress == Progress::ended) {
            giveUp("the client went away in the middle of an answer");
        }
        if (transfer.progress != Progress::done) {
            await(transfer.progress);
        }
    }
}

void Reply::await(Progress progress) {
    const auto since = std::chrono::steady_clock::now();
    const Pace::Time most = _held < _terms.holdTime ? _terms.holdTime : _terms.longestHold;
    const Pace::Time toHold = _isAside ? glance : most - _held;
    const auto patience = std::chrono::ceil<std::chrono::milliseconds>(std::min({glance, _uptake->left(), toHold}));
    pollfd waited{_descriptor, static_cast<short>(progress == Progress::wantRead ? POLLIN : POLLOUT), 0};
    ::poll(&waited, 1, static_cast<int>(patience.count()));
    const Pace::Time time = std::chrono::steady_clock::now() - since;
    _uptake->waited(time);
    if (_uptake->isTooSlow()) {
        drop("the client took its answer too slowly");
    }
    hold(time);
}

/** The worker has waited for so long. */
void Reply::hold(Pace::Time time) {
    _held += time;
    if (_isAside || _held < _terms.holdTime) {
        return;
    }
    _isAside = _terms.stepAside && _terms.stepAside();
    if (!_isAside && _held >= _terms.longestHold) {
        drop("too many clients take their answers slowly");
    }
}

/** As much as goes without waiting. */
void Reply::sendLast() {
    _stage = Stage::complete;
    if (_delay.count() > 0) {
        return;
    }
    std::size_t sent = 0;
    Transfer transfer{Progress::done, 0};
    while (sent < _rest.size() && transfer.progress == Progress::done) {
        transfer = _stream.write(std::string_view(_rest).substr(sent));
        sent += transfer.bytes;
    }
    _rest.erase(0, sent);
    if (transfer.progress == Progress::failed || transfer.progress == Progress::ended) {
        giveUp("the client went away before its answer");
    }
}

} // namespace marlo::http
