/**
 * @file
 * What providers return, made to agree with the schema.
 */
#pragma once

#include "host/cimom/ObjectManager.h"

#include <functional>
#include <mutex>
#include <optional>
#include <set>
#include <string>
#include <utility>

namespace marlo {

/** True when a property list has the name, or is none. */
bool isAsked(const PropertyList& properties, const std::string& name);

/** Says each thing once, however often it is found. Any thread. */
class OnceLog {
  public:
    explicit OnceLog(std::function<void(const std::string&)> log) : _log(std::move(log)) {}

    void say(const std::string& text);

  private:
    std::function<void(const std::string&)> _log;
    std::mutex _mutex;
    std::set<std::string> _said;
};

/** Checks the answers of one provider to one request. */
class InstanceChecks {
  public:
    /**
     * `definition` is the class that the provider was asked for; it outlives this, like all the rest but the
     * provider's name.
     */
    InstanceChecks(const Schema& schema, const std::string& nameSpace, const Class& definition, std::string provider,
                   OnceLog& log)
        : _schema(schema),
          _nameSpace(nameSpace),
          _definition(definition),
          _provider(std::move(provider)),
          _log(log) {}

    /**
     * The path with namespace and typed keys in the schema's order, without host. Nothing when it is not one of the
     * class or lacks a key; why is logged.
     */
    std::optional<ObjectPath> checkPath(const ObjectPath& path);

    /** The instance with a checked path and those properties that its class has and the client asked for. */
    std::optional<Instance> checkInstance(Instance&& instance, const PropertyList& properties);

  private:
    const Class* classOf(const std::string& className);
    void say(const std::string& text);
    bool checkProperty(const Class& definition, NamedValue& property);

    const Schema& _schema;
    const std::string& _nameSpace;
    const Class& _definition;
    const std::string _provider;
    OnceLog& _log;
    std::string _lastName; ///< the class name of the last answer and its definition: most answers are of one class
    const Class* _lastClass = nullptr;
};

} // namespace marlo
