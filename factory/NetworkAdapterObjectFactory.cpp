#include "factory/NetworkAdapterObjectFactory.h"

#include "factory/FactoryParts.h"

namespace Orv::NetworkAdapterComposite {

const std::string loggerNetworkObjFactory = "Hearth.NetworkAdapterProvider";

NetworkAdapterObjectFactory::NetworkAdapterObjectFactory(const char* className) {
    const ProviderLog log(loggerNetworkObjFactory, FACTORY_UNIT, __func__);
    log.entering();
    if (textEqual(className, CLASS_CONFIGURATION) || textEqual(className, CLASS_PHYSICAL)) {
        if (getNetworkAdapterConfigurationInstances(_networkAdapterConfigurationMap) == 0) {
            numberOfInstances = static_cast<std::uint32_t>(_networkAdapterConfigurationMap.size());
        }
    }
    log.exiting();
}

std::uint32_t NetworkAdapterObjectFactory::getNumberOfInstances() const {
    const ProviderLog log(loggerNetworkObjFactory, FACTORY_UNIT, __func__);
    log.variable("numberOfInstances", numberOfInstances);
    return numberOfInstances;
}

const char* characters(const CMPIString* text) {
    return text != nullptr ? CMGetCharPtr(text) : nullptr;
}

std::string textOf(const CMPIString* text) {
    const char* found = characters(text);
    return found != nullptr ? found : "";
}

std::string textOf(const CMPIData& data) {
    const bool isText = (data.state & CMPI_nullValue) == 0 && data.type == CMPI_string;
    return isText ? textOf(data.value.string) : "";
}

std::string pathText(const CMPIObjectPath* path, CMPIStatus* status) {
    return path != nullptr ? textOf(CMObjectPathToString(path, status)) : "";
}

std::string elementOf(const CMPIArray* array, CMPICount index, CMPIStatus* status) {
    return array != nullptr ? textOf(CMGetArrayElementAt(array, index, status)) : "";
}

CMPIObjectPath* makeObjectPath(const CMPIBroker* broker, const CMPIObjectPath* reference, const char* className) {
    const char* nameSpace = characters(CMGetNameSpace(reference, nullptr));
    CMPIObjectPath* path = CMNewObjectPath(broker, nameSpace, className, nullptr);
    if (path == nullptr || path->hdl == nullptr) {
        return nullptr;
    }
    (void)CMSetNameSpace(path, characters(CMGetNameSpace(reference, nullptr)));
    (void)CMSetHostname(path, getSystemName().c_str());
    return path;
}

void setText(CMPIInstance* instance, const char* name, const char* value) {
    (void)CMSetProperty(instance, name, value, CMPI_chars);
}

} // namespace Orv::NetworkAdapterComposite
