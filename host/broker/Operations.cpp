/**
 * @file
 * The broker's own table: attached threads, indications, and operations on what other providers serve.
 */
#include "host/broker/BrokerState.h"
#include "host/broker/Convert.h"
#include "host/broker/OperationSlots.h"
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

constexpr unsigned capabilities = CMPI_MB_InstanceManipulation | CMPI_MB_AssociationTraversal |
                                  CMPI_MB_QueryExecution | CMPI_MB_Indications | CMPI_MB_OSEncapsulationSupport |
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
    slot<createInstance>,
    modifyInstance,
    deleteInstance,
    slot<execQuery>,
    slot<enumerateInstances>,
    slot<associators>,
    slot<associatorNames>,
    slot<references>,
    slot<referenceNames>,
    slot<invokeMethod>,
    setProperty,
    slot<getProperty>,
    unsupported<decltype(CMPIBrokerFT::enumerateInstancesFiltered)>,
    unsupported<decltype(CMPIBrokerFT::associatorsFiltered)>,
    unsupported<decltype(CMPIBrokerFT::referencesFiltered)>,
};

} // namespace marlo::broker
