/**
 * @file
 * What the head of a request says about the CIM operation in its body (DSP0200, RFC 2774).
 */
#pragma once

#include "host/cimxml/Message.h"
#include "host/http/Message.h"

#include <optional>
#include <string>

namespace marlo::wbem {

/** The URI that stands for the mapping of CIM onto HTTP in the fields Man and Opt. */
inline constexpr const char* extensionUri = "http://www.dmtf.org/cim/mapping/http/v1.0";

struct CimFields {
    /** Of M-POST: what precedes the names of the fields, "73-" for ns=73, in the request and in its answer. */
    std::optional<std::string> prefix;
    std::string answerType; ///< of the answer's XML
    std::string method;     ///< CIMMethod, decoded
    std::string object;     ///< CIMObject, decoded
};

/**
 * The name space that M-POST declares for the fields of CIM: "73-" for `Man: ...v1.0; ns=73`; nothing for POST.
 * Throws HttpError: 510 for an M-POST whose extension is not this one, 405 for all other methods.
 */
std::optional<std::string> readPrefix(const http::RequestHead& head);

/**
 * Reads the fields of CIM, under M-POST with or without the prefix. Throws HttpError: 400 unsupported-operation for
 * anything but `CIMOperation: MethodCall`, 501 for a batch and for a protocol that is not 1.x, 400 header-mismatch
 * where a field is missing, doubled or badly encoded.
 */
CimFields readCimFields(const http::RequestHead& head, std::optional<std::string> prefix);

/**
 * Throws HttpError (400 header-mismatch) where head and body differ: proxies and firewalls decide by the head. Names
 * are compared without case, key values without their types; the host of a path does not count.
 */
void compareWithBody(const CimFields& fields, const cimxml::Message& message);

} // namespace marlo::wbem
