#include "host/delivery/Client.h"

#include "host/delivery/Message.h"

#include <utility>

namespace marlo::delivery {
namespace {

constexpr std::chrono::seconds idleTime{30};

} // namespace

Client::Client(Network& network, const Options& options, const Destination& destination, TlsClient tls)
    : _network(network),
      _options(options),
      _url(Url::parse(destination.url)),
      _tls(std::move(tls)),
      _isVerified(destination.isVerified),
      _timer(network) {}

Client::~Client() {
    disconnect();
}

void Client::send(std::string&& body, Done done) {
    _timer.cancel();
    _body = std::move(body);
    _done = std::move(done);
    _isFresh = !_connection;
    if (_isFresh) {
        lookUp();
    } else {
        exchange();
    }
}

void Client::close() {
    _done = nullptr;
    disconnect();
}

void Client::disconnect() {
    ++_turn;
    _timer.cancel();
    if (_connection) {
        std::exchange(_connection, nullptr)->close();
    }
}

void Client::lookUp() {
    _timer.after(_options.connectTime,
                 guarded([](Client& self) { self.finish("no address of " + self._url.host + " in time"); }));
    _network.lookUps().find(_url.host,
                            guarded([](Client& self, std::vector<std::string> addresses, const std::string& problem) {
                                self._timer.cancel();
                                if (problem.empty()) {
                                    self.connect(addresses);
                                } else {
                                    self.finish(problem);
                                }
                            }));
}

void Client::connect(const std::vector<std::string>& addresses) {
    _connection = Connection::make(_network, _options, _url, _tls, _isVerified);
    _connection->open(addresses, guarded([](Client& self, const std::string& problem) {
                          if (problem.empty()) {
                              self.exchange();
                          } else {
                              self.finish(problem);
                          }
                      }));
}

void Client::exchange() {
    _connection->exchange(requestHead(_url, _body.size()), std::string(_body),
                          guarded([](Client& self, Answer&& answer) { self.onAnswer(std::move(answer)); }));
}

void Client::onAnswer(Answer&& answer) {
    if (answer.wasClosed && !_isFresh) {
        disconnect();
        _isFresh = true;
        lookUp();
        return;
    }
    if (!answer.problem.empty()) {
        finish(answer.problem);
        return;
    }
    if (answer.keepsAlive) {
        _timer.after(idleTime, guarded([](Client& self) { self.disconnect(); }));
    } else {
        disconnect();
    }
    if (const Done done = std::exchange(_done, nullptr)) {
        done(problemOf(answer.status, answer.cimError, answer.body));
    }
}

/** Nothing is known of a connection after a failure. */
void Client::finish(const std::string& problem) {
    disconnect();
    if (const Done done = std::exchange(_done, nullptr)) {
        done(problem);
    }
}

} // namespace marlo::delivery
