/**
 * @file
 * The CMPI provider of MARLO_NetworkAdapterConfiguration: instances, methods and indications.
 */
#include "indication/NetworkIndication.h"
#include "providers/ProviderExport.h"
#include "providers/ReadOperations.h"
#include "providers/WriteOperations.h"
#include "trace/Trace.h"

#include <cmpimacs.h>

namespace Orv::NetworkAdapterComposite {

namespace {

const std::string loggerNetworkProvider = "Hearth.NetworkAdapterProvider";
constexpr const char* UNIT = "NetworkAdapterProvider";
constexpr Enumeration ENUMERATION = &NetworkAdapterObjectFactory::getAllNetworkAdapterCMPIInstances;
constexpr const char* ENUMERATION_FAILURE = "getAllNetworkAdapterCMPIInstances Failed";

/** The object manager as the latest factory call gave it; never released. */
const CMPIBroker* broker = nullptr;

/** The class of an indication path; empty when the object manager has none. `status` is that of the last call. */
std::string indicationClass(const CMPIObjectPath* classPath, CMPIStatus* status) {
    const CMPIString* name = CMGetClassName(classPath, status);
    const char* text = name != nullptr ? CMGetCharsPtr(name, status) : nullptr;
    return text != nullptr ? text : "";
}

} // namespace

CMPIStatus NetworkAdapter_Cleanup(CMPIInstanceMI* /*mi*/, const CMPIContext* /*context*/,
                                  CMPIBoolean /*terminating*/) {
    return {CMPI_RC_OK, nullptr};
}

CMPIStatus NetworkAdapter_GetInstance(CMPIInstanceMI* /*mi*/, const CMPIContext* context, const CMPIResult* result,
                                      const CMPIObjectPath* reference, const char** properties) {
    return getInstance({loggerNetworkProvider, UNIT, __func__, broker, ENUMERATION, ENUMERATION_FAILURE}, context,
                       result, reference, properties);
}

CMPIStatus NetworkAdapter_EnumInstanceNames(CMPIInstanceMI* /*mi*/, const CMPIContext* context,
                                            const CMPIResult* result, const CMPIObjectPath* reference) {
    return enumInstanceNames({loggerNetworkProvider, UNIT, __func__, broker, ENUMERATION, ENUMERATION_FAILURE},
                             context, result, reference);
}

CMPIStatus NetworkAdapter_EnumInstances(CMPIInstanceMI* /*mi*/, const CMPIContext* context, const CMPIResult* result,
                                        const CMPIObjectPath* reference, const char** properties) {
    return enumInstances({loggerNetworkProvider, UNIT, __func__, broker, ENUMERATION, ENUMERATION_FAILURE}, context,
                         result, reference, properties);
}

CMPIStatus NetworkAdapter_CreateInstance(CMPIInstanceMI* /*mi*/, const CMPIContext* /*context*/,
                                         const CMPIResult* /*result*/, const CMPIObjectPath* /*reference*/,
                                         const CMPIInstance* /*instance*/) {
    return {CMPI_RC_ERR_NOT_SUPPORTED, nullptr};
}

CMPIStatus NetworkAdapter_ModifyInstance(CMPIInstanceMI* /*mi*/, const CMPIContext* context, const CMPIResult* result,
                                         const CMPIObjectPath* reference, const CMPIInstance* instance,
                                         const char** properties) {
    return modifyInstance({loggerNetworkProvider, UNIT, __func__, broker}, context, result, reference, instance,
                          properties);
}

CMPIStatus NetworkAdapter_DeleteInstance(CMPIInstanceMI* /*mi*/, const CMPIContext* /*context*/,
                                         const CMPIResult* /*result*/, const CMPIObjectPath* /*reference*/) {
    return {CMPI_RC_ERR_NOT_SUPPORTED, nullptr};
}

CMPIStatus NetworkAdapter_ExecQuery(CMPIInstanceMI* /*mi*/, const CMPIContext* /*context*/,
                                    const CMPIResult* /*result*/, const CMPIObjectPath* /*reference*/,
                                    const char* /*language*/, const char* /*query*/) {
    return {CMPI_RC_ERR_NOT_SUPPORTED, nullptr};
}

/** Answers NOT_SUPPORTED where the other cleanups answer OK: object managers have met it so. */
CMPIStatus NetworkAdapter_MethodCleanup(CMPIMethodMI* /*mi*/, const CMPIContext* /*context*/,
                                        CMPIBoolean /*terminating*/) {
    return {CMPI_RC_ERR_NOT_SUPPORTED, nullptr};
}

CMPIStatus NetworkAdapter_InvokeMethod(CMPIMethodMI* /*mi*/, const CMPIContext* /*context*/, const CMPIResult* result,
                                       const CMPIObjectPath* reference, const char* methodName, const CMPIArgs* in,
                                       CMPIArgs* /*out*/) {
    return invokeMethod({loggerNetworkProvider, UNIT, __func__, broker}, result, reference, methodName, in);
}

CMPIStatus NetworkAdapter_IndicationCleanup(CMPIIndicationMI* /*mi*/, const CMPIContext* /*context*/,
                                            CMPIBoolean /*terminating*/) {
    return {CMPI_RC_OK, nullptr};
}

CMPIStatus NetworkAdapter_AuthorizeFilter(CMPIIndicationMI* /*mi*/, const CMPIContext* /*context*/,
                                          const CMPISelectExp* /*filter*/, const char* /*className*/,
                                          const CMPIObjectPath* /*classPath*/, const char* /*owner*/) {
    markProviderEntry(loggerNetworkProvider, UNIT, __func__, __LINE__);
    markProviderExit(loggerNetworkProvider, UNIT, __func__, __LINE__);
    return {CMPI_RC_OK, nullptr};
}

/** Some object managers pass a sixth argument; none is looked at. */
CMPIStatus NetworkAdapter_MustPoll(CMPIIndicationMI* /*mi*/, const CMPIContext* /*context*/,
                                   const CMPISelectExp* /*filter*/, const char* /*className*/,
                                   const CMPIObjectPath* /*classPath*/) {
    markProviderEntry(loggerNetworkProvider, UNIT, __func__, __LINE__);
    markProviderExit(loggerNetworkProvider, UNIT, __func__, __LINE__);
    return {CMPI_RC_OK, nullptr};
}

/** The class of the path counts, whatever the filter and its class name say; selecting by filter is not done here. */
CMPIStatus NetworkAdapter_ActivateFilter(CMPIIndicationMI* /*mi*/, const CMPIContext* context,
                                         const CMPISelectExp* /*filter*/, const char* /*className*/,
                                         const CMPIObjectPath* classPath, CMPIBoolean /*firstActivation*/) {
    const ProviderLog log(loggerNetworkProvider, UNIT, __func__);
    markProviderEntry(loggerNetworkProvider, UNIT, __func__, __LINE__);
    CMPIStatus status = {CMPI_RC_OK, nullptr};
    unsigned short id = INDICATION_NONE;
    const std::string className = indicationClass(classPath, &status);
    log.variable("className", className);
    if (!getNetworkIndicationId(className.c_str(), id)) {
        log.message(LEVEL_FAILURE, "The Given Class does not support indication");
        status = {CMPI_RC_ERR_NOT_SUPPORTED, nullptr};
    } else {
        saveIndicationContext(broker, CBPrepareAttachThread(broker, context));
        subscribeforEvent(id);
    }
    markProviderExit(loggerNetworkProvider, UNIT, __func__, __LINE__);
    return status;
}

CMPIStatus NetworkAdapter_DeActivateFilter(CMPIIndicationMI* /*mi*/, const CMPIContext* /*context*/,
                                           const CMPISelectExp* /*filter*/, const char* /*className*/,
                                           const CMPIObjectPath* classPath, CMPIBoolean /*lastActivation*/) {
    const ProviderLog log(loggerNetworkProvider, UNIT, __func__);
    markProviderEntry(loggerNetworkProvider, UNIT, __func__, __LINE__);
    CMPIStatus status = {CMPI_RC_OK, nullptr};
    unsigned short id = INDICATION_NONE;
    const std::string className = indicationClass(classPath, &status);
    log.variable("className", className);
    if (!getNetworkIndicationId(className.c_str(), id)) {
        log.message(LEVEL_FAILURE, "The Given Class does not support Indication");
        status = {CMPI_RC_ERR_NOT_SUPPORTED, nullptr};
    } else {
        UnsubscribeforEvent(id);
    }
    markProviderExit(loggerNetworkProvider, UNIT, __func__, __LINE__);
    return status;
}

CMPIStatus NetworkAdapter_EnableIndications(CMPIIndicationMI* /*mi*/, const CMPIContext* /*context*/) {
    markProviderEntry(loggerNetworkProvider, UNIT, __func__, __LINE__);
    setNetworkEnable();
    markProviderExit(loggerNetworkProvider, UNIT, __func__, __LINE__);
    return {CMPI_RC_OK, nullptr};
}

CMPIStatus NetworkAdapter_DisableIndications(CMPIIndicationMI* /*mi*/, const CMPIContext* /*context*/) {
    markProviderEntry(loggerNetworkProvider, UNIT, __func__, __LINE__);
    disableNetworkIndication();
    markProviderExit(loggerNetworkProvider, UNIT, __func__, __LINE__);
    return {CMPI_RC_OK, nullptr};
}

CMPIStatus NetworkAdapter_AuthorizeFilterCollection(CMPIIndicationMI* /*mi*/, const CMPIContext* /*context*/,
                                                    const CMPIInstance* /*collection*/) {
    return {CMPI_RC_ERR_NOT_SUPPORTED, nullptr};
}

CMPIStatus NetworkAdapter_ActivateFilterCollection(CMPIIndicationMI* /*mi*/, const CMPIContext* /*context*/,
                                                   const CMPIInstance* /*collection*/,
                                                   CMPIBoolean /*firstActivation*/) {
    return {CMPI_RC_ERR_NOT_SUPPORTED, nullptr};
}

CMPIStatus NetworkAdapter_DeActivateFilterCollection(CMPIIndicationMI* /*mi*/, const CMPIContext* /*context*/,
                                                     const CMPIInstance* /*collection*/,
                                                     CMPIBoolean /*lastActivation*/) {
    return {CMPI_RC_ERR_NOT_SUPPORTED, nullptr};
}

namespace {

// NOLINTNEXTLINE(bugprone-reserved-identifier,cert-dcl37-c,cert-dcl51-cpp): the usual name of a CMPI table
const CMPIInstanceMIFT instMIFT__ = {
    MI_VERSION,
    MI_VERSION,
    "instanceNetworkAdapterProvider",
    NetworkAdapter_Cleanup,
    NetworkAdapter_EnumInstanceNames,
    NetworkAdapter_EnumInstances,
    NetworkAdapter_GetInstance,
    NetworkAdapter_CreateInstance,
    NetworkAdapter_ModifyInstance,
    NetworkAdapter_DeleteInstance,
    NetworkAdapter_ExecQuery,
};

// NOLINTNEXTLINE(bugprone-reserved-identifier,cert-dcl37-c,cert-dcl51-cpp): the usual name of a CMPI table
const CMPIMethodMIFT methMIFT__ = {
    MI_VERSION, MI_VERSION, "methodNetworkAdapterProvider", NetworkAdapter_MethodCleanup, NetworkAdapter_InvokeMethod,
};

// NOLINTNEXTLINE(bugprone-reserved-identifier,cert-dcl37-c,cert-dcl51-cpp): the usual name of a CMPI table
const CMPIIndicationMIFT indMIFT__ = {
    MI_VERSION,
    MI_VERSION,
    "IndicationNetworkAdapterProvider",
    NetworkAdapter_IndicationCleanup,
    NetworkAdapter_AuthorizeFilter,
    NetworkAdapter_MustPoll,
    NetworkAdapter_ActivateFilter,
    NetworkAdapter_DeActivateFilter,
    NetworkAdapter_EnableIndications,
    NetworkAdapter_DisableIndications,
    NetworkAdapter_AuthorizeFilterCollection,
    NetworkAdapter_ActivateFilterCollection,
    NetworkAdapter_DeActivateFilterCollection,
};
} // namespace

} // namespace Orv::NetworkAdapterComposite

using namespace Orv::NetworkAdapterComposite;

MARLO_PROVIDER_FACTORY CMPIInstanceMI* NetworkAdapterProvider_Create_InstanceMI(const CMPIBroker* caller,
                                                                                const CMPIContext* /*context*/,
                                                                                CMPIStatus* /*status*/) {
    static CMPIInstanceMI mi = {nullptr, &instMIFT__};
    broker = caller;
    return &mi;
}

MARLO_PROVIDER_FACTORY CMPIMethodMI* NetworkAdapterProvider_Create_MethodMI(const CMPIBroker* caller,
                                                                            const CMPIContext* /*context*/,
                                                                            CMPIStatus* /*status*/) {
    static CMPIMethodMI mi = {nullptr, &methMIFT__};
    broker = caller;
    return &mi;
}

MARLO_PROVIDER_FACTORY CMPIIndicationMI* NetworkAdapterProvider_Create_IndicationMI(const CMPIBroker* caller,
                                                                                    const CMPIContext* /*context*/,
                                                                                    CMPIStatus* /*status*/) {
    static CMPIIndicationMI mi = {nullptr, &indMIFT__};
    broker = caller;
    return &mi;
}
