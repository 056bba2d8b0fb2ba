#include "configuration/PropertyModification.h"

#include "factory/FactoryParts.h"
#include "factory/NetworkAdapterObjectFactory.h"

namespace Orv::NetworkAdapterComposite {

namespace {

/** The first element of an array property; empty where there is none. */
std::string firstOf(const CMPIInstance* instance, const char* name, CMPIStatus* status) {
    const CMPIData data = CMGetProperty(instance, name, status);
    if ((data.state & CMPI_nullValue) != 0 || (data.type & CMPI_ARRAY) == 0 || data.value.array == nullptr ||
        CMGetArrayCount(data.value.array, status) == 0) {
        return {};
    }
    return elementOf(data.value.array, 0, status);
}

} // namespace

int NetworkAdapterObjectFactory::modifyNetworkAdapterCMPIInstance(const CMPIBroker* /*broker*/,
                                                                  const CMPIContext* /*context*/,
                                                                  const CMPIObjectPath* reference,
                                                                  const char** /*properties*/, bool /*flag*/,
                                                                  const CMPIInstance* instance, CMPIStatus* status) {
    const ProviderLog log(loggerNetworkObjFactory, FACTORY_UNIT, __func__);
    log.variable("modifyobjstring", pathText(CMGetObjectPath(instance, status), status));
    const std::string settingId = textOf(CMGetKey(reference, "SettingID", status));
    log.variable("NameKey", settingId);
    const std::string address = firstOf(instance, "IPv4Address", status);
    log.variable("ipAddr", address);
    const std::string mask = firstOf(instance, "SubnetMask", status);
    log.variable("ipSubnetMask", mask);
    const std::string gateway = firstOf(instance, "DefaultIPGateway", status);
    log.variable("ipGateway", gateway);
    std::string domain;
    const CMPIData domainData = CMGetProperty(instance, "DNSDomain", status);
    if ((domainData.state & CMPI_nullValue) == 0) {
        domain = textOf(domainData);
        log.variable("ipDomainName", domain);
    }
    const int result = modifyNetworkAdapterConfigurationInstances(settingId, address, gateway, mask, domain);
    if (result != 0) {
        log.message(LEVEL_FAILURE, " Network Adapter Configuration Failed ");
    } else {
        log.exiting();
    }
    return result;
}

} // namespace Orv::NetworkAdapterComposite
