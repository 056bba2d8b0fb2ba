/**
 * @file
 * The client's side as bytes: what is sent is what a test wrote, and nothing that comes is made better than it is.
 */
#pragma once

#include "host/http/Descriptor.h"
#include "host/http/Server.h"

#include <chrono>
#include <string>
#include <string_view>

namespace marlo::http {

class RawClient {
  public:
    /** An answer as it came. */
    struct Reading {
        unsigned status = 0; ///< 0: the connection ended, or nothing came in time
        std::string head;    ///< with the empty line
        std::string body;    ///< without its transfer coding
        bool isWhole = false;
        std::string trailers;

        /** The value of a field of the head; empty where there is none. */
        [[nodiscard]] std::string field(const std::string& name) const;
    };

    explicit RawClient(Descriptor descriptor) : _descriptor(std::move(descriptor)) {}

    /** To a listening server, or a descriptor of -1. */
    static RawClient connectTo(const Endpoint& endpoint);
    /** The other end of a connection that the server has been handed. */
    static RawClient servedBy(Server& server);

    [[nodiscard]] int descriptor() const { return _descriptor.get(); }

    /** Waits at most 20 s for the server to take it. */
    bool send(std::string_view bytes);
    /** Answers to HEAD have no body, whatever they say. */
    Reading readAnswer(bool toHead = false);
    /** All that comes until the connection ends. */
    std::string readToEnd();
    /** Bytes, without a wait when none come within `patience`. */
    std::string readSome(std::chrono::milliseconds patience);
    /** Whether the server ends the connection within that time, and sends nothing before. */
    bool isEndedWithin(std::chrono::milliseconds patience);

    /** Whether the last read ended with a reset rather than an end. */
    [[nodiscard]] bool wasReset() const { return _wasReset; }

    /** Sends no more. */
    void shutDown();
    /** Closes so that the server gets a reset. */
    void vanish();

    void close() { _descriptor = Descriptor(); }

  private:
    /** Reads until the text holds `mark` behind `from`; npos when it never will. */
    std::size_t readUntil(std::string_view mark, std::size_t from);
    bool readMore(std::chrono::milliseconds patience);
    bool readChunks(Reading& reading);

    Descriptor _descriptor;
    std::string _text; ///< what has been read and not been used
    bool _wasReset = false;
};

} // namespace marlo::http
