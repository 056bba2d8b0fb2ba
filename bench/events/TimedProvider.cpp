/**
 * @file
 * The provider's indication interface with a broker that tells the benchmark when a delivery has returned.
 */
#include <stdexcept>

#include <cmpift.h>
#include <dlfcn.h>

namespace {

using Factory = CMPIIndicationMI* (*)(const CMPIBroker*, const CMPIContext*, CMPIStatus*);
using Delivered = void (*)();

const CMPIBrokerFT* realTable = nullptr;
Delivered delivered = nullptr;

template <typename Function>
Function find(void* library, const char* name) {
    void* symbol = dlsym(library, name);
    if (symbol == nullptr) {
        throw std::runtime_error(dlerror());
    }
    return reinterpret_cast<Function>(symbol);
}

CMPIStatus deliver(const CMPIBroker* broker, const CMPIContext* context, const char* nameSpace,
                   const CMPIInstance* indication) {
    const CMPIStatus status = realTable->deliverIndication(broker, context, nameSpace, indication);
    delivered();
    return status;
}

} // namespace

extern "C" __attribute__((visibility("default"))) CMPIIndicationMI*
NetworkAdapterProvider_Create_IndicationMI(const CMPIBroker* broker, const CMPIContext* context, CMPIStatus* status) {
    static CMPIBrokerFT table;
    static CMPIBroker handle;
    realTable = broker->bft;
    table = *broker->bft;
    table.deliverIndication = deliver;
    handle = *broker;
    handle.bft = &table;
    delivered = find<Delivered>(RTLD_DEFAULT, "marloBenchDelivered");
    void* provider = dlopen(MARLO_PROVIDER_LIBRARY, RTLD_NOW | RTLD_LOCAL);
    if (provider == nullptr) {
        throw std::runtime_error(dlerror());
    }
    return find<Factory>(provider, "NetworkAdapterProvider_Create_IndicationMI")(&handle, context, status);
}
