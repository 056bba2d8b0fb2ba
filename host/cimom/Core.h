/**
 * @file
 * What all operations of an object manager stand on.
 */
#pragma once

#include "host/broker/Broker.h"
#include "host/cimom/InstanceChecks.h"
#include "host/cimom/LogGate.h"
#include "host/cimom/ObjectManager.h"
#include "host/cimom/Provider.h"
#include "host/cimom/SchemaKnowledge.h"
#include "host/cimom/Servant.h"

#include <functional>
#include <memory>
#include <optional>
#include <string>
#include <vector>

namespace marlo {

/** Immutable once the first request has come, but for what its members guard themselves. */
class Core {
  public:
    /** Reads schema and registrations. `upCalls` outlives this and is not called before a provider is. */
    Core(const ObjectManagerOptions& options, broker::UpCalls& upCalls);
    Core(const Core&) = delete;
    Core& operator=(const Core&) = delete;

    /** As ObjectManager::add. */
    void add(std::shared_ptr<BuiltIn> builtIn);

    /** Somebody, and a class that he serves. */
    struct Service {
        Servant servant;
        const Class* definition;
    };

    /** Those who serve a class and its subclasses; nobody is refused by a RequestError. */
    [[nodiscard]] std::vector<Service> servicesOf(const std::string& nameSpace, const Class& definition) const;

    /** Whoever serves a class itself; throws RequestError with `code` and `what` when nobody does. */
    [[nodiscard]] Servant servantOf(ProviderKind kind, const std::string& nameSpace, const Class& definition,
                                    CMPIrc code, const std::string& what) const;

    /** The same, or nothing. */
    [[nodiscard]] std::optional<Servant> findServant(ProviderKind kind, const std::string& nameSpace,
                                                     const std::string& className) const;

    /** Tells the providers that were used that the process ends, and closes the log. */
    void end();

    /** True when threads that nobody can wait for may still use this. */
    [[nodiscard]] bool mayBeUsed() const;

    Schema schema;
    SchemaKnowledge knowledge;
    LogGate gate;
    std::function<void(const std::string&)> log;
    OnceLog onceLog;
    broker::Broker broker;
    std::vector<std::unique_ptr<Provider>> providers;

  private:
    struct Own {
        std::shared_ptr<BuiltIn> builtIn;
        std::string nameSpace;
        std::vector<std::string> classes;
    };

    std::vector<Own> _own;
};

} // namespace marlo
