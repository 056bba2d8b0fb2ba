/**
 * @file
 * Requests in files and the answers that they get, byte by byte.
 *
 * `golden/NAME.request` holds what a client sends: one request or, on one connection, several. `golden/NAME.response`
 * holds all that it gets. What differs from run to run is replaced: the Date of an answer, and contexts of
 * enumerations, for which `contextPlaceholder` stands, in a request for the last one that an answer gave.
 */
#pragma once

#include <string>
#include <vector>

namespace marlo::test {

/** As long as a context, so that lengths stay right. */
inline constexpr const char* contextPlaceholder = "contextcontextcontextcontextcont";

/** The names of all pairs, sorted. */
std::vector<std::string> goldenNames();

std::string readGolden(const std::string& file);
void writeGolden(const std::string& file, const std::string& text);

/** Sends the requests of a text over a stream socket, each after the answer to the former; returns the answers. */
std::string exchange(int descriptor, const std::string& requests);

} // namespace marlo::test
