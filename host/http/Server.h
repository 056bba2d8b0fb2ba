/**
 * @file
 * An HTTP/1.1 server on TCP, TLS and Unix domain sockets. It knows nothing of CIM and nothing of users.
 */
#pragma once

#include "host/http/Message.h"

#include <chrono>
#include <cstddef>
#include <functional>
#include <memory>
#include <stdexcept>
#include <string>
#include <string_view>
#include <vector>

namespace marlo::http {

/** The client went away, or took longer than it may, before all of an answer was sent. */
class ClientGone : public std::runtime_error {
  public:
    using std::runtime_error::runtime_error;
};

/**
 * The answer to one request; used by one thread. Either `send`, or `begin`, any number of `write`, and `finish`. All
 * wait until the client has taken enough for memory to stay bounded, and throw ClientGone.
 */
class Responder {
  public:
    virtual ~Responder() = default;

    virtual void send(Answer&& answer) = 0;

    /**
     * Begins an answer of unknown length: chunked for HTTP/1.1, ended by the connection's end for HTTP/1.0. What is
     * written is gathered: an answer that ends before `Limits::gathered` bytes goes out whole, with its length.
     */
    virtual void begin(unsigned status, Fields&& fields) = 0;
    virtual void write(std::string_view piece) = 0;
    virtual void finish() = 0;
    /**
     * Ends an answer that began and cannot be completed. Where nothing has been sent yet, `instead` is sent in its
     * place; where the client takes trailers (TE: trailers) those end it; else the connection is cut, so that nobody
     * takes half an answer for a whole one.
     */
    virtual void fail(Answer&& instead, Fields&& trailers) = 0;

  protected:
    Responder() = default;
    Responder(const Responder&) = default;
    Responder& operator=(const Responder&) = default;
};

/** What answers. Called on worker threads, several at once; what it throws is answered 500, and logged. */
class Handler {
  public:
    virtual ~Handler() = default;

    /**
     * Sees a head before the body is read, or asked for where the client waits to be (Expect: 100-continue). Returns
     * the refusal, or nothing and what `Request::admission` shall be.
     */
    virtual std::optional<Answer> admit(const RequestHead& head, const Peer& peer, std::any& admission) = 0;
    virtual void handle(Request&& request, Responder& responder) = 0;
    /**
     * The answer to what is no HTTP or too much of it (400, 408, 411, 413, 417, 431, 501, 503, 505), and to what was
     * thrown (500): maybe nobody has been admitted. Fields may be added; the reason is for the body. Does not wait.
     */
    virtual Answer refuse(unsigned status, const std::string& reason) = 0;

  protected:
    Handler() = default;
    Handler(const Handler&) = default;
    Handler& operator=(const Handler&) = default;
};

/** What one client may take of the server. */
struct Limits {
    std::size_t headBytes = std::size_t{16} * 1024;       ///< request line and fields
    std::size_t bodyBytes = std::size_t{4} * 1024 * 1024; ///< without transfer coding
    std::size_t gathered = std::size_t{64} * 1024;        ///< of an answer before its first piece is sent
    std::size_t connections = 1024;                       ///< of all peers
    std::size_t connectionsPerPeer = 256;                 ///< of one address, or one user of the local socket
    std::size_t workers = 16;                             ///< requests that are handled at once
    std::size_t queued = 256;                             ///< requests that wait for a worker; 503 beyond
    std::size_t aside = 16;                               ///< answers to clients that keep a worker waiting
    std::size_t sendRate = std::size_t{8} * 1024;         ///< bytes a second that a client takes of an answer
    std::size_t drained = std::size_t{64} * 1024;   ///< of the body of a refused request; its connection is kept
    std::chrono::milliseconds headTime{10000};      ///< from the first byte to the end of the head
    std::chrono::milliseconds bodyTime{30000};      ///< of the whole body
    std::chrono::milliseconds idleTime{60000};      ///< between two requests
    std::chrono::milliseconds sendTime{30000};      ///< that a client may fall behind the rate above
    std::chrono::milliseconds holdTime{500};        ///< that it keeps a worker waiting before that steps aside
    std::chrono::milliseconds longestHold{10000};   ///< that it keeps a worker waiting where none may step aside
    std::chrono::milliseconds admissionTime{10000}; ///< for the handler to make up its mind: Answer::isForNow
    std::chrono::milliseconds lingerTime{5000};     ///< for a client that still sends to see the last answer

    bool operator==(const Limits&) const = default;
};

/** A TLS identity and whom to trust; PEM files. */
struct TlsOptions {
    std::string certificateFile;
    std::string keyFile;
    std::string clientCaFile;       ///< verifies client certificates; empty: none are asked for
    bool clientCertificate = false; ///< whoever has none that is good is turned away
};

struct Endpoint {
    Transport transport = Transport::tcp;
    std::string address = "127.0.0.1"; ///< numeric, or the path of a Unix domain socket
    unsigned short port = 0;           ///< 0: one that is free
    unsigned mode = 0666;              ///< of the Unix domain socket; who may do what is the handler's business
};

struct Counters {
    std::uint64_t connections = 0; ///< open now
    std::uint64_t accepted = 0;
    std::uint64_t requests = 0;
    std::uint64_t busy = 0; ///< requests that are being handled now
    std::uint64_t refusedConnections = 0;
    std::uint64_t aside =
        0; ///< of the busy ones, those whose clients have been kept waiting for; they hold no worker
    std::uint64_t tooSlow = 0; ///< clients that took an answer too slowly and were dropped
};

/**
 * Listens from construction to `stop`. Every connection has TCP_NODELAY. Pipelined requests are answered one after
 * the other, in their order. Accepting goes on when descriptors ran out and are free again.
 */
class Server {
  public:
    using Log = std::function<void(const std::string& line)>;

    /** Binds all endpoints or throws std::runtime_error that names the one and the reason. `handler` outlives this.
     */
    Server(Handler& handler, const std::vector<Endpoint>& endpoints, const std::optional<TlsOptions>& tls,
           const Limits& limits, Log log);
    ~Server();
    Server(const Server&) = delete;
    Server& operator=(const Server&) = delete;

    /**
     * Serves a connection that exists already, until it ends. The descriptor of a stream socket goes over to the
     * server. `peer` is what the handler is told; its transport says whether TLS is spoken.
     */
    void serve(int descriptor, Peer peer);

    /** Where it listens, with the ports that were free. */
    [[nodiscard]] std::vector<Endpoint> endpoints() const;
    [[nodiscard]] Counters counters() const;

    /** Takes new certificates, for connections from now on. Throws std::runtime_error and keeps what it had. */
    void reloadTls(const TlsOptions& tls);

    /**
     * No new connection, no new request; requests that are being handled get `patience` to end and their answers are
     * sent. Then everything is closed, and handlers that still run find their clients gone; returns when they have
     * returned. Once, and not by a handler; also called by the destructor with no patience.
     */
    void stop(std::chrono::milliseconds patience);

  private:
    struct State;
    std::unique_ptr<State> _state;
};

} // namespace marlo::http
