#include "host/delivery/Policies.h"

#include <exception>

namespace marlo::delivery {

Policies::Policies(Delivery::PolicyHandler handler, Delivery::Log log)
    : _handler(std::move(handler)), _log(std::move(log)), _thread([this] { run(); }) {}

Policies::~Policies() {
    {
        const std::lock_guard lock(_mutex);
        _isEnding = true;
        _changed.notify_one();
    }
    _thread.join();
}

void Policies::fire(const std::string& subscription, OnFatalError policy) {
    const std::lock_guard lock(_mutex);
    _fired.emplace_back(subscription, policy);
    _changed.notify_one();
}

void Policies::run() {
    std::unique_lock lock(_mutex);
    while (true) {
        _changed.wait(lock, [this] { return _isEnding || !_fired.empty(); });
        if (_isEnding) {
            return;
        }
        const auto [subscription, policy] = std::move(_fired.front());
        _fired.pop_front();
        lock.unlock();
        try {
            _handler(subscription, policy);
        } catch (const std::exception& error) {
            _log("subscription " + subscription +
                 ": its policy for failing listeners cannot be applied: " + error.what());
        }
        lock.lock();
    }
}

} // namespace marlo::delivery
