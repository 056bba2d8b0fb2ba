/**
 * @file
 * One subscription to indications.
 */
#pragma once

#include "host/broker/Broker.h"
#include "host/cimom/ObjectManager.h"
#include "host/cimom/Provider.h"
#include "host/filter/Filter.h"

#include <condition_variable>
#include <memory>
#include <mutex>
#include <string>
#include <vector>

namespace marlo {

class Subscription {
  public:
    /** A provider and the class of its indications that this subscription has activated there. */
    struct Activation {
        Provider* provider;
        std::string className;
    };

    Subscription(const broker::Broker& broker, filter::Filter filter, std::string nameSpace, std::string fromClass,
                 ObjectManager::RoundSink sink);
    ~Subscription() = default;
    Subscription(const Subscription&) = delete;
    Subscription& operator=(const Subscription&) = delete;

    [[nodiscard]] const std::string& nameSpace() const { return _nameSpace; }

    [[nodiscard]] const std::string& fromClass() const { return _fromClass; }

    /** The filter as providers get it, one and the same in all calls. */
    [[nodiscard]] const CMPISelectExp* filterHandle() const { return _filterHandle.get(); }

    /** True when the indication, in this namespace, is what was subscribed to. */
    [[nodiscard]] bool wants(const Instance& indication, const broker::SchemaView& schema) const;

    /** Hands a copy, cut to the selected properties, to the sink; throws what the sink throws. */
    void deliver(const Instance& indication, DeliveryRound& round);

    /**
     * From now on nothing is delivered; waits until no sink runs on other threads. One that runs on this thread is
     * this call's caller.
     */
    void close();

    std::vector<Activation> activations; ///< in the order in which they were made

  private:
    class Delivery;

    struct Release {
        void operator()(CMPISelectExp* handle) const { handle->ft->release(handle); }
    };

    static std::unique_ptr<CMPISelectExp, Release> makeHandle(const broker::Broker& broker,
                                                              const filter::Filter& filter);

    const filter::Filter _filter;
    const std::string _nameSpace;
    const std::string _fromClass;
    const ObjectManager::RoundSink _sink;
    const std::unique_ptr<CMPISelectExp, Release> _filterHandle;
    std::mutex _mutex; ///< guards all below
    std::condition_variable _sinkReturned;
    bool _closed = false;
    int _running = 0; ///< calls of the sink
};

} // namespace marlo
