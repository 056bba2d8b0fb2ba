/**
 * @file
 * How the operations of the scripted agent record themselves.
 */
#pragma once

#include "tests/support/scripted_agent/ScriptedAgent.h"

#include <string>

namespace scripted_agent {

/** False when nobody wants to know of a call: calls by the million are then not even put into words. */
bool watched();

/** Shows the call to the script, which may make it throw. */
void announce(const std::string& call);

/** Adds a line. */
void add(std::string line);

/** Puts a call into words, shows it to the script, and returns the words; empty when nobody wants to know. */
template <typename Describe>
std::string announced(const Describe& describe) {
    if (!watched()) {
        return {};
    }
    std::string call = describe();
    announce(call);
    return call;
}

/** A number for a new cursor. */
int nextCursor();

/** The text in quotation marks, or null. */
std::string quoted(const char* text);

/** What startMonitoring and stopMonitoring do; stopping waits until no callback is running. */
void addMonitoring(const Monitoring& monitoring);
void removeMonitoring(const Monitoring& monitoring);

/** Tells who waits for it that a cursor has selected `path`. */
void pickUp(const std::string& path);

/** Ends every monitoring, and forgets what was picked up. */
void resetEvents();

} // namespace scripted_agent
