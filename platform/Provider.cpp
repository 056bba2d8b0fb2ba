/**
 * @file
 * The CMPI instance providers of TAVIS_NetworkCard and TAVIS_NetworkPort: their function table and their factories.
 */
#include "platform/Requests.h"

#include <atomic>
#include <exception>

#include <cmpimacs.h>

namespace Orv::Platform {

namespace {

/** One provider: what its MI's handle points to. Lives as long as the library. */
struct Provider {
    const ObjectClass& objects;
    std::atomic<const CMPIBroker*> broker; ///< as the latest factory call gave it
};

CMPIStatus failure(const CMPIBroker* broker, const char* reason) noexcept {
    CMPIStatus status{CMPI_RC_ERR_FAILED, nullptr};
    try {
        status.msg = CMNewString(broker, reason, nullptr);
    } catch (...) {
        status.msg = nullptr; // a broker that throws gives no string either
    }
    return status;
}

/** Runs one operation of a request; nothing that it throws, of whatever type, reaches the object manager. */
template <class Operation>
CMPIStatus answer(const CMPIInstanceMI* mi, const CMPIResult* result, const CMPIObjectPath* reference,
                  const Operation& operation) noexcept {
    const auto& provider = *static_cast<const Provider*>(mi->hdl);
    const CMPIBroker* broker = provider.broker;
    try {
        return operation(Request{provider.objects, broker, result, reference});
    } catch (const std::exception& error) {
        return failure(broker, error.what());
    } catch (...) {
        return failure(broker, "the request failed, and what was thrown does not say why");
    }
}

CMPIStatus cleanup(CMPIInstanceMI* /*mi*/, const CMPIContext* /*context*/, CMPIBoolean /*terminating*/) {
    return {CMPI_RC_OK, nullptr};
}

CMPIStatus enumerateInstanceNames(CMPIInstanceMI* mi, const CMPIContext* /*context*/, const CMPIResult* result,
                                  const CMPIObjectPath* reference) {
    return answer(mi, result, reference, [](const Request& request) { return request.enumerateNames(); });
}

CMPIStatus enumerateInstances(CMPIInstanceMI* mi, const CMPIContext* /*context*/, const CMPIResult* result,
                              const CMPIObjectPath* reference, const char** properties) {
    return answer(mi, result, reference, [=](const Request& request) { return request.enumerate(properties); });
}

CMPIStatus getInstance(CMPIInstanceMI* mi, const CMPIContext* /*context*/, const CMPIResult* result,
                       const CMPIObjectPath* reference, const char** properties) {
    return answer(mi, result, reference, [=](const Request& request) { return request.get(properties); });
}

CMPIStatus createInstance(CMPIInstanceMI* /*mi*/, const CMPIContext* /*context*/, const CMPIResult* /*result*/,
                          const CMPIObjectPath* /*reference*/, const CMPIInstance* /*instance*/) {
    return {CMPI_RC_ERR_NOT_SUPPORTED, nullptr};
}

CMPIStatus modifyInstance(CMPIInstanceMI* /*mi*/, const CMPIContext* /*context*/, const CMPIResult* /*result*/,
                          const CMPIObjectPath* /*reference*/, const CMPIInstance* /*instance*/,
                          const char** /*properties*/) {
    return {CMPI_RC_ERR_NOT_SUPPORTED, nullptr};
}

CMPIStatus deleteInstance(CMPIInstanceMI* /*mi*/, const CMPIContext* /*context*/, const CMPIResult* /*result*/,
                          const CMPIObjectPath* /*reference*/) {
    return {CMPI_RC_ERR_NOT_SUPPORTED, nullptr};
}

CMPIStatus execQuery(CMPIInstanceMI* /*mi*/, const CMPIContext* /*context*/, const CMPIResult* /*result*/,
                     const CMPIObjectPath* /*reference*/, const char* /*query*/, const char* /*language*/) {
    return {CMPI_RC_ERR_NOT_SUPPORTED, nullptr};
}

constexpr CMPIInstanceMIFT functionTable(const char* name) {
    return {CMPI_VERSION,           CMPI_VERSION,       name,        cleanup,
            enumerateInstanceNames, enumerateInstances, getInstance, createInstance,
            modifyInstance,         deleteInstance,     execQuery};
}

CMPIInstanceMI* start(Provider& provider, CMPIInstanceMI& mi, const CMPIBroker* broker) {
    provider.broker = broker;
    return &mi;
}

} // namespace

} // namespace Orv::Platform

/*
 * The factories. A third argument, the status, exists since CMPI 2.0: object managers of before pass two, so it is
 * not touched, and nothing here can fail.
 */
extern "C" {

__attribute__((visibility("default"))) CMPIInstanceMI*
TavisNetworkCardProvider_Create_InstanceMI(const CMPIBroker* broker, const CMPIContext* /*context*/,
                                           CMPIStatus* /*status*/) {
    static Orv::Platform::Provider provider{Orv::Platform::networkCard, nullptr};
    static const CMPIInstanceMIFT table = Orv::Platform::functionTable("TavisNetworkCardProvider");
    static CMPIInstanceMI mi{&provider, &table};
    return Orv::Platform::start(provider, mi, broker);
}

__attribute__((visibility("default"))) CMPIInstanceMI*
TavisNetworkPortProvider_Create_InstanceMI(const CMPIBroker* broker, const CMPIContext* /*context*/,
                                           CMPIStatus* /*status*/) {
    static Orv::Platform::Provider provider{Orv::Platform::networkPort, nullptr};
    static const CMPIInstanceMIFT table = Orv::Platform::functionTable("TavisNetworkPortProvider");
    static CMPIInstanceMI mi{&provider, &table};
    return Orv::Platform::start(provider, mi, broker);
}

} // extern "C"
