/**
 * @file
 * Requests as clients write them, from the parts that a test is about.
 */
#pragma once

#include "host/cimxml/Message.h"

#include <optional>
#include <string>

namespace marlo::test {

/** The message of a request in its frame. */
inline std::string frame(const std::string& inner) {
    return "<?xml version=\"1.0\" encoding=\"utf-8\" ?>\n"
           "<CIM CIMVERSION=\"2.0\" DTDVERSION=\"2.0\">\n"
           "<MESSAGE ID=\"1001\" PROTOCOLVERSION=\"1.0\">" +
           inner + "</MESSAGE></CIM>";
}

/** An intrinsic method call of `root/cimv2` with these IPARAMVALUEs. */
inline std::string intrinsic(const std::string& method, const std::string& parameters) {
    return frame("<SIMPLEREQ><IMETHODCALL NAME=\"" + method +
                 "\"><LOCALNAMESPACEPATH><NAMESPACE NAME=\"root\"/><NAMESPACE NAME=\"cimv2\"/></LOCALNAMESPACEPATH>" +
                 parameters + "</IMETHODCALL></SIMPLEREQ>");
}

/** One argument that is read from `element`. */
inline cimxml::Argument argumentOf(const std::string& element, const std::string& attributes = "",
                                   const cimxml::Limits& limits = {}) {
    const auto message = cimxml::readMessage(
        intrinsic("Any", "<IPARAMVALUE NAME=\"It\"" + attributes + ">" + element + "</IPARAMVALUE>"), limits);
    return std::get<cimxml::IntrinsicCall>(message.call).arguments.at(0).value;
}

/** What was wrong with a document. */
struct Refusal {
    cimxml::MessageError::Kind kind{};
    std::string reason;
};

/** Nothing where the document is read. */
inline std::optional<Refusal> refusalOf(const std::string& document, const cimxml::Limits& limits = {}) {
    try {
        cimxml::readMessage(document, limits);
        return std::nullopt;
    } catch (const cimxml::MessageError& error) {
        return Refusal{error.kind(), error.what()};
    }
}

} // namespace marlo::test
