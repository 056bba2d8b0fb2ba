/**
 * @file
 * The answer to one CIM operation, written while it comes about.
 */
#pragma once

#include "host/cimxml/Writer.h"
#include "host/http/Server.h"

#include <cstddef>
#include <memory>
#include <optional>
#include <string>

namespace marlo::wbem {

/** What an answer needs to know of its request. */
struct ReplyHead {
    std::string messageId;
    std::string method;
    bool intrinsic = true;
    std::string host;                  ///< in paths that carry one
    std::string type;                  ///< "application/xml" or "text/xml"
    std::optional<std::string> prefix; ///< of the fields of CIM, where M-POST declared one
    bool trailers = false;             ///< the client takes them
};

/**
 * Nothing is written before the first object: an operation that fails until then is answered by its error alone. One
 * that fails later ends as Responder::fail has it, with the error as a trailer. Used by one thread.
 */
class Reply {
  public:
    Reply(http::Responder& responder, ReplyHead head);

    /** The writer, in an open IRETURNVALUE. */
    cimxml::Writer& returned();
    /** The writer in the METHODRESPONSE, or in the IMETHODRESPONSE behind a closed IRETURNVALUE. */
    cimxml::Writer& behind();

    /** Ends the answer; more than once is as good as once. */
    void succeed();
    void fail(unsigned code, const std::string& description);

    [[nodiscard]] std::size_t bytes() const { return _bytes; } ///< of the body, handed over so far

  private:
    enum class State { untouched, opened, returning, behind, ended };

    [[nodiscard]] http::Fields fields() const;
    [[nodiscard]] std::string errorDocument(unsigned code, const std::string& description) const;
    void open();
    void hand(std::string_view piece);

    http::Responder& _responder;
    ReplyHead _head;
    State _state = State::untouched;
    bool _begun = false; ///< something was handed over
    std::size_t _bytes = 0;
    std::unique_ptr<cimxml::Writer> _writer;
};

} // namespace marlo::wbem
