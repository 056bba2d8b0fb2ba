/**
 * @file
 * The indication service of DSP1054: filters, destinations and subscriptions, from a client's request to the queue.
 */
#pragma once

#include "host/cimom/BuiltIn.h"
#include "host/delivery/Delivery.h"
#include "host/subscriptions/Activations.h"
#include "host/subscriptions/Records.h"
#include "host/subscriptions/Registry.h"

#include <atomic>
#include <condition_variable>
#include <filesystem>
#include <functional>
#include <memory>
#include <mutex>
#include <optional>
#include <string>
#include <thread>
#include <vector>

namespace marlo::subscriptions {

struct Options {
    std::filesystem::path database; ///< in a directory that exists
    delivery::Options delivery;
    std::function<bool(const std::string& user)> mayRead; ///< none: everyone
    /** Says whom a destination with https may be: sets what Destination has besides key and URL. None: as it is. */
    std::function<void(delivery::Destination& destination)> trust;
    std::function<void(const std::string& line)> log; ///< from any thread
};

/**
 * Serves the classes of "root/interop" that have to do with subscribing, and has subscribed to what its subscriptions
 * are about for as long as it is started. What clients make is on disk before they are answered, and there again
 * after a restart, but for transient destinations and what is subscribed for them.
 *
 * A subscription that cannot be activated at a start, since its class is gone or its owner may not read any more,
 * stays; it says that it is disabled, and is tried again at the next start and when it is enabled. What waits for one
 * whose owner may not read is discarded.
 */
class Service final : public BuiltIn {
  public:
    /** Opens the database. Throws store::Error; or std::runtime_error when another process uses it. `manager`
     * outlives all calls, and stop() at the latest. */
    Service(ObjectManager& manager, Options options);
    ~Service() override;

    /** Restores everything and begins to deliver. Once, before the first request, and after the manager has this. */
    void start();

    /**
     * Unsubscribes from everything, and sends what waits for at most `patience`; the rest stays on disk. Requests
     * from now on are refused.
     */
    void stop(std::chrono::milliseconds patience);

    /** Asks `mayRead` and `trust` anew about everything that there is. */
    void review();

    /** Of all destinations, each told by its Name. */
    [[nodiscard]] std::vector<delivery::Counters> counters() const;

    [[nodiscard]] std::string nameSpace() const override { return interop; }

    [[nodiscard]] std::vector<std::string> classes() const override;
    Status enumerate(const Class& definition, const ObjectManager::InstanceSink& sink) override;
    Status get(const Class& definition, const ObjectPath& path, const ObjectManager::InstanceSink& sink) override;
    Status create(const Class& definition, const Instance& instance, ObjectPath& created) override;
    Status modify(const Class& definition, const Instance& instance, const std::vector<std::string>& names) override;
    Status remove(const Class& definition, const ObjectPath& path) override;

  private:
    class Changing;

    [[nodiscard]] const Schema& schema() const { return _manager.schema(); }

    void say(const std::string& line) const;
    void guard(const char* failure, const Object& object, const std::function<void()>& step) const;
    [[nodiscard]] Instance present(const Object& object) const;

    // At the start.
    void load();
    void makeFixedFilters();
    void activateAtStart(const Object& subscription);
    [[nodiscard]] bool mayRead(const Object& subscription) const;

    // With the right to change.
    Status addFilter(Object&& object);
    Status addDestination(Object&& object);
    Status addSubscription(Object&& object);
    void keep(Object&& object);
    Status changeFilter(const Object& former, Object&& changed);
    Status changeDestination(const Object& former, Object&& changed);
    Status changeSubscription(const Object& former, Object&& changed);
    void replace(Object&& changed);
    void reviewOwner(const Object& subscription);
    Status restartAll(const std::vector<ObjectPointer>& subscriptions, const Instance& filter,
                      const Instance& former);
    void removeSubscription(const Object& subscription);
    void disable(const Object& subscription);
    void setDestination(const Object& destination);
    void setSubscription(const Object& subscription);
    [[nodiscard]] ObjectPointer filterOf(const Object& subscription) const;
    [[nodiscard]] ObjectPointer require(const ObjectPath& path) const;
    void requireRoom(Kind kind, std::size_t most) const;

    void applyPolicy(const std::string& subscription, delivery::OnFatalError policy);
    void runExpiry();
    void removeExpired();
    void wakeExpiry();

    ObjectManager& _manager;
    const Options _options;
    const Time _start = std::chrono::system_clock::now();
    Registry _registry;
    std::shared_ptr<delivery::Delivery> _delivery;
    Activations _activations;

    std::mutex _changing; ///< held while something is changed; guards all down to _isOpen
    Records _records;
    Id _lastId = 0;
    bool _isOpen = false;                         ///< between start() and stop()
    std::atomic<std::thread::id> _changingThread; ///< that holds _changing

    std::mutex _expiryMutex; ///< guards _isEnding; taken by itself
    std::condition_variable _expiryWake;
    bool _isEnding = false;
    std::thread _expiry;
};

} // namespace marlo::subscriptions
