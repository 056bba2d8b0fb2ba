/**
 * @file
 * The CMPI provider of MARLO_LogicalNetworkAdapter.
 */
#include "providers/ProviderExport.h"
#include "providers/ReadOperations.h"

namespace Orv::NetworkAdapterComposite {

namespace {

const std::string loggerLogicalNetworkProvider = "Hearth.LogicalNetworkAdapterProvider";
constexpr const char* UNIT = "LogicalNetworkAdapterProvider";
constexpr Enumeration ENUMERATION = &NetworkAdapterObjectFactory::getAllLogicalNetworkAdapterCMPIInstances;
constexpr const char* ENUMERATION_FAILURE = "getAllNetworkAdapterCMPIInstances Failed";

/** The object manager as the latest factory call gave it; never released. */
const CMPIBroker* broker = nullptr;

} // namespace

CMPIStatus LogicalNetworkAdapter_Cleanup(CMPIInstanceMI* /*mi*/, const CMPIContext* /*context*/,
                                         CMPIBoolean /*terminating*/) {
    return {CMPI_RC_OK, nullptr};
}

CMPIStatus LogicalNetworkAdapter_GetInstance(CMPIInstanceMI* /*mi*/, const CMPIContext* context,
                                             const CMPIResult* result, const CMPIObjectPath* reference,
                                             const char** properties) {
    return getInstance({loggerLogicalNetworkProvider, UNIT, __func__, broker, ENUMERATION, ENUMERATION_FAILURE},
                       context, result, reference, properties);
}

CMPIStatus LogicalNetworkAdapter_EnumInstanceNames(CMPIInstanceMI* /*mi*/, const CMPIContext* context,
                                                   const CMPIResult* result, const CMPIObjectPath* reference) {
    return enumInstanceNames({loggerLogicalNetworkProvider, UNIT, __func__, broker, ENUMERATION, ENUMERATION_FAILURE},
                             context, result, reference);
}

CMPIStatus LogicalNetworkAdapter_EnumInstances(CMPIInstanceMI* /*mi*/, const CMPIContext* context,
                                               const CMPIResult* result, const CMPIObjectPath* reference,
                                               const char** properties) {
    return enumInstances({loggerLogicalNetworkProvider, UNIT, __func__, broker, ENUMERATION, ENUMERATION_FAILURE},
                         context, result, reference, properties);
}

CMPIStatus LogicalNetworkAdapter_CreateInstance(CMPIInstanceMI* /*mi*/, const CMPIContext* /*context*/,
                                                const CMPIResult* /*result*/, const CMPIObjectPath* /*reference*/,
                                                const CMPIInstance* /*instance*/) {
    return {CMPI_RC_ERR_NOT_SUPPORTED, nullptr};
}

CMPIStatus LogicalNetworkAdapter_ModifyInstance(CMPIInstanceMI* /*mi*/, const CMPIContext* /*context*/,
                                                const CMPIResult* /*result*/, const CMPIObjectPath* /*reference*/,
                                                const CMPIInstance* /*instance*/, const char** /*properties*/) {
    return {CMPI_RC_ERR_NOT_SUPPORTED, nullptr};
}

CMPIStatus LogicalNetworkAdapter_DeleteInstance(CMPIInstanceMI* /*mi*/, const CMPIContext* /*context*/,
                                                const CMPIResult* /*result*/, const CMPIObjectPath* /*reference*/) {
    return {CMPI_RC_ERR_NOT_SUPPORTED, nullptr};
}

CMPIStatus LogicalNetworkAdapter_ExecQuery(CMPIInstanceMI* /*mi*/, const CMPIContext* /*context*/,
                                           const CMPIResult* /*result*/, const CMPIObjectPath* /*reference*/,
                                           const char* /*language*/, const char* /*query*/) {
    return {CMPI_RC_ERR_NOT_SUPPORTED, nullptr};
}

namespace {

// NOLINTNEXTLINE(bugprone-reserved-identifier,cert-dcl37-c,cert-dcl51-cpp): the usual name of a CMPI table
const CMPIInstanceMIFT instMIFT__ = {
    MI_VERSION,
    MI_VERSION,
    "instanceLogicalNetworkAdapterProvider",
    LogicalNetworkAdapter_Cleanup,
    LogicalNetworkAdapter_EnumInstanceNames,
    LogicalNetworkAdapter_EnumInstances,
    LogicalNetworkAdapter_GetInstance,
    LogicalNetworkAdapter_CreateInstance,
    LogicalNetworkAdapter_ModifyInstance,
    LogicalNetworkAdapter_DeleteInstance,
    LogicalNetworkAdapter_ExecQuery,
};
} // namespace

} // namespace Orv::NetworkAdapterComposite

using namespace Orv::NetworkAdapterComposite;

MARLO_PROVIDER_FACTORY CMPIInstanceMI* LogicalNetworkAdapterProvider_Create_InstanceMI(const CMPIBroker* caller,
                                                                                       const CMPIContext* /*context*/,
                                                                                       CMPIStatus* /*status*/) {
    static CMPIInstanceMI mi = {nullptr, &instMIFT__};
    broker = caller;
    return &mi;
}
