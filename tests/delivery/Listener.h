/**
 * @file
 * A listener that behaves as a test wants it to.
 */
#pragma once

#include "host/http/Descriptor.h"

#include <chrono>
#include <condition_variable>
#include <cstdint>
#include <functional>
#include <memory>
#include <mutex>
#include <string>
#include <thread>
#include <vector>

using SSL_CTX = struct ssl_ctx_st;

namespace marlo::delivery {

/** Listens on a port of the loopback interface, or of all where it is everywhere, a thread for each connection. Any
 * thread. */
class Listener {
  public:
    /** An export request as it came. */
    struct Received {
        std::string head;
        std::string body;
        std::string context;
        std::int64_t number = -1;
        int connection = 0; ///< counted from 1
        std::chrono::steady_clock::time_point time;

        /** The text of a property's VALUE; empty where there is none. */
        [[nodiscard]] std::string property(const std::string& name) const;
    };

    struct Reaction {
        std::string bytes;                  ///< of the answer, as they go out
        bool ends = false;                  ///< the connection, behind the bytes
        std::chrono::milliseconds delay{0}; ///< before the bytes
        std::chrono::milliseconds pace{0};  ///< between one byte and the next
    };

    using React = std::function<Reaction(const Received&)>;

    /** PEM files; empty: plain HTTP. */
    struct Identity {
        std::string certificateFile;
        std::string keyFile;
    };

    explicit Listener(React react = accept, const Identity& identity = {}, bool isEverywhere = false);
    ~Listener();
    Listener(const Listener&) = delete;
    Listener& operator=(const Listener&) = delete;

    [[nodiscard]] std::string url(const std::string& host = "127.0.0.1") const;

    /** From the next request on. */
    void setReaction(React react);

    /** Ends all connections; nobody listens until `start`, which takes the same port again. */
    void stop();
    void start();

    [[nodiscard]] std::vector<Received> received() const;
    [[nodiscard]] std::vector<std::int64_t> numbers() const; ///< in the order in which they came
    /** Whether so many have come within the time. */
    bool await(std::size_t count, std::chrono::milliseconds patience = std::chrono::seconds(20)) const;
    [[nodiscard]] int connections() const;

    static Reaction answer(unsigned status, const std::string& body = {}, const std::string& fields = {});
    static Reaction accept(const Received& received);
    static Reaction refuse(const Received& received); ///< 200 with ERROR 1

  private:
    class Stream;

    void listen();
    void serve(http::Descriptor descriptor, int connection);
    bool receive(Stream& stream, Received& received);
    bool send(Stream& stream, const Reaction& reaction);

    std::shared_ptr<SSL_CTX> _tls;
    const bool _isEverywhere;
    unsigned short _port = 0;
    http::Descriptor _listening;
    std::thread _acceptor;

    mutable std::mutex _mutex; ///< guards all below
    mutable std::condition_variable _came;
    React _react;
    std::vector<Received> _received;
    std::vector<std::thread> _threads;
    std::vector<int> _open; ///< descriptors of connections
    int _connections = 0;
    bool _isStopping = false;
};

} // namespace marlo::delivery
