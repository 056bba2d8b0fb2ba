/**
 * @file
 * HTTP requests (RFC 9110, RFC 9112) as those who answer them see them, and what an answer is made of.
 */
#pragma once

#include <any>
#include <chrono>
#include <cstdint>
#include <optional>
#include <string>
#include <string_view>
#include <vector>

namespace marlo::http {

/** A field of a head or a trailer. */
struct Field {
    std::string name; ///< as it was written; compared without case
    std::string value;
};

using Fields = std::vector<Field>;

/** The method, the target and the fields of a request, in the order in which they came. */
struct RequestHead {
    std::string method; ///< as it was written: methods have case
    std::string target; ///< path and query, not decoded
    unsigned version = 11;
    Fields fields;

    /** The values of all fields of a name: a client may send one twice. */
    [[nodiscard]] std::vector<std::string_view> values(std::string_view name) const;
    /** The value of the first one. */
    [[nodiscard]] std::optional<std::string_view> value(std::string_view name) const;
};

enum class Transport { tcp, tls, local };

/** Who is at the other end, as far as the connection tells. */
struct Peer {
    Transport transport = Transport::tcp;
    std::string address;                   ///< "127.0.0.1" or "::1"; "local" on a Unix domain socket
    unsigned port = 0;                     ///< 0 on a Unix domain socket
    std::optional<unsigned> userId;        ///< of the process at the other end of a Unix domain socket (SO_PEERCRED)
    std::optional<std::string> commonName; ///< of a client certificate that has been verified

    /** "127.0.0.1:41234", "[::1]:41234", "local uid 1000". */
    [[nodiscard]] std::string toString() const;
};

struct Request {
    std::uint64_t id = 0; ///< counts the requests of one server from 1
    Peer peer;
    RequestHead head;
    std::string body;   ///< whole, without transfer coding
    std::any admission; ///< what Handler::admit left for Handler::handle
};

/** An answer that is at hand as a whole. Content-Length, Date and Connection are added. */
struct Answer {
    unsigned status = 200;
    Fields fields;
    std::string body;
    bool close = false; ///< the connection ends with this answer
    /** It is held back this long, by a timer and not by a worker: many who guess passwords keep nobody waiting. */
    std::chrono::milliseconds delay{0};
    /** Of Handler::admit: the head is shown again a little later, and this is sent if that goes on for too long. */
    bool isForNow = false;
};

} // namespace marlo::http
