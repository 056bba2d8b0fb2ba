#include "factory/FactoryParts.h"

namespace Orv::NetworkAdapterComposite {

namespace {

/** Reads and logs the property that tells whose an instance is; true when it is the service processor's. */
bool isServiceProcessors(const CMPIInstance* instance, const PlatformClass& source, std::string& value,
                         const ProviderLog& log, CMPIStatus* status) {
    const CMPIData data = CMGetProperty(instance, source.filterProperty, status);
    if ((data.state & CMPI_nullValue) != 0 || data.type != CMPI_string) {
        return false;
    }
    if (const char* text = characters(data.value.string); text != nullptr) {
        value = text;
    }
    log.variable("nicName", value);
    if (value != source.filteredValue) {
        return false;
    }
    log.message(LEVEL_FILTERED, "Service Processor card needs to be filtered");
    return true;
}

} // namespace

void forEachPlatformInstance(const CMPIBroker* broker, const CMPIContext* context, const PlatformClass& source,
                             const ProviderLog& log, CMPIStatus* status, const Republish& republish) {
    CMPIObjectPath* path = CMNewObjectPath(broker, PLATFORM_NAMESPACE, source.name, status);
    CMPIEnumeration* elements = CBEnumInstances(broker, context, path, nullptr, status);
    if (status->rc != CMPI_RC_OK) {
        return;
    }
    log.message(LEVEL_FLOW, source.successMessage);
    while (elements != nullptr && CMHasNext(elements, status)) {
        const CMPIData element = CMGetNext(elements, status);
        if ((element.state & CMPI_nullValue) != 0 || element.value.inst == nullptr) {
            break; // it promised one more and has none: nothing says that it would ever end
        }
        std::string filterValue;
        if (!isServiceProcessors(element.value.inst, source, filterValue, log, status)) {
            republish(element, filterValue);
        }
    }
}

} // namespace Orv::NetworkAdapterComposite
