#include "providers/WriteOperations.h"

#include "factory/NetworkAdapterObjectFactory.h"
#include "instrumentation/Utilities.h"
#include "providers/Texts.h"
#include "trace/Trace.h"

#include <algorithm>
#include <array>
#include <string_view>

namespace Orv::NetworkAdapterComposite {

namespace {

constexpr const char* NO_INSTANCE = "Modify instance Passed is NULL";
constexpr std::string_view CLASS_WITH_METHODS = "MARLO_NetworkAdapterConfiguration";

std::string pathText(const CMPIObjectPath* path, CMPIStatus* status) {
    return path != nullptr ? textOf(CMObjectPathToString(path, status), status) : "";
}

/** Writes to the adapter; nonzero when that failed. */
int modify(const WriteFunction& self, const CMPIContext* context, const CMPIObjectPath* reference,
           const CMPIInstance* instance, const char** properties, NetworkAdapterObjectFactory& factory,
           CMPIStatus* status) {
    const ProviderLog log(self.logger, self.file, self.function);
    log.variable("objstring", pathText(reference, status));
    log.variable("modifyobjstring", pathText(CMGetObjectPath(instance, status), status));
    return factory.modifyNetworkAdapterCMPIInstance(self.broker, context, reference, properties, false, instance,
                                                    status);
}

/** One call of one method. */
struct MethodCall {
    NetworkAdapterObjectFactory& factory;
    const CMPIObjectPath* reference;
    const char* method;
    const CMPIArgs* in;
    const ProviderLog& log;
    CMPIStatus* status;

    [[nodiscard]] std::string settingId() const {
        const CMPIData key = CMGetKey(reference, "SettingID", status);
        const bool isText = (key.state & CMPI_nullValue) == 0 && key.type == CMPI_string;
        return isText ? textOf(key.value.string, status) : "";
    }
};

int enableDHCP(const MethodCall& call) {
    return call.factory.executeDHCPChanges(call.settingId());
}

int enableStatic(const MethodCall& call) {
    return call.factory.executeStaticChanges(call.settingId(), call.in);
}

int setDNSDomain(const MethodCall& call) {
    const std::string settingId = call.settingId();
    call.log.variable("settingId", settingId);
    return call.factory.executeDNSChanges(settingId, call.in, call.method);
}

/** The name service is the host's: the adapter of the path does not count. */
int setSearchOrder(const MethodCall& call) {
    return call.factory.executeDNSChanges({}, call.in, call.method);
}

int setGateways(const MethodCall& call) {
    return call.factory.executeGatewayChanges(call.settingId(), call.in);
}

int restartNetwork(const MethodCall& call) {
    return call.factory.executeRestartNetwork();
}

struct Method {
    const char* name;
    int (*run)(const MethodCall&);
    const char* failure;
};

/** One text for all methods but the restart. */
constexpr const char* CHANGE_FAILED = "Failed to Execute DHCP Changes";

constexpr std::array METHODS{
    Method{"EnableDHCP", enableDHCP, CHANGE_FAILED},
    Method{"EnableStatic", enableStatic, CHANGE_FAILED},
    Method{"SetDNSDomain", setDNSDomain, CHANGE_FAILED},
    Method{"SetDNSSuffixSearchOrder", setSearchOrder, CHANGE_FAILED},
    Method{"SetDNSServerSearchOrder", setSearchOrder, CHANGE_FAILED},
    Method{"SetGateways", setGateways, CHANGE_FAILED},
    Method{"RestartNetwork", restartNetwork, "Failed to Execute RestartNetwork"},
};

/** False, and a failure in the log, when the method failed; an unknown one succeeds. */
bool dispatch(const WriteFunction& self, const char* className, const CMPIObjectPath* reference,
              const char* methodName, const CMPIArgs* in, CMPIStatus* status) {
    const ProviderLog log(self.logger, self.file, self.function);
    NetworkAdapterObjectFactory factory(className);
    log.variable("objstring", pathText(reference, status));
    const auto* method = std::find_if(METHODS.begin(), METHODS.end(),
                                      [&](const Method& known) { return textEqual(methodName, known.name); });
    if (method != METHODS.end() && method->run({factory, reference, methodName, in, log, status}) != 0) {
        log.message(LEVEL_FAILURE, method->failure);
        return false;
    }
    return true;
}

} // namespace

CMPIStatus modifyInstance(const WriteFunction& self, const CMPIContext* context, const CMPIResult* result,
                          const CMPIObjectPath* reference, const CMPIInstance* instance, const char** properties) {
    markProviderEntry(self.logger, self.file, self.function, self.line);
    CMPIStatus status = {CMPI_RC_OK, nullptr};
    if (CMGetKeyCount(reference, &status) != 0) {
        const CMPIString* className = CMGetClassName(reference, &status);
        NetworkAdapterObjectFactory factory(className != nullptr ? CMGetCharPtr(className) : nullptr);
        if (instance == nullptr || instance->hdl == nullptr) {
            status.rc = CMPI_RC_ERR_FAILED;
            if (self.broker != nullptr) {
                // The broker hears of it; the answer carries the code alone.
                status.msg = CMNewString(self.broker, NO_INSTANCE, nullptr);
            }
            ProviderLog(self.logger, self.file, self.function).message(LEVEL_FAILURE, NO_INSTANCE, self.line);
        } else if (modify(self, context, reference, instance, properties, factory, &status) != 0) {
            return status;
        }
    }
    (void)CMReturnDone(result);
    return {status.rc, nullptr};
}

CMPIStatus invokeMethod(const WriteFunction& self, const CMPIResult* result, const CMPIObjectPath* reference,
                        const char* methodName, const CMPIArgs* in) {
    markProviderEntry(self.logger, self.file, self.function, self.line);
    CMPIStatus status = {CMPI_RC_OK, nullptr};
    const char* className = characters(CMGetClassName(reference, &status), &status);
    // The object manager's word for the class, to the letter: whoever spells it otherwise asks for another class.
    const bool hasMethods = className != nullptr && className == CLASS_WITH_METHODS;
    if (hasMethods && !dispatch(self, className, reference, methodName, in, &status)) {
        return status;
    }
    const CMPIUint32 answer = status.rc;
    (void)CMReturnData(result, &answer, CMPI_uint32);
    (void)CMReturnDone(result);
    markProviderExit(self.logger, self.file, self.function, self.line);
    return status;
}

} // namespace Orv::NetworkAdapterComposite
