/**
 * @file
 * The CMPI provider of MARLO_PhysicalNetworkAdapter.
 */
#include "providers/ProviderExport.h"
#include "providers/ReadOperations.h"

namespace Orv::NetworkAdapterComposite {

namespace {

const std::string loggerPhysicalNetworkProvider = "Hearth.NetworkAdapterProvider";
constexpr const char* UNIT = "PhysicalNetworkAdapterProvider";
constexpr Enumeration ENUMERATION = &NetworkAdapterObjectFactory::getAllPhysicalNetworkAdapterCMPIInstances;
/** One text for all three providers, but for one operation of this one. */
constexpr const char* ENUMERATION_FAILURE = "getAllNetworkAdapterCMPIInstances Failed";

/** The object manager as the latest factory call gave it; never released. */
const CMPIBroker* broker = nullptr;

} // namespace

CMPIStatus PhysicalNetworkAdapter_Cleanup(CMPIInstanceMI* /*mi*/, const CMPIContext* /*context*/,
                                          CMPIBoolean /*terminating*/) {
    return {CMPI_RC_OK, nullptr};
}

CMPIStatus PhysicalNetworkAdapter_GetInstance(CMPIInstanceMI* /*mi*/, const CMPIContext* context,
                                              const CMPIResult* result, const CMPIObjectPath* reference,
                                              const char** properties) {
    return getInstance({loggerPhysicalNetworkProvider, UNIT, __func__, broker, ENUMERATION, ENUMERATION_FAILURE},
                       context, result, reference, properties);
}

CMPIStatus PhysicalNetworkAdapter_EnumInstanceNames(CMPIInstanceMI* /*mi*/, const CMPIContext* context,
                                                    const CMPIResult* result, const CMPIObjectPath* reference) {
    return enumInstanceNames(
        {loggerPhysicalNetworkProvider, UNIT, __func__, broker, ENUMERATION, ENUMERATION_FAILURE}, context, result,
        reference);
}

CMPIStatus PhysicalNetworkAdapter_EnumInstances(CMPIInstanceMI* /*mi*/, const CMPIContext* context,
                                                const CMPIResult* result, const CMPIObjectPath* reference,
                                                const char** properties) {
    return enumInstances({loggerPhysicalNetworkProvider, UNIT, __func__, broker, ENUMERATION,
                          "getAllPhysicalNetworkAdapterCMPIInstances Failed"},
                         context, result, reference, properties);
}

CMPIStatus PhysicalNetworkAdapter_CreateInstance(CMPIInstanceMI* /*mi*/, const CMPIContext* /*context*/,
                                                 const CMPIResult* /*result*/, const CMPIObjectPath* /*reference*/,
                                                 const CMPIInstance* /*instance*/) {
    return {CMPI_RC_ERR_NOT_SUPPORTED, nullptr};
}

CMPIStatus PhysicalNetworkAdapter_ModifyInstance(CMPIInstanceMI* /*mi*/, const CMPIContext* /*context*/,
                                                 const CMPIResult* /*result*/, const CMPIObjectPath* /*reference*/,
                                                 const CMPIInstance* /*instance*/, const char** /*properties*/) {
    return {CMPI_RC_ERR_NOT_SUPPORTED, nullptr};
}

CMPIStatus PhysicalNetworkAdapter_DeleteInstance(CMPIInstanceMI* /*mi*/, const CMPIContext* /*context*/,
                                                 const CMPIResult* /*result*/, const CMPIObjectPath* /*reference*/) {
    return {CMPI_RC_ERR_NOT_SUPPORTED, nullptr};
}

CMPIStatus PhysicalNetworkAdapter_ExecQuery(CMPIInstanceMI* /*mi*/, const CMPIContext* /*context*/,
                                            const CMPIResult* /*result*/, const CMPIObjectPath* /*reference*/,
                                            const char* /*language*/, const char* /*query*/) {
    return {CMPI_RC_ERR_NOT_SUPPORTED, nullptr};
}

namespace {

// NOLINTNEXTLINE(bugprone-reserved-identifier,cert-dcl37-c,cert-dcl51-cpp): the usual name of a CMPI table
const CMPIInstanceMIFT instMIFT__ = {
    MI_VERSION,
    MI_VERSION,
    "instancePhysicalNetworkAdapterProvider",
    PhysicalNetworkAdapter_Cleanup,
    PhysicalNetworkAdapter_EnumInstanceNames,
    PhysicalNetworkAdapter_EnumInstances,
    PhysicalNetworkAdapter_GetInstance,
    PhysicalNetworkAdapter_CreateInstance,
    PhysicalNetworkAdapter_ModifyInstance,
    PhysicalNetworkAdapter_DeleteInstance,
    PhysicalNetworkAdapter_ExecQuery,
};
} // namespace

} // namespace Orv::NetworkAdapterComposite

using namespace Orv::NetworkAdapterComposite;

MARLO_PROVIDER_FACTORY CMPIInstanceMI*
PhysicalNetworkAdapterProvider_Create_InstanceMI(const CMPIBroker* caller, const CMPIContext* /*context*/,
                                                 CMPIStatus* /*status*/) {
    static CMPIInstanceMI mi = {nullptr, &instMIFT__};
    broker = caller;
    return &mi;
}
