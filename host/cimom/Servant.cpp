#include "host/cimom/Servant.h"

#include "host/cimom/ClassChecks.h"
#include "host/cimom/Principal.h"
#include "host/cimom/ProviderCall.h"
#include "host/cimom/References.h"

#include <exception>
#include <utility>

namespace marlo {

namespace {

/** The path of a built-in's instance with all that its properties and its class say of it. */
void completePath(const Class& definition, const std::string& nameSpace, Instance& instance) {
    ObjectPath& path = instance.path;
    path.nameSpace = nameSpace;
    if (path.className.empty()) {
        path.className = definition.name;
    }
    for (const Property* key : definition.keys()) {
        const NamedValue* value = findName(instance.properties, key->name);
        if (findName(path.keys, key->name) == nullptr && value != nullptr) {
            path.keys.push_back({key->name, value->value});
        }
    }
}

/** Calls a built-in; `ask` gets a sink that completes paths and tells its own exceptions from the built-in's. */
template <typename Ask>
Status askBuiltIn(const Class& definition, const std::string& nameSpace, const Servant::InstanceSink& sink,
                  const Ask& ask) {
    std::exception_ptr thrownBySink;
    try {
        return ask([&](Instance&& instance) {
            completePath(definition, nameSpace, instance);
            try {
                sink(std::move(instance));
            } catch (...) {
                thrownBySink = std::current_exception();
                throw;
            }
        });
    } catch (const RequestError&) {
        throw;
    } catch (...) {
        if (thrownBySink) {
            std::rethrow_exception(thrownBySink);
        }
        return {CMPI_RC_ERR_FAILED, definition.name + ": " + currentExceptionText(), {}};
    }
}

/** The same for what answers no instances. */
template <typename Ask>
Status askBuiltIn(const Class& definition, const Ask& ask) {
    return askBuiltIn(definition, "", {}, [&ask](const Servant::InstanceSink& /*sink*/) { return ask(); });
}

} // namespace

Servant::Servant(const broker::Broker& broker, Provider& provider)
    : _broker(&broker), _provider(&provider), _principal(actingPrincipal()) {}

Servant::Servant(const Schema& schema, BuiltIn& builtIn) : _schema(&schema), _builtIn(&builtIn) {}

std::string Servant::name() const {
    return _provider == nullptr ? "(built in)" : _provider->registration().name;
}

Status Servant::enumerateInstances(const Class& definition, const std::string& nameSpace, const PropertyList& names,
                                   const InstanceSink& sink) const {
    if (_provider != nullptr) {
        return ProviderCall(*_broker, *_provider, _principal)
            .enumerateInstances({"", nameSpace, definition.name, {}}, names, sink);
    }
    return askBuiltIn(definition, nameSpace, sink,
                      [&](const InstanceSink& completing) { return _builtIn->enumerate(definition, completing); });
}

Status Servant::enumerateInstanceNames(const Class& definition, const std::string& nameSpace,
                                       const PathSink& sink) const {
    if (_provider != nullptr) {
        return ProviderCall(*_broker, *_provider, _principal)
            .enumerateInstanceNames({"", nameSpace, definition.name, {}}, sink);
    }
    return enumerateInstances(definition, nameSpace, std::nullopt,
                              [&sink](Instance&& instance) { sink(std::move(instance.path)); });
}

Status Servant::getInstance(const Class& definition, const ObjectPath& path, const PropertyList& names,
                            const InstanceSink& sink) const {
    if (_provider != nullptr) {
        return ProviderCall(*_broker, *_provider, _principal).getInstance(path, names, sink);
    }
    const InstanceSink picking = [&](Instance&& instance) {
        if (spellPath(*_schema, path.nameSpace, instance.path) == path) {
            sink(std::move(instance));
        }
    };
    return askBuiltIn(definition, path.nameSpace, picking,
                      [&](const InstanceSink& completing) { return _builtIn->get(definition, path, completing); });
}

Status Servant::createInstance(const Class& definition, const Instance& instance, ObjectPath& created) const {
    if (_provider != nullptr) {
        return ProviderCall(*_broker, *_provider, _principal).createInstance(instance, created);
    }
    return askBuiltIn(definition, [&] { return _builtIn->create(definition, instance, created); });
}

Status Servant::modifyInstance(const Class& definition, const Instance& instance,
                               const std::vector<std::string>& names) const {
    if (_provider != nullptr) {
        return ProviderCall(*_broker, *_provider, _principal).modifyInstance(instance, names);
    }
    return askBuiltIn(definition, [&] { return _builtIn->modify(definition, instance, names); });
}

Status Servant::deleteInstance(const Class& definition, const ObjectPath& path) const {
    if (_provider != nullptr) {
        return ProviderCall(*_broker, *_provider, _principal).deleteInstance(path);
    }
    return askBuiltIn(definition, [&] { return _builtIn->remove(definition, path); });
}

Status Servant::invokeMethod(const Class& definition, const ObjectPath& path, const Method& method,
                             const std::vector<NamedValue>& arguments, MethodAnswer& answer) const {
    if (_provider != nullptr) {
        return ProviderCall(*_broker, *_provider, _principal).invokeMethod(path, method.name, arguments, answer);
    }
    return askBuiltIn(definition, [&] { return _builtIn->invoke(definition, path, method, arguments, answer); });
}

} // namespace marlo
