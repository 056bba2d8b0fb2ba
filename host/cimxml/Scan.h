/**
 * @file
 * A first look at a document, before the parser's: at what the parser lets pass, and at what makes it slow.
 */
#pragma once

#include "host/cimxml/Message.h"

#include <string>
#include <string_view>

namespace marlo::cimxml {

/** "line 3, column 14", each from 1, columns in characters. */
std::string placeOf(std::string_view text, std::size_t offset);

/** Throws MessageError for a place in a text. */
[[noreturn]] void failAt(std::string_view text, std::size_t offset, MessageError::Kind kind,
                         const std::string& reason);

/**
 * Throws MessageError for a document that is not in UTF-8 or says that it is in another encoding, has a NUL, behind
 * which the parser would see nothing, declares something in its DOCTYPE, or has an element with more attributes than
 * allowed: the parser compares each with each before it says that it has found them.
 *
 * Up to the first place where a document is not well-formed this sees the same tags as the parser, which then stops.
 */
void scan(std::string_view document, const Limits& limits);

} // namespace marlo::cimxml
