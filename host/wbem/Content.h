/**
 * @file
 * What requests and answers consist of: XML in UTF-8, by one name or another.
 */
#pragma once

#include "host/http/Message.h"

#include <string>

namespace marlo::wbem {

/**
 * Throws HttpError unless the body is XML in UTF-8 (415) and the client takes that for an answer (406). Returns the
 * name by which it likes XML better: "application/xml", or "text/xml".
 */
std::string checkContent(const http::RequestHead& head);

} // namespace marlo::wbem
