/**
 * @file
 * One call of one provider's instance or method interface.
 */
#pragma once

#include "host/broker/Broker.h"
#include "host/cimom/ObjectManager.h"
#include "host/cimom/Provider.h"

#include <functional>
#include <vector>

namespace marlo {

/**
 * Calls a provider with all that CMPI prepares for it and releases what the call created when it is over.
 *
 * Answers go to the sinks as they come. What the provider throws becomes CMPI_RC_ERR_FAILED with its text; what a
 * sink throws is thrown on once the provider has returned. A function that the provider's table leaves out is
 * answered CMPI_RC_ERR_NOT_SUPPORTED.
 */
class ProviderCall {
  public:
    using InstanceSink = std::function<void(Instance&&)>;
    using PathSink = std::function<void(ObjectPath&&)>;

    ProviderCall(const broker::Broker& broker, Provider& provider, const std::string& principal)
        : _broker(broker), _provider(provider), _principal(principal) {}

    Status enumerateInstances(const ObjectPath& classPath, const PropertyList& properties, const InstanceSink& sink);
    Status enumerateInstanceNames(const ObjectPath& classPath, const PathSink& sink);
    Status getInstance(const ObjectPath& path, const PropertyList& properties, const InstanceSink& sink);

    /** `created` is the path that the provider returned, and is left alone where it returned none. */
    Status createInstance(const Instance& instance, ObjectPath& created);
    Status deleteInstance(const ObjectPath& path);

    /**
     * A provider that ends either of these in success, but has not said that it is done, has failed: the status is
     * then CMPI_RC_ERR_FAILED with an empty message, for the caller to give the reason.
     */
    Status modifyInstance(const Instance& instance, const std::vector<std::string>& names);
    /** `answer` gets what the provider returned, and is complete when the status is CMPI_RC_OK. */
    Status invokeMethod(const ObjectPath& path, const std::string& method, const std::vector<NamedValue>& arguments,
                        MethodAnswer& answer);

  private:
    struct Arguments;
    using Function = std::function<CMPIStatus(const Arguments&)>;

    Status call(const ObjectPath& path, const PropertyList& properties, broker::ResultSink& sink,
                const Function& function, bool* isDone = nullptr);

    const broker::Broker& _broker;
    Provider& _provider;
    const std::string& _principal;
};

} // namespace marlo
