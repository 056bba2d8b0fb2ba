#include "host/broker/Convert.h"
#include "host/broker/OperationSlots.h"
#include "host/broker/Scope.h"

#include <functional>

namespace marlo::broker {

namespace {

CMPIData dataOf(InstanceObject& instance) {
    CMPIData data{};
    data.type = CMPI_instance;
    data.value.inst = &instance.handle;
    return data;
}

CMPIData dataOf(ObjectPathObject& path) {
    CMPIData data{};
    data.type = CMPI_ref;
    data.value.ref = &path.handle;
    return data;
}

/** Makes an enumeration of what an operation hands over. It lies in the caller's memory, which outlives the call. */
template <typename Element>
CMPIEnumeration* collect(CMPIStatus& status, const BrokerState& broker, CMPIType type,
                         const std::function<Outcome(const std::function<void(Element&&)>&)>& operation) {
    Arena& arena = currentArena();
    EnumerationObject* enumeration = EnumerationObject::make(arena, type);
    const Outcome outcome =
        operation([&](Element&& element) { enumeration->add(dataOf(*toObject(arena, broker, element))); });
    return report(status, outcome) ? &enumeration->handle : nullptr;
}

CMPIEnumeration* collectInstances(CMPIStatus& status, const BrokerState& broker,
                                  const std::function<Outcome(const UpCalls::InstanceSink&)>& operation) {
    return collect<Instance>(status, broker, CMPI_instance, operation);
}

CMPIEnumeration* collectPaths(CMPIStatus& status, const BrokerState& broker,
                              const std::function<Outcome(const UpCalls::PathSink&)>& operation) {
    return collect<ObjectPath>(status, broker, CMPI_ref, operation);
}

} // namespace

std::string textOf(const char* text) {
    return text == nullptr ? "" : text;
}

UpCalls::PropertyNames namesOf(const char** list) {
    if (list == nullptr) {
        return std::nullopt;
    }
    std::vector<std::string> names;
    for (; *list != nullptr; ++list) {
        names.emplace_back(*list);
    }
    return names;
}

std::optional<ObjectPath> targetOf(CMPIStatus& status, const BrokerState& broker, const CMPIObjectPath* handle) {
    const auto* path = objectOf<ObjectPathObject>(handle);
    if (path == nullptr) {
        status.rc = CMPI_RC_ERR_INVALID_HANDLE;
        return std::nullopt;
    }
    if (broker.upCalls() == nullptr) {
        status.rc = CMPI_RC_ERR_NOT_SUPPORTED;
        return std::nullopt;
    }
    return toModel(*path);
}

bool report(CMPIStatus& status, const Outcome& outcome) {
    status.rc = outcome.code;
    if (!outcome.message.empty()) {
        status.msg = &StringObject::make(currentArena(), outcome.message)->handle;
    }
    return outcome.code == CMPI_RC_OK;
}

CMPIEnumeration* enumerateInstances(CMPIStatus& status, BrokerState& broker, const CMPIContext* /*context*/,
                                    const CMPIObjectPath* path, const char** properties) {
    const auto target = targetOf(status, broker, path);
    return !target ? nullptr : collectInstances(status, broker, [&](const UpCalls::InstanceSink& sink) {
        return broker.upCalls()->enumerateInstances(*target, namesOf(properties), sink);
    });
}

CMPIEnumeration* enumerateInstanceNames(CMPIStatus& status, BrokerState& broker, const CMPIContext* /*context*/,
                                        const CMPIObjectPath* path) {
    const auto target = targetOf(status, broker, path);
    return !target ? nullptr : collectPaths(status, broker, [&](const UpCalls::PathSink& sink) {
        return broker.upCalls()->enumerateInstanceNames(*target, sink);
    });
}

CMPIInstance* getInstance(CMPIStatus& status, BrokerState& broker, const CMPIContext* /*context*/,
                          const CMPIObjectPath* path, const char** properties) {
    const auto target = targetOf(status, broker, path);
    if (!target) {
        return nullptr;
    }
    Arena& arena = currentArena();
    InstanceObject* found = nullptr;
    const Outcome outcome = broker.upCalls()->getInstance(
        *target, namesOf(properties), [&](Instance&& instance) { found = toObject(arena, broker, instance); });
    if (!report(status, outcome)) {
        return nullptr;
    }
    if (found == nullptr) {
        status.rc = CMPI_RC_ERR_NOT_FOUND;
        return nullptr;
    }
    return &found->handle;
}

CMPIEnumeration* execQuery(CMPIStatus& status, BrokerState& broker, const CMPIContext* /*context*/,
                           const CMPIObjectPath* path, const char* query, const char* language) {
    const auto target = targetOf(status, broker, path);
    return !target ? nullptr : collectInstances(status, broker, [&](const UpCalls::InstanceSink& sink) {
        return broker.upCalls()->execQuery(target->nameSpace, textOf(query), textOf(language), sink);
    });
}

CMPIEnumeration* associators(CMPIStatus& status, BrokerState& broker, const CMPIContext* /*context*/,
                             const CMPIObjectPath* path, const char* associationClass, const char* resultClass,
                             const char* role, const char* resultRole, const char** properties) {
    const auto target = targetOf(status, broker, path);
    return !target ? nullptr : collectInstances(status, broker, [&](const UpCalls::InstanceSink& sink) {
        return broker.upCalls()->associators(
            *target, {textOf(associationClass), textOf(resultClass), textOf(role), textOf(resultRole)},
            namesOf(properties), sink);
    });
}

CMPIEnumeration* associatorNames(CMPIStatus& status, BrokerState& broker, const CMPIContext* /*context*/,
                                 const CMPIObjectPath* path, const char* associationClass, const char* resultClass,
                                 const char* role, const char* resultRole) {
    const auto target = targetOf(status, broker, path);
    return !target ? nullptr : collectPaths(status, broker, [&](const UpCalls::PathSink& sink) {
        return broker.upCalls()->associatorNames(
            *target, {textOf(associationClass), textOf(resultClass), textOf(role), textOf(resultRole)}, sink);
    });
}

CMPIEnumeration* references(CMPIStatus& status, BrokerState& broker, const CMPIContext* /*context*/,
                            const CMPIObjectPath* path, const char* resultClass, const char* role,
                            const char** properties) {
    const auto target = targetOf(status, broker, path);
    return !target ? nullptr : collectInstances(status, broker, [&](const UpCalls::InstanceSink& sink) {
        return broker.upCalls()->references(*target, {textOf(resultClass), "", textOf(role), ""}, namesOf(properties),
                                            sink);
    });
}

CMPIEnumeration* referenceNames(CMPIStatus& status, BrokerState& broker, const CMPIContext* /*context*/,
                                const CMPIObjectPath* path, const char* resultClass, const char* role) {
    const auto target = targetOf(status, broker, path);
    return !target ? nullptr : collectPaths(status, broker, [&](const UpCalls::PathSink& sink) {
        return broker.upCalls()->referenceNames(*target, {textOf(resultClass), "", textOf(role), ""}, sink);
    });
}

} // namespace marlo::broker
