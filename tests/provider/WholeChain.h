/**
 * @file
 * The agent, the provider and the object manager as they are installed, and a subscriber to every indication.
 */
#pragma once

#include "host/cimom/ObjectManager.h"

#include <chrono>
#include <condition_variable>
#include <cstddef>
#include <memory>
#include <mutex>
#include <stdexcept>
#include <string>
#include <utility>
#include <vector>

namespace provider_test {

/**
 * Subscribed to all four classes as long as it lives. The agent serves what its environment says when the first of
 * them is made. One in a process: the provider does not start monitoring again once its last subscriptions have gone.
 */
class WholeChain {
  public:
    WholeChain()
        : _manager(
              std::make_unique<marlo::ObjectManager>(marlo::ObjectManagerOptions{{MARLO_SHARE_DIRECTORY "/schema"},
                                                                                 {MARLO_SHARE_DIRECTORY "/providers"},
                                                                                 MARLO_LIBRARY_DIRECTORY,
                                                                                 {},
                                                                                 false})) {
        for (const char* event : {"Online", "Offline", "SwitchOver", "SwitchBack"}) {
            subscribe(std::string("SELECT * FROM MARLO_NetworkAdapter") + event + "Event");
        }
    }

    ~WholeChain() { _manager.reset(); }

    WholeChain(const WholeChain&) = delete;
    WholeChain& operator=(const WholeChain&) = delete;

    /**
     * Takes what has come when there are so many, or after a minute without any more. A little later, to meet
     * indications that are too many.
     */
    std::vector<marlo::Instance> take(std::size_t count) {
        std::unique_lock lock(_mutex);
        for (std::size_t before = ~_received.size(); _received.size() < count && before != _received.size();) {
            before = _received.size();
            _changed.wait_for(lock, std::chrono::minutes(1), [&] { return _received.size() != before; });
        }
        _changed.wait_for(lock, std::chrono::milliseconds(300), [&] { return _received.size() > count; });
        return std::exchange(_received, {});
    }

  private:
    void subscribe(const std::string& filter) {
        marlo::SubscriptionId id = 0;
        const marlo::Status status = _manager->subscribe(
            "root/tavis", filter, "WQL", [this](marlo::Instance&& indication) { receive(std::move(indication)); },
            id);
        if (!status.ok()) {
            throw std::runtime_error(status.message);
        }
    }

    void receive(marlo::Instance&& indication) {
        const std::lock_guard lock(_mutex);
        _received.push_back(std::move(indication));
        _changed.notify_all();
    }

    std::mutex _mutex; ///< guards what has been received
    std::condition_variable _changed;
    std::vector<marlo::Instance> _received;
    std::unique_ptr<marlo::ObjectManager> _manager;
};

/** A property's text; empty when there is none. */
inline std::string textOf(const marlo::Instance& instance, const char* property) {
    const marlo::NamedValue* found = marlo::findName(instance.properties, property);
    const std::string* text = found != nullptr ? std::get_if<std::string>(&found->value.data) : nullptr;
    return text != nullptr ? *text : std::string();
}

/** A text property of each. */
inline std::vector<std::string> textsOf(const std::vector<marlo::Instance>& instances, const char* property) {
    std::vector<std::string> texts;
    for (const marlo::Instance& instance : instances) {
        texts.push_back(textOf(instance, property));
    }
    return texts;
}

} // namespace provider_test
