/**
 * @file
 * Heads of answers and pieces of their bodies as they go out (RFC 9112).
 */
#pragma once

#include "host/http/Message.h"

#include <cstddef>
#include <optional>
#include <string>
#include <string_view>

namespace marlo::http {

/** How the client will know where an answer ends, and what becomes of the connection then. */
struct Ending {
    enum class Body { length, chunks, connection };

    Body body = Body::length;
    std::size_t length = 0;
    unsigned version = 11; ///< of the request
    bool keepsAlive = true;
};

/** Appends the status line, the fields, and those that are added: Date, Content-Length or Transfer-Encoding,
 * Connection. */
void appendHead(std::string& text, unsigned status, const Fields& fields, const Ending& ending);

/** Appends one chunk. Nothing for nothing: an empty chunk would be the last one. */
void appendChunk(std::string& text, std::string_view data);

/** Appends the last chunk with the trailers. */
void appendLastChunk(std::string& text, const Fields& trailers);

/** Whether answers of this status have a body at all, if only an empty one. */
bool mayHaveBody(unsigned status);

} // namespace marlo::http
