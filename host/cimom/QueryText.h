/**
 * @file
 * SELECT statements as clients give them, with the name of a language.
 */
#pragma once

#include "host/filter/Filter.h"
#include "host/schema/Schema.h"

#include <string>

namespace marlo {

/**
 * Reads a statement and compares it with the schema. Throws RequestError for an unknown namespace or language, and
 * for a statement that is wrong, with line and column; `what` begins the message.
 */
filter::Filter readQuery(const Schema& schema, const std::string& nameSpace, const std::string& text,
                         const std::string& language, const std::string& what);

} // namespace marlo
