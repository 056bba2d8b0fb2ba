/**
 * @file
 * An answer that is kept instead of sent, and requests to be answered.
 */
#pragma once

#include "host/http/Server.h"
#include "host/security/Identity.h"

#include <functional>
#include <optional>
#include <string>
#include <vector>

namespace marlo::test {

class MemoryResponder final : public http::Responder {
  public:
    void send(http::Answer&& answer) override {
        sent = std::move(answer);
        body += sent->body;
    }

    void begin(unsigned status, http::Fields&& fields) override {
        begun = status;
        beginFields = std::move(fields);
    }

    void write(std::string_view piece) override {
        if (goneAfter && body.size() + piece.size() > *goneAfter) {
            throw http::ClientGone("it went away");
        }
        body += piece;
        largestPiece = std::max(largestPiece, piece.size());
    }

    void finish() override { finished = true; }

    void fail(http::Answer&& answer, http::Fields&& fields) override {
        instead = std::move(answer);
        trailers = std::move(fields);
    }

    std::optional<std::size_t> goneAfter; ///< bytes that the client takes

    std::optional<http::Answer> sent;
    std::optional<unsigned> begun;
    http::Fields beginFields;
    std::string body; ///< of what was sent, or begun
    std::size_t largestPiece = 0;
    bool finished = false;
    std::optional<http::Answer> instead;
    http::Fields trailers;
};

/** A request that somebody has been admitted with. */
inline http::Request requestOf(const security::Identity& identity, const std::string& method,
                               const std::string& object, const std::string& call) {
    http::Request request;
    request.id = 7;
    request.peer.address = "192.0.2.99";
    request.peer.port = 4000;
    request.head.method = "POST";
    request.head.target = "/cimom";
    request.head.fields = {{"Content-Type", "application/xml"},
                           {"CIMOperation", "MethodCall"},
                           {"CIMMethod", method},
                           {"CIMObject", object}};
    request.body = "<?xml version=\"1.0\"?><CIM CIMVERSION=\"2.0\" DTDVERSION=\"2.0\"><MESSAGE ID=\"1\" "
                   "PROTOCOLVERSION=\"1.0\"><SIMPLEREQ>" +
                   call + "</SIMPLEREQ></MESSAGE></CIM>";
    request.admission = identity;
    return request;
}

/** An intrinsic method in root/test. */
inline http::Request intrinsic(const security::Identity& identity, const std::string& method,
                               const std::string& arguments) {
    return requestOf(identity, method, "root/test",
                     "<IMETHODCALL NAME=\"" + method +
                         "\"><LOCALNAMESPACEPATH><NAMESPACE NAME=\"root\"/><NAMESPACE NAME=\"test\"/>"
                         "</LOCALNAMESPACEPATH>" +
                         arguments + "</IMETHODCALL>");
}

inline std::string classArgument(const std::string& className) {
    return "<IPARAMVALUE NAME=\"ClassName\"><CLASSNAME NAME=\"" + className + "\"/></IPARAMVALUE>";
}

inline std::string argument(const std::string& name, const std::string& value) {
    return "<IPARAMVALUE NAME=\"" + name + "\"><VALUE>" + value + "</VALUE></IPARAMVALUE>";
}

} // namespace marlo::test
