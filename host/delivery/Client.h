/**
 * @file
 * The HTTP client of one destination.
 */
#pragma once

#include "host/delivery/Connection.h"
#include "host/delivery/Delivery.h"
#include "host/delivery/Network.h"
#include "host/delivery/Url.h"

#include <functional>
#include <memory>
#include <string>

namespace marlo::delivery {

/**
 * One request at a time, over a connection that is kept for the next one until it has been idle for a while. On the
 * network's thread only.
 */
class Client : public std::enable_shared_from_this<Client> {
  public:
    /** Empty: the listener has answered that the indication has arrived; else why it is not known to have. */
    using Done = std::function<void(const std::string& problem)>;

    /** The first two outlive this. `tls` is null for plain HTTP. Throws std::invalid_argument as Url does. */
    Client(Network& network, const Options& options, const Destination& destination, TlsClient tls);
    ~Client(); ///< closes
    Client(const Client&) = delete;
    Client& operator=(const Client&) = delete;

    /**
     * Sends a body, after the one before has been answered for. The answer comes later, once. When a connection that
     * has been used before turns out to be closed, another one is tried at once: that is how listeners end
     * connections that were idle.
     */
    void send(std::string&& body, Done done);

    /** Ends the connection; what is under way is never answered for. */
    void close();

  private:
    void lookUp();
    void connect(const std::vector<std::string>& addresses);
    void exchange();
    void onAnswer(Answer&& answer);
    void finish(const std::string& problem);
    void disconnect();

    /** A function that does nothing once this is gone or its connection is another one. */
    template <typename Function>
    auto guarded(Function function) {
        return [weak = weak_from_this(), turn = _turn, function](auto&&... arguments) {
            const auto self = weak.lock();
            if (self && self->_turn == turn) {
                function(*self, std::forward<decltype(arguments)>(arguments)...);
            }
        };
    }

    Network& _network;
    const Options& _options;
    const Url _url;
    const TlsClient _tls;
    const bool _isVerified;
    Timer _timer; ///< for looking up the name, and for a connection that is idle
    std::shared_ptr<Connection> _connection;
    std::uint64_t _turn = 0;
    bool _isFresh = true;
    std::string _body;
    Done _done;
};

} // namespace marlo::delivery
