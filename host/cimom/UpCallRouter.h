/**
 * @file
 * What providers ask of each other, on its way to the object manager.
 */
#pragma once

#include "host/broker/Broker.h"
#include "host/cimom/Operations.h"
#include "host/cimom/Subscriptions.h"

#include <atomic>
#include <functional>

namespace marlo {

/** Runs what a provider asks for as an operation within the provider's own. Any thread. */
class UpCallRouter final : public broker::UpCalls {
  public:
    using PropertyNames = broker::UpCalls::PropertyNames;

    /** Once, before any provider is called; both outlive the providers' threads. */
    void connect(Operations& operations, Subscriptions& subscriptions);

    /** From now on everything but indications, which subscriptions refuse by themselves, is refused. */
    void end() { _ended = true; }

    broker::Outcome enumerateInstances(const ObjectPath& classPath, const PropertyNames& properties,
                                       const InstanceSink& sink) override;
    broker::Outcome enumerateInstanceNames(const ObjectPath& classPath, const PathSink& sink) override;
    broker::Outcome getInstance(const ObjectPath& path, const PropertyNames& properties,
                                const InstanceSink& sink) override;
    broker::Outcome deliverIndication(const std::string& nameSpace, Instance&& indication) override;
    broker::Outcome createInstance(const Instance& instance, ObjectPath& created) override;
    broker::Outcome modifyInstance(const Instance& instance, const PropertyNames& properties) override;
    broker::Outcome deleteInstance(const ObjectPath& path) override;
    broker::Outcome execQuery(const std::string& nameSpace, const std::string& query, const std::string& language,
                              const InstanceSink& sink) override;
    broker::Outcome invokeMethod(const ObjectPath& path, const std::string& method,
                                 const std::vector<NamedValue>& arguments, Value& returned,
                                 std::vector<NamedValue>& out) override;
    broker::Outcome associators(const ObjectPath& path, const AssociationFilter& filter,
                                const PropertyNames& properties, const InstanceSink& sink) override;
    broker::Outcome associatorNames(const ObjectPath& path, const AssociationFilter& filter,
                                    const PathSink& sink) override;
    broker::Outcome references(const ObjectPath& path, const AssociationFilter& filter,
                               const PropertyNames& properties, const InstanceSink& sink) override;
    broker::Outcome referenceNames(const ObjectPath& path, const AssociationFilter& filter,
                                   const PathSink& sink) override;

  private:
    [[nodiscard]] broker::Outcome run(const std::function<Status(Operations&)>& operation) const;

    Operations* _operations = nullptr;
    Subscriptions* _subscriptions = nullptr;
    std::atomic<bool> _ended{false};
};

} // namespace marlo
