#include "factory/FactoryParts.h"
#include "factory/NetworkAdapterObjectFactory.h"

#include <array>

namespace Orv::NetworkAdapterComposite {

namespace {

constexpr PlatformClass PORT{"TAVIS_NetworkPort", "CB CALL CLASS_TAVIS_NETWORK_PORT SUCCESS",
                             "SystemCreationClassName", "TAVIS_SPComputerSystem"};

constexpr std::array COPIED{
    CopiedProperty{"Status", DATA_TYPE_STRING},
    CopiedProperty{"SystemName", DATA_TYPE_STRING},
    CopiedProperty{"DeviceID", DATA_TYPE_STRING},
    CopiedProperty{"ElementName", DATA_TYPE_STRING},
    CopiedProperty{"Caption", DATA_TYPE_STRING},
    CopiedProperty{"Description", DATA_TYPE_STRING},
    CopiedProperty{"Name", DATA_TYPE_STRING},
    CopiedProperty{"Speed", DATA_TYPE_UINT64},
    CopiedProperty{"MaxSpeed", DATA_TYPE_UINT64},
    CopiedProperty{"RequestedSpeed", DATA_TYPE_UINT64},
    CopiedProperty{"PortType", DATA_TYPE_UINT16},
    CopiedProperty{"PortNumber", DATA_TYPE_UINT16},
    CopiedProperty{"PermanentAddress", DATA_TYPE_STRING},
    CopiedProperty{"FullDuplex", DATA_TYPE_BOOLEAN},
    CopiedProperty{"AutoSense", DATA_TYPE_BOOLEAN},
    CopiedProperty{"LinkTechnology", DATA_TYPE_UINT16},
};

void fill(CMPIInstance* instance, const CMPIData& port, CMPIStatus* status) {
    setText(instance, "CreationClassName", CLASS_LOGICAL);
    setText(instance, "SystemCreationClassName", "MARLO_ComputerSystem");
    for (const CopiedProperty& property : COPIED) {
        mapProperty(port, instance, property.name, property.type, status);
    }
}

} // namespace

CMPIInstance* NetworkAdapterObjectFactory::makeLogicalNetworkAdapterInstance(const CMPIBroker* broker,
                                                                             const CMPIObjectPath* reference,
                                                                             const char** /*properties*/,
                                                                             bool /*flag*/, CMPIStatus* /*status*/) {
    const ProviderLog log(loggerNetworkObjFactory, FACTORY_UNIT, __func__);
    log.entering();
    CMPIObjectPath* path = makeObjectPath(broker, reference, CLASS_LOGICAL);
    CMPIInstance* instance = path != nullptr ? CMNewInstance(broker, path, nullptr) : nullptr;
    log.exiting();
    return instance;
}

int NetworkAdapterObjectFactory::getAllLogicalNetworkAdapterCMPIInstances(
    const CMPIBroker* broker, const CMPIContext* context, const CMPIObjectPath* reference, const char* className,
    const char** properties, bool flag, std::vector<CMPIInstance*>& instances, CMPIStatus* status) {
    const ProviderLog log(loggerNetworkObjFactory, FACTORY_UNIT, __func__);
    log.entering();
    if (!textEqual(className, CLASS_LOGICAL)) {
        log.message(LEVEL_FAILURE, NO_INSTANCE_FOUND);
        log.exiting();
        return 1;
    }
    forEachPlatformInstance(broker, context, PORT, log, status, [&](const CMPIData& port, const std::string&) {
        CMPIInstance* instance = makeLogicalNetworkAdapterInstance(broker, reference, properties, flag, status);
        if (instance != nullptr) {
            fill(instance, port, status);
            instances.push_back(instance);
        }
    });
    log.exiting();
    return 0;
}

} // namespace Orv::NetworkAdapterComposite
