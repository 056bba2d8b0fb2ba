/**
 * @file
 * What the fields of a head say about the bytes behind it and about the connection (RFC 9112, 6 and 9).
 */
#pragma once

#include "host/http/Message.h"

#include <cstdint>

namespace marlo::http {

struct Framing {
    bool isChunked = false;
    bool hasLength = false;   ///< a Content-Length was sent
    std::uint64_t length = 0; ///< of the body, where it is not chunked
    bool keepsAlive = true;
    bool expectsContinue = false;       ///< the client waits for "100 Continue" before it sends the body
    bool hasUnknownExpectation = false; ///< to be answered 417
    bool takesTrailers = false;         ///< TE: trailers

    [[nodiscard]] bool hasBody() const { return isChunked || length > 0; }
};

/**
 * Throws Fault wherever two readers could see the end of the request, or its addressee, in two places: a length that
 * is doubled, or accompanied by a transfer coding, or no number; codings other than "chunked"; no Host or two.
 */
Framing framingOf(const RequestHead& head);

} // namespace marlo::http
