/**
 * @file
 * Message texts with inserts.
 */
#pragma once

#include <string>
#include <string_view>
#include <vector>

#include <cmpift.h>

namespace marlo::broker {

/** Replaces `$1` to `$9` by the inserts; a placeholder without an insert stays as it is, `$$` is one `$`. */
std::string fillIn(std::string_view text, const std::vector<std::string>& inserts);

/** The slots; inserts are given as pairs of a type code and a value. */
CMPIString* getMessage(const CMPIBroker* broker, const char* id, const char* text, CMPIStatus* status,
                       CMPICount count, ...);
CMPIString* getMessage2(const CMPIBroker* broker, const char* id, CMPIMsgFileHandle file, const char* text,
                        CMPIStatus* status, CMPICount count, ...);

} // namespace marlo::broker
