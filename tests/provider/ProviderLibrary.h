/**
 * @file
 * The provider library as an object manager meets it: loaded at run time, known by its factories alone.
 */
#pragma once

#include <stdexcept>
#include <string>

#include <cmpift.h>
#include <dlfcn.h>

namespace provider_test {

using InstanceFactory = CMPIInstanceMI* (*)(const CMPIBroker*, const CMPIContext*, CMPIStatus*);
using MethodFactory = CMPIMethodMI* (*)(const CMPIBroker*, const CMPIContext*, CMPIStatus*);
using IndicationFactory = CMPIIndicationMI* (*)(const CMPIBroker*, const CMPIContext*, CMPIStatus*);

/** The library, loaded once for the process as strictly as an object manager may: all symbols now, none for others.
 */
inline void* library() {
    static void* handle = dlopen(MARLO_PROVIDER_LIBRARY, RTLD_NOW | RTLD_LOCAL);
    if (handle == nullptr) {
        throw std::runtime_error(dlerror());
    }
    return handle;
}

template <typename Function>
Function symbol(const std::string& name) {
    void* found = dlsym(library(), name.c_str());
    if (found == nullptr) {
        throw std::runtime_error("no symbol " + name);
    }
    return reinterpret_cast<Function>(found);
}

/** The instance MI of a provider, such as "LogicalNetworkAdapterProvider". */
inline CMPIInstanceMI* createInstanceMI(const std::string& provider, const CMPIBroker* broker,
                                        const CMPIContext* context = nullptr) {
    CMPIStatus status = {CMPI_RC_OK, nullptr};
    return symbol<InstanceFactory>(provider + "_Create_InstanceMI")(broker, context, &status);
}

inline CMPIMethodMI* createMethodMI(const CMPIBroker* broker, const CMPIContext* context = nullptr) {
    CMPIStatus status = {CMPI_RC_OK, nullptr};
    return symbol<MethodFactory>("NetworkAdapterProvider_Create_MethodMI")(broker, context, &status);
}

inline CMPIIndicationMI* createIndicationMI(const CMPIBroker* broker, const CMPIContext* context = nullptr) {
    CMPIStatus status = {CMPI_RC_OK, nullptr};
    return symbol<IndicationFactory>("NetworkAdapterProvider_Create_IndicationMI")(broker, context, &status);
}

} // namespace provider_test
