#include "host/broker/Convert.h"
#include "host/broker/OperationSlots.h"
#include "host/broker/Slot.h"
#include "host/broker/Values.h"

#include <utility>

namespace marlo::broker {

namespace {

/** Does what returns nothing but a status, with the text that the other slots give through their last argument. */
template <typename Operation>
CMPIStatus answering(const CMPIBroker* handle, const Operation& operation) {
    CMPIStatus status{};
    auto* broker = objectOf<BrokerState>(handle);
    if (broker == nullptr) {
        return statusOf(CMPI_RC_ERR_INVALID_HANDLE);
    }
    try {
        operation(status, *broker);
    } catch (const std::exception&) {
        return statusOf(CMPI_RC_ERR_FAILED);
    }
    return status;
}

std::vector<NamedValue> argumentsOf(const CMPIArgs* handle) {
    const auto* args = objectOf<ArgsObject>(handle);
    return args == nullptr ? std::vector<NamedValue>{} : toModel(args->values);
}

} // namespace

std::optional<Instance> targetOf(CMPIStatus& status, const BrokerState& broker, const CMPIObjectPath* handle,
                                 const CMPIInstance* instance) {
    const auto* object = objectOf<InstanceObject>(instance);
    auto path = targetOf(status, broker, handle);
    if (!path) {
        return std::nullopt;
    }
    if (object == nullptr) {
        status.rc = CMPI_RC_ERR_INVALID_HANDLE;
        return std::nullopt;
    }
    return Instance{*std::move(path), toModel(object->properties)};
}

CMPIObjectPath* createInstance(CMPIStatus& status, BrokerState& broker, const CMPIContext* /*context*/,
                               const CMPIObjectPath* path, const CMPIInstance* instance) {
    const auto target = targetOf(status, broker, path, instance);
    if (!target) {
        return nullptr;
    }
    ObjectPath created;
    const Outcome outcome = broker.upCalls()->createInstance(*target, created);
    return report(status, outcome) ? &toObject(currentArena(), broker, created)->handle : nullptr;
}

CMPIData invokeMethod(CMPIStatus& status, BrokerState& broker, const CMPIContext* /*context*/,
                      const CMPIObjectPath* path, const char* method, const CMPIArgs* in, CMPIArgs* out) {
    const auto target = targetOf(status, broker, path);
    if (!target) {
        return emptyAnswer<CMPIData>();
    }
    Value returned;
    std::vector<NamedValue> given;
    const Outcome outcome = broker.upCalls()->invokeMethod(*target, textOf(method), argumentsOf(in), returned, given);
    if (!report(status, outcome)) {
        return emptyAnswer<CMPIData>();
    }
    if (auto* args = objectOf<ArgsObject>(out)) {
        for (const NamedValue& value : given) {
            args->values.set(value.name, toData(args->arena(), broker, value.value));
        }
    }
    return toData(currentArena(), broker, returned);
}

CMPIData getProperty(CMPIStatus& status, BrokerState& broker, const CMPIContext* /*context*/,
                     const CMPIObjectPath* path, const char* name) {
    const auto target = targetOf(status, broker, path);
    if (!target) {
        return emptyAnswer<CMPIData>();
    }
    CMPIData data = nullData(CMPI_null);
    const Outcome outcome =
        broker.upCalls()->getInstance(*target, std::vector<std::string>{textOf(name)}, [&](Instance&& instance) {
            if (const NamedValue* found = findName(instance.properties, textOf(name))) {
                data = toData(currentArena(), broker, found->value);
            }
        });
    return report(status, outcome) ? data : emptyAnswer<CMPIData>();
}

CMPIStatus modifyInstance(const CMPIBroker* handle, const CMPIContext* /*context*/, const CMPIObjectPath* path,
                          const CMPIInstance* instance, const char** properties) {
    return answering(handle, [&](CMPIStatus& status, BrokerState& broker) {
        if (const auto target = targetOf(status, broker, path, instance)) {
            report(status, broker.upCalls()->modifyInstance(*target, namesOf(properties)));
        }
    });
}

CMPIStatus deleteInstance(const CMPIBroker* handle, const CMPIContext* /*context*/, const CMPIObjectPath* path) {
    return answering(handle, [&](CMPIStatus& status, BrokerState& broker) {
        if (const auto target = targetOf(status, broker, path)) {
            report(status, broker.upCalls()->deleteInstance(*target));
        }
    });
}

CMPIStatus setProperty(const CMPIBroker* handle, const CMPIContext* /*context*/, const CMPIObjectPath* path,
                       const char* name, const CMPIValue* value, CMPIType type) {
    return answering(handle, [&](CMPIStatus& status, BrokerState& broker) {
        CMPIData data{};
        const auto target = targetOf(status, broker, path);
        if (!target) {
            return;
        }
        status.rc = takeValue(currentArena(), value, type, Accepted::cim, data);
        if (status.rc == CMPI_RC_OK) {
            const Instance modified{*target, {{textOf(name), toModel(data)}}};
            report(status, broker.upCalls()->modifyInstance(modified, std::vector<std::string>{textOf(name)}));
        }
    });
}

} // namespace marlo::broker
