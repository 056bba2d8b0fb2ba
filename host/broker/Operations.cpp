/**
 * @file
 * The broker's services: attached threads, indications, and operations on what other providers serve.
 */
#include "host/broker/BrokerState.h"
#include "host/broker/Convert.h"
#include "host/broker/Slot.h"
#include "host/broker/Unsupported.h"

namespace marlo::broker {

namespace {

CMPIContext* prepareAttachThread(const CMPIBroker* handle, const CMPIContext* context) {
    auto* broker = objectOf<BrokerState>(handle);
    const auto* object = objectOf<ContextObject>(context);
    if (broker == nullptr || object == nullptr) {
        return nullptr;
    }
    try {
        return &broker->prepare(*object).handle;
    } catch (const std::exception&) {
        return nullptr;
    }
}

CMPIrc attachThread(BrokerState& broker, const CMPIContext* context) {
    const auto* object = objectOf<ContextObject>(context);
    if (object == nullptr) {
        return CMPI_RC_ERR_INVALID_HANDLE;
    }
    broker.attach(*object);
    return CMPI_RC_OK;
}

CMPIrc detachThread(BrokerState& broker, const CMPIContext* context) {
    const auto* object = objectOf<ContextObject>(context);
    if (object == nullptr) {
        return CMPI_RC_ERR_INVALID_HANDLE;
    }
    return broker.detach(*object) ? CMPI_RC_OK : CMPI_RC_ERR_FAILED;
}

CMPIrc deliverIndication(BrokerState& broker, const CMPIContext* context, const char* nameSpace,
                         const CMPIInstance* indication) {
    const auto* instance = objectOf<InstanceObject>(indication);
    if (instance == nullptr || objectOf<ContextObject>(context) == nullptr) {
        return CMPI_RC_ERR_INVALID_HANDLE;
    }
    if (nameSpace == nullptr) {
        return CMPI_RC_ERR_INVALID_PARAMETER;
    }
    if (broker.upCalls() == nullptr) {
        return CMPI_RC_ERR_NOT_SUPPORTED;
    }
    return broker.upCalls()->deliverIndication(nameSpace, toModel(*instance)).code;
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

/** The path that an up-call is about, or nothing and the status that says why there can be none. */
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

/** Takes an outcome over into a status; true when it was good. */
bool report(CMPIStatus& status, const Outcome& outcome) {
    status.rc = outcome.code;
    if (!outcome.message.empty()) {
        status.msg = &StringObject::make(currentArena(), outcome.message)->handle;
    }
    return outcome.code == CMPI_RC_OK;
}

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

CMPIEnumeration* enumerateInstances(CMPIStatus& status, BrokerState& broker, const CMPIContext* /*context*/,
                                    const CMPIObjectPath* path, const char** properties) {
    const auto target = targetOf(status, broker, path);
    if (!target) {
        return nullptr;
    }
    Arena& arena = currentArena(); // the caller's: results outlive the scope in which they are made
    EnumerationObject* enumeration = EnumerationObject::make(arena, CMPI_instance);
    const Outcome outcome =
        broker.upCalls()->enumerateInstances(*target, namesOf(properties), [&](Instance&& instance) {
            enumeration->add(dataOf(*toObject(arena, broker, instance)));
        });
    return report(status, outcome) ? &enumeration->handle : nullptr;
}

CMPIEnumeration* enumerateInstanceNames(CMPIStatus& status, BrokerState& broker, const CMPIContext* /*context*/,
                                        const CMPIObjectPath* path) {
    const auto target = targetOf(status, broker, path);
    if (!target) {
        return nullptr;
    }
    Arena& arena = currentArena();
    EnumerationObject* enumeration = EnumerationObject::make(arena, CMPI_ref);
    const Outcome outcome = broker.upCalls()->enumerateInstanceNames(
        *target, [&](ObjectPath&& name) { enumeration->add(dataOf(*toObject(arena, broker, name))); });
    return report(status, outcome) ? &enumeration->handle : nullptr;
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

constexpr unsigned capabilities = CMPI_MB_BasicRead | CMPI_MB_Indications | CMPI_MB_OSEncapsulationSupport |
                                  CMPI_MB_MemEnhancements | CMPI_MB_Extended_Error;

} // namespace

const CMPIBrokerFT operationTable = {
    capabilities,
    CMPI_VERSION,
    "marlo",
    prepareAttachThread,
    slot<attachThread>,
    slot<detachThread>,
    slot<deliverIndication>,
    slot<enumerateInstanceNames>,
    slot<getInstance>,
    unsupported<decltype(CMPIBrokerFT::createInstance)>,
    unsupported<decltype(CMPIBrokerFT::modifyInstance)>,
    unsupported<decltype(CMPIBrokerFT::deleteInstance)>,
    unsupported<decltype(CMPIBrokerFT::execQuery)>,
    slot<enumerateInstances>,
    unsupported<decltype(CMPIBrokerFT::associators)>,
    unsupported<decltype(CMPIBrokerFT::associatorNames)>,
    unsupported<decltype(CMPIBrokerFT::references)>,
    unsupported<decltype(CMPIBrokerFT::referenceNames)>,
    unsupported<decltype(CMPIBrokerFT::invokeMethod)>,
    unsupported<decltype(CMPIBrokerFT::setProperty)>,
    unsupported<decltype(CMPIBrokerFT::getProperty)>,
    unsupported<decltype(CMPIBrokerFT::enumerateInstancesFiltered)>,
    unsupported<decltype(CMPIBrokerFT::associatorsFiltered)>,
    unsupported<decltype(CMPIBrokerFT::referencesFiltered)>,
};

} // namespace marlo::broker
