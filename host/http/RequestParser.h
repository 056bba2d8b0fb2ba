/**
 * @file
 * Bytes to requests.
 */
#pragma once

#include "host/http/Framing.h"
#include "host/http/Message.h"

#include <cstddef>
#include <memory>
#include <string>
#include <string_view>

namespace marlo::http {

/**
 * Reads one request after the other from bytes that come in pieces of any size. Lines end with CR LF only, no line is
 * continued on the next, and no field has a space before its colon: where another reader on the way could see another
 * request than this one, a Fault is thrown. Without state that outlives a request but for the limit.
 */
class RequestParser {
  public:
    explicit RequestParser(std::size_t headBytes);
    ~RequestParser();
    RequestParser(const RequestParser&) = delete;
    RequestParser& operator=(const RequestParser&) = delete;

    /**
     * `bytes` are all that came and was not used yet. Returns how many have been used up. Throws Fault, 431 for a
     * head that is longer than the limit.
     */
    std::size_t readHead(std::string_view bytes);
    [[nodiscard]] bool hasHead() const;

    /** Valid from hasHead() on; may be moved from. */
    [[nodiscard]] RequestHead& head();
    [[nodiscard]] const RequestHead& head() const;
    [[nodiscard]] const Framing& framing() const;

    /**
     * Goes on with the body behind the head, and appends to `body`. Returns as readHead does. Throws Fault, 413 when
     * the body gets longer than `limit`. Trailers are read and dropped.
     */
    std::size_t readBody(std::string_view bytes, std::string& body, std::size_t limit);
    /** The request has been read to its end. */
    [[nodiscard]] bool isDone() const;

    /** The next request begins. */
    void reset();

  private:
    class Beast;

    /** Where the head ends, or 0 while that has not come; refuses lines that end or begin badly. */
    std::size_t findEnd(std::string_view bytes);

    std::size_t _headBytes;
    std::size_t _scanned = 0; ///< of the bytes that the last call saw and did not use
    std::unique_ptr<Beast> _beast;
};

} // namespace marlo::http
