/**
 * @file
 * One connection to a listener.
 */
#pragma once

#include "host/delivery/Delivery.h"
#include "host/delivery/Network.h"
#include "host/delivery/Url.h"

#include <functional>
#include <memory>
#include <string>
#include <vector>

namespace marlo::delivery {

/** What a listener answered, or why there is no answer. */
struct Answer {
    std::string problem;    ///< empty: all below is there
    bool wasClosed = false; ///< the problem is that the connection ended before anything came
    unsigned status = 0;
    std::string cimError; ///< the field CIMError; empty where there is none
    std::string body;
    bool keepsAlive = false; ///< the connection is good for another request
};

/**
 * HTTP/1.1 over TCP or TLS, one thing at a time, on the network's thread. Whoever is to be told is told later, once,
 * and not any more after `close`. Addresses, heads and bodies are read no further than the options allow.
 */
class Connection {
  public:
    using Opened = std::function<void(const std::string& problem)>;
    using Answered = std::function<void(Answer&& answer)>;

    /** `tls` is null for plain TCP; `isVerified`: the certificate must name the host. */
    static std::shared_ptr<Connection> make(Network& network, const Options& options, const Url& url,
                                            const TlsClient& tls, bool isVerified);

    virtual ~Connection() = default;
    Connection(const Connection&) = delete;
    Connection& operator=(const Connection&) = delete;

    /** Connects to the first of the numeric addresses that takes it, and shakes hands. */
    virtual void open(const std::vector<std::string>& addresses, Opened opened) = 0;
    virtual void exchange(std::string&& head, std::string&& body, Answered answered) = 0;
    virtual void close() = 0;

  protected:
    Connection() = default;
};

} // namespace marlo::delivery
