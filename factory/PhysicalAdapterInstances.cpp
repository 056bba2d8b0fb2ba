#include "factory/FactoryParts.h"
#include "factory/NetworkAdapterObjectFactory.h"

#include <array>

namespace Orv::NetworkAdapterComposite {

namespace {

constexpr PlatformClass CARD{"TAVIS_NetworkCard", "CB CALL CLASS_TAVIS_NETWORK_CARD SUCCESS", "Name", "NIC1"};

constexpr std::array COPIED{
    CopiedProperty{"Status", DATA_TYPE_STRING},       CopiedProperty{"ElementName", DATA_TYPE_STRING},
    CopiedProperty{"Description", DATA_TYPE_STRING},  CopiedProperty{"Name", DATA_TYPE_STRING},
    CopiedProperty{"SerialNumber", DATA_TYPE_STRING}, CopiedProperty{"PackageType", DATA_TYPE_UINT16},
};

void fill(CMPIInstance* instance, const CMPIData& card, const std::string& name, CMPIStatus* status) {
    setText(instance, "CreationClassName", CLASS_PHYSICAL);
    for (const CopiedProperty& property : COPIED) {
        mapProperty(card, instance, property.name, property.type, status);
    }
    setText(instance, "Tag", name.c_str());
}

} // namespace

CMPIInstance* NetworkAdapterObjectFactory::makePhysicalNetworkAdapterCMPIInstance(const CMPIBroker* broker,
                                                                                  const CMPIObjectPath* reference,
                                                                                  const char** /*properties*/,
                                                                                  bool /*flag*/,
                                                                                  CMPIStatus* /*status*/) {
    const ProviderLog log(loggerNetworkObjFactory, FACTORY_UNIT, __func__);
    log.entering();
    CMPIInstance* instance = nullptr;
    if (CMPIObjectPath* path = makeObjectPath(broker, reference, CLASS_PHYSICAL); path != nullptr) {
        instance = CMNewInstance(broker, path, nullptr);
        if (instance != nullptr && instance->hdl != nullptr) {
            setText(instance, "CreationClassName", CLASS_PHYSICAL);
        }
    }
    log.exiting();
    return instance;
}

int NetworkAdapterObjectFactory::getAllPhysicalNetworkAdapterCMPIInstances(
    const CMPIBroker* broker, const CMPIContext* context, const CMPIObjectPath* reference, const char* className,
    const char** properties, bool flag, std::vector<CMPIInstance*>& instances, CMPIStatus* status) {
    const ProviderLog log(loggerNetworkObjFactory, FACTORY_UNIT, __func__);
    log.entering();
    if (!textEqual(className, CLASS_PHYSICAL)) {
        log.message(LEVEL_FAILURE, NO_INSTANCE_FOUND);
        log.exiting();
        return 1;
    }
    forEachPlatformInstance(broker, context, CARD, log, status, [&](const CMPIData& card, const std::string& name) {
        CMPIInstance* instance = makePhysicalNetworkAdapterCMPIInstance(broker, reference, properties, flag, status);
        if (instance != nullptr) {
            fill(instance, card, name, status);
            instances.push_back(instance);
        }
    });
    log.exiting();
    return 0;
}

} // namespace Orv::NetworkAdapterComposite
