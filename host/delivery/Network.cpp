#include "host/delivery/NetworkAsio.h"

#include <boost/asio/post.hpp>
#include <boost/asio/steady_timer.hpp>
#include <utility>

#include <pthread.h>

namespace marlo::delivery {

using boost::system::error_code;

Network::Network()
    : _asio(std::make_unique<Asio>()),
      _lookUps(std::make_unique<LookUps>([this](std::function<void()> what) { post(std::move(what)); })) {}

Network::~Network() = default;

void Network::start() {
    _thread = std::thread([this] {
        ::pthread_setname_np(::pthread_self(), "marlo-delivery");
        _asio->context.run();
    });
}

void Network::stop() {
    post([this] { _asio->context.stop(); });
    _thread.join();
    _lookUps.reset(); // answers that still come find nobody
}

void Network::post(std::function<void()> what) {
    boost::asio::post(_asio->context, std::move(what));
}

/** A timer that has run out may have its handler called although it was cancelled, or is gone, since. */
struct Timer::Asio {
    boost::asio::steady_timer timer;
    std::shared_ptr<std::uint64_t> turn = std::make_shared<std::uint64_t>(0);
};

Timer::Timer(Network& network) : _asio(new Asio{boost::asio::steady_timer(network.asio().context)}) {}

Timer::~Timer() = default;

void Timer::after(std::chrono::milliseconds delay, std::function<void()> what) {
    cancel();
    _asio->timer.expires_after(delay);
    _asio->timer.async_wait(
        [what = std::move(what), turn = *_asio->turn, current = std::weak_ptr(_asio->turn)](const error_code& error) {
            const auto now = current.lock();
            if (!error && now && *now == turn) {
                what();
            }
        });
}

void Timer::cancel() {
    ++*_asio->turn;
    _asio->timer.cancel();
}

} // namespace marlo::delivery
