#include "host/http/Server.h"

#include "host/http/Listener.h"
#include "host/http/Roster.h"
#include "host/http/Sockets.h"
#include "host/http/Tls.h"

#include <algorithm>
#include <exception>
#include <future>
#include <mutex>
#include <thread>
#include <utility>

namespace marlo::http {
namespace {

constexpr unsigned mostLoops = 4;

std::size_t loopCount() {
    return std::clamp(std::thread::hardware_concurrency(), 1U, mostLoops);
}

/** Users of the local socket are told apart by who they are, others by where they are. */
std::string seatName(const Peer& peer) {
    return peer.transport == Transport::local ? peer.toString() : peer.address;
}

} // namespace

struct Server::State {
    State(Handler& handler, const Limits& limits, Log&& log) : site(handler, limits, std::move(log), loopCount()) {
        for (const auto& loop : site.workers.loops()) {
            rosters.push_back(std::make_unique<Roster>(*loop, site.limits));
        }
    }

    void listen(const Endpoint& endpoint);
    void adopt(Descriptor&& descriptor, Peer&& peer);
    void refuse(const Descriptor& descriptor, const Peer& peer);
    void begin(std::size_t index, Descriptor&& descriptor, Peer&& peer, Seats::Seat&& seat);
    std::unique_ptr<Stream> makeStream(int descriptor, Transport transport);
    /** Runs `what` in every loop, and waits for it. */
    void inEveryLoop(const std::function<void(std::size_t)>& what);
    void stop(std::chrono::milliseconds patience);

    Site site;
    std::vector<std::unique_ptr<Roster>> rosters;
    std::vector<std::shared_ptr<Listener>> listeners;
    std::atomic<std::size_t> turn{0};
    std::mutex tlsMutex;
    std::shared_ptr<const TlsContext> tls;
    std::once_flag stopped;
};

void Server::State::listen(const Endpoint& endpoint) {
    if (endpoint.transport == Transport::tls && !tls) {
        throw std::runtime_error("cannot listen on " + toString(endpoint) + ": there is no certificate");
    }
    Loop& loop = *site.workers.loops().front();
    listeners.push_back(
        std::make_shared<Listener>(site, loop, endpoint, [this](Descriptor&& descriptor, Peer&& peer) {
            adopt(std::move(descriptor), std::move(peer));
        }));
}

std::unique_ptr<Stream> Server::State::makeStream(int descriptor, Transport transport) {
    if (transport != Transport::tls) {
        return makePlainStream(descriptor);
    }
    const std::lock_guard lock(tlsMutex);
    if (!tls) {
        throw std::runtime_error("there is no certificate");
    }
    return makeTlsStream(descriptor, tls);
}

void Server::State::adopt(Descriptor&& descriptor, Peer&& peer) {
    if (peer.transport != Transport::local) {
        sendAtOnce(descriptor.get());
    }
    std::optional<Seats::Seat> seat = site.seats.take(seatName(peer));
    if (!seat) {
        ++site.refusedConnections;
        refuse(descriptor, peer);
        return;
    }

    struct Arrival {
        Descriptor descriptor;
        Peer peer;
        Seats::Seat seat;
    };

    const std::size_t index = turn++ % rosters.size();
    auto arrival = std::make_shared<Arrival>(Arrival{std::move(descriptor), std::move(peer), std::move(*seat)});
    site.workers.loops()[index]->post([this, index, arrival] {
        begin(index, std::move(arrival->descriptor), std::move(arrival->peer), std::move(arrival->seat));
    });
}

/** In the clear a client can be told why. Through TLS it would cost a handshake, and there are too many already. */
void Server::State::refuse(const Descriptor& descriptor, const Peer& peer) {
    if (peer.transport == Transport::tls) {
        return;
    }
    const auto stream = makePlainStream(descriptor.get());
    const std::atomic<bool> isCut{false};
    Terms terms;
    terms.keepsAlive = false;
    Reply reply(*stream, descriptor.get(), isCut, terms);
    try {
        reply.send(site.handler.refuse(503, "too many connections"));
    } catch (const std::exception&) { // who is gone needs no answer
    }
    stream->finish();
}

void Server::State::begin(std::size_t index, Descriptor&& descriptor, Peer&& peer, Seats::Seat&& seat) {
    const std::string name = peer.toString();
    try {
        auto stream = makeStream(descriptor.get(), peer.transport);
        const auto connection =
            std::make_shared<Connection>(site, *site.workers.loops()[index], *rosters[index], std::move(descriptor),
                                         std::move(stream), std::move(peer), std::move(seat));
        rosters[index]->add(connection);
        connection->start();
        if (site.isStopping) {
            connection->endIfIdle();
        }
    } catch (const std::exception& error) {
        site.log("no connection with " + name + ": " + error.what());
    }
}

void Server::State::inEveryLoop(const std::function<void(std::size_t)>& what) {
    std::vector<std::future<void>> ends;
    for (std::size_t index = 0; index < rosters.size(); ++index) {
        const auto end = std::make_shared<std::promise<void>>();
        ends.push_back(end->get_future());
        site.workers.loops()[index]->post([index, end, &what] {
            what(index);
            end->set_value();
        });
    }
    for (auto& end : ends) {
        end.wait();
    }
}

void Server::State::stop(std::chrono::milliseconds patience) {
    site.isStopping = true;
    inEveryLoop([this](std::size_t index) {
        if (index == 0) { // where all listeners are
            for (const auto& listener : listeners) {
                listener->close();
            }
        }
        rosters[index]->endIdle();
    });
    if (!site.seats.awaitEmpty(patience)) {
        inEveryLoop([this](std::size_t index) { rosters[index]->cut(); });
        site.seats.awaitEmpty();
    }
    site.workers.stop();
}

Server::Server(Handler& handler, const std::vector<Endpoint>& endpoints, const std::optional<TlsOptions>& tls,
               const Limits& limits, Log log)
    : _state(std::make_unique<State>(handler, limits, std::move(log))) {
    if (tls) {
        _state->tls = std::make_shared<const TlsContext>(*tls);
    }
    for (const Endpoint& endpoint : endpoints) {
        _state->listen(endpoint);
    }
    State& state = *_state;
    state.site.workers.loops().front()->post([&state] {
        for (const auto& listener : state.listeners) {
            listener->start();
        }
    });
}

Server::~Server() {
    stop(std::chrono::milliseconds(0));
}

void Server::serve(int descriptor, Peer peer) {
    _state->adopt(Descriptor(descriptor), std::move(peer));
}

std::vector<Endpoint> Server::endpoints() const {
    std::vector<Endpoint> endpoints;
    for (const auto& listener : _state->listeners) {
        endpoints.push_back(listener->endpoint());
    }
    return endpoints;
}

Counters Server::counters() const {
    const Site& site = _state->site;
    return {site.seats.taken(),      site.accepted,        site.requests, site.workers.busy(),
            site.refusedConnections, site.workers.aside(), site.tooSlow};
}

void Server::reloadTls(const TlsOptions& tls) {
    auto fresh = std::make_shared<const TlsContext>(tls);
    const std::lock_guard lock(_state->tlsMutex);
    _state->tls = std::move(fresh);
}

void Server::stop(std::chrono::milliseconds patience) {
    std::call_once(_state->stopped, [this, patience] { _state->stop(patience); });
}

} // namespace marlo::http
