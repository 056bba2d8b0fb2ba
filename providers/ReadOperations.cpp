#include "providers/ReadOperations.h"

#include "instrumentation/Utilities.h"
#include "providers/Texts.h"
#include "trace/Trace.h"

#include <cstdint>
#include <vector>

#include <cmpimacs.h>

namespace Orv::NetworkAdapterComposite {

namespace {

constexpr const char* KEYLESS = "At least one key should be passed";

/** Instances are counted in 16 bits: a walk visits the first size modulo 65536. */
using InstanceCount = std::uint16_t;

void markEntry(const ReadFunction& self) {
    markProviderEntry(self.logger, self.file, self.function, self.line);
}

void markExit(const ReadFunction& self) {
    markProviderExit(self.logger, self.file, self.function, self.line);
}

void logFailure(const ReadFunction& self, const char* text) {
    ProviderLog(self.logger, self.file, self.function).message(LEVEL_FAILURE, text, self.line);
}

/**
 * Builds all instances of the class of `reference` into `instances`. False, and a failure in the log, when the
 * factory does not produce that class.
 */
bool enumerate(const ReadFunction& self, const CMPIContext* context, const CMPIObjectPath* reference,
               const char** properties, std::vector<CMPIInstance*>& instances, CMPIStatus* status) {
    const char* className = characters(CMGetClassName(reference, status), status);
    NetworkAdapterObjectFactory factory(className);
    instances.reserve(static_cast<InstanceCount>(factory.getNumberOfInstances()));
    if ((factory.*self.enumerate)(self.broker, context, reference, className, properties, false, instances, status) !=
        0) {
        logFailure(self, self.failure);
        return false;
    }
    return true;
}

bool isUsable(const CMPIInstance* instance) {
    return instance != nullptr && instance->hdl != nullptr;
}

void returnEqual(const std::vector<CMPIInstance*>& instances, const CMPIObjectPath* reference,
                 const CMPIResult* result, CMPIStatus* status) {
    const auto count = static_cast<InstanceCount>(instances.size());
    for (InstanceCount i = 0; i < count; ++i) {
        CMPIInstance* instance = instances.at(i);
        if (isUsable(instance) && isObjPathsEqual(reference, CMGetObjectPath(instance, status), false)) {
            (void)CMReturnInstance(result, instance);
            return;
        }
    }
}

void returnPath(CMPIObjectPath* path, const CMPIObjectPath* reference, const CMPIResult* result, CMPIStatus* status) {
    (void)CMSetNameSpace(path, characters(CMGetNameSpace(reference, status), status));
    (void)CMSetHostname(path, getSystemName().c_str());
    (void)CMReturnObjectPath(result, path);
}

} // namespace

CMPIStatus getInstance(const ReadFunction& self, const CMPIContext* context, const CMPIResult* result,
                       const CMPIObjectPath* reference, const char** properties) {
    markEntry(self);
    CMPIStatus status = {CMPI_RC_OK, nullptr};
    if (CMGetKeyCount(reference, &status) == 0) {
        logFailure(self, KEYLESS);
        status.rc = CMPI_RC_ERR_FAILED;
        status.msg = self.broker != nullptr ? CMNewString(self.broker, KEYLESS, nullptr) : nullptr;
    } else {
        std::vector<CMPIInstance*> instances;
        if (!enumerate(self, context, reference, properties, instances, &status)) {
            return status;
        }
        returnEqual(instances, reference, result, &status);
    }
    (void)CMReturnDone(result);
    markExit(self);
    return status;
}

CMPIStatus enumInstanceNames(const ReadFunction& self, const CMPIContext* context, const CMPIResult* result,
                             const CMPIObjectPath* reference) {
    markEntry(self);
    CMPIStatus status = {CMPI_RC_OK, nullptr};
    std::vector<CMPIInstance*> instances;
    if (!enumerate(self, context, reference, nullptr, instances, &status)) {
        return status;
    }
    const auto count = static_cast<InstanceCount>(instances.size());
    for (InstanceCount i = 0; i < count; ++i) {
        CMPIInstance* instance = instances.at(i);
        if (!isUsable(instance)) {
            continue;
        }
        if (CMPIObjectPath* path = CMGetObjectPath(instance, &status); path != nullptr) {
            returnPath(path, reference, result, &status);
        }
    }
    (void)CMReturnDone(result);
    markExit(self);
    return status;
}

CMPIStatus enumInstances(const ReadFunction& self, const CMPIContext* context, const CMPIResult* result,
                         const CMPIObjectPath* reference, const char** properties) {
    markEntry(self);
    CMPIStatus status = {CMPI_RC_OK, nullptr};
    std::vector<CMPIInstance*> instances;
    if (!enumerate(self, context, reference, properties, instances, &status)) {
        return status;
    }
    const auto count = static_cast<InstanceCount>(instances.size());
    for (InstanceCount i = 0; i < count; ++i) {
        (void)CMReturnInstance(result, instances.at(i));
    }
    (void)CMReturnDone(result);
    markExit(self);
    return status;
}

} // namespace Orv::NetworkAdapterComposite
