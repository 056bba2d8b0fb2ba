/**
 * @file
 * Who has subscribed to which indications, and what the providers were told of it.
 */
#pragma once

#include "host/broker/Broker.h"
#include "host/cimom/InstanceChecks.h"
#include "host/cimom/ObjectManager.h"
#include "host/cimom/Provider.h"
#include "host/cimom/SchemaKnowledge.h"
#include "host/cimom/Subscription.h"

#include <atomic>
#include <map>
#include <memory>
#include <mutex>
#include <string>
#include <thread>
#include <tuple>
#include <vector>

namespace marlo {

/**
 * Subscriptions in memory. All operations may be called from any thread; subscribing and unsubscribing happen one
 * after the other, deliveries at any time.
 *
 * A provider is told in the order of CMPI: for each subscription and class authorizeFilter, mustPoll, activateFilter;
 * enableIndications with its first one; deActivateFilter; disableIndications with its last one.
 */
class Subscriptions {
  public:
    using Providers = std::vector<std::unique_ptr<Provider>>;

    /** All outlive this. */
    Subscriptions(const Schema& schema, const SchemaKnowledge& knowledge, const broker::Broker& broker,
                  const Providers& providers, OnceLog& log)
        : _schema(schema), _knowledge(knowledge), _broker(broker), _providers(providers), _log(log) {}

    /** As ObjectManager::subscribe, the namespace spelled as the schema has it; throws RequestError. */
    Status subscribe(const std::string& nameSpace, const std::string& text, const std::string& language,
                     const ObjectManager::RoundSink& sink, SubscriptionId& id);
    Status unsubscribe(SubscriptionId id);

    /** Ends all subscriptions; deliveries and subscriptions from now on are refused. */
    void end();

    /** Hands an indication to everyone who wants it. */
    broker::Outcome deliver(const std::string& nameSpace, Instance&& indication);

  private:
    using Entry = std::shared_ptr<Subscription>;
    using List = std::vector<std::pair<SubscriptionId, Entry>>;
    using ActivationKey = std::tuple<const Provider*, std::string, std::string>;

    class Setup;

    std::shared_ptr<const List> list() const;
    void add(SubscriptionId id, const Entry& entry);
    Entry remove(SubscriptionId id);
    Entry makeEntry(const std::string& nameSpace, const std::string& text, const std::string& language,
                    const ObjectManager::RoundSink& sink) const;
    std::vector<Subscription::Activation> servicesOf(const Subscription& entry) const;
    Status activate(Subscription& entry, const Subscription::Activation& activation);
    Status deactivate(const Subscription& entry, const Subscription::Activation& activation);
    Status deactivateAll(Subscription& entry);
    std::optional<Instance> check(const std::string& given, Instance&& indication, broker::Outcome& outcome);

    const Schema& _schema;
    const SchemaKnowledge& _knowledge;
    const broker::Broker& _broker;
    const Providers& _providers;
    OnceLog& _log;

    std::mutex _setupMutex; ///< held while providers are told; guards the three below
    std::map<ActivationKey, int> _activations;
    std::map<const Provider*, int> _activationsOfProvider;
    SubscriptionId _lastId = 0;
    std::atomic<std::thread::id> _setupThread; ///< that holds _setupMutex

    mutable std::mutex _listMutex; ///< guards the two below
    std::shared_ptr<const List> _list = std::make_shared<const List>();
    bool _ended = false;
};

} // namespace marlo
