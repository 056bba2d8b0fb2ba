/**
 * @file
 * How the operations of the scripted agent record themselves.
 */
#pragma once

#include <string>

namespace scripted_agent {

/** Shows the call to the script, which may make it throw. */
void announce(const std::string& call);

/** Adds a line. */
void add(std::string line);

/** A number for a new cursor. */
int nextCursor();

/** The text in quotation marks, or null. */
std::string quoted(const char* text);

} // namespace scripted_agent
