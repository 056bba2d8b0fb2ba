/**
 * @file
 * Whoever serves a class: the provider of a library, or the object manager itself.
 */
#pragma once

#include "host/broker/Broker.h"
#include "host/cimom/BuiltIn.h"
#include "host/cimom/ObjectManager.h"
#include "host/cimom/Provider.h"

#include <string>
#include <vector>

namespace marlo {

/**
 * Asks in the name of the user that acts when it is made (Principal.h). Takes arguments that have been checked, hands
 * on answers that have not. What a provider or a built-in throws is answered CMPI_RC_ERR_FAILED with its text, but
 * for the RequestError of a built-in; that and what a sink throws is thrown on.
 */
class Servant {
  public:
    using InstanceSink = ObjectManager::InstanceSink;
    using PathSink = ObjectManager::PathSink;

    /** All outlive this. */
    Servant(const broker::Broker& broker, Provider& provider);
    Servant(const Schema& schema, BuiltIn& builtIn);

    /** For the log. */
    [[nodiscard]] std::string name() const;

    Status enumerateInstances(const Class& definition, const std::string& nameSpace, const PropertyList& names,
                              const InstanceSink& sink) const;
    Status enumerateInstanceNames(const Class& definition, const std::string& nameSpace, const PathSink& sink) const;
    Status getInstance(const Class& definition, const ObjectPath& path, const PropertyList& names,
                       const InstanceSink& sink) const;
    /** `created` is left alone where the servant gives no path. */
    Status createInstance(const Class& definition, const Instance& instance, ObjectPath& created) const;
    Status modifyInstance(const Class& definition, const Instance& instance,
                          const std::vector<std::string>& names) const;
    Status deleteInstance(const Class& definition, const ObjectPath& path) const;
    Status invokeMethod(const Class& definition, const ObjectPath& path, const Method& method,
                        const std::vector<NamedValue>& arguments, MethodAnswer& answer) const;

  private:
    const broker::Broker* _broker = nullptr; ///< of a provider
    Provider* _provider = nullptr;           ///< null where the built-in serves
    const Schema* _schema = nullptr;         ///< of a built-in
    BuiltIn* _builtIn = nullptr;
    std::string _principal;
};

} // namespace marlo
