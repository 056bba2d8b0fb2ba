/**
 * @file
 * ModifyInstance and InvokeMethod of MARLO_NetworkAdapterConfiguration.
 */
#pragma once

#include <string>

#include <cmpift.h>

namespace Orv::NetworkAdapterComposite {

/** An MI function as it appears in the log, and the object manager that called it. */
struct WriteFunction {
    const std::string& logger;
    const char* file;
    const char* function;
    const CMPIBroker* broker;
    unsigned line = __builtin_LINE();
};

/*
 * Both: exceptions of the broker, and those of the agent outside of a change, leave the call.
 */

/**
 * Writes the values of `instance` to the adapter that the key SettingID of `reference` names; no such adapter is a
 * success, as is a reference without keys. A change that failed ends with the status that the last reading of the
 * instance left, which may well be CMPI_RC_OK, and without CMReturnDone. There is an entry mark and no exit mark.
 */
CMPIStatus modifyInstance(const WriteFunction& self, const CMPIContext* context, const CMPIResult* result,
                          const CMPIObjectPath* reference, const CMPIInstance* instance, const char** properties);

/**
 * Calls the method of that name, compared without case, on the adapter that the key SettingID of `reference` names,
 * and returns a uint32: the code of the status, 0 for success. A method that failed returns nothing, neither a value
 * nor CMReturnDone nor an exit mark, and a status that is normally CMPI_RC_OK; the log has the reason. Unknown
 * methods and other classes are answered 0.
 */
CMPIStatus invokeMethod(const WriteFunction& self, const CMPIResult* result, const CMPIObjectPath* reference,
                        const char* methodName, const CMPIArgs* in);

} // namespace Orv::NetworkAdapterComposite
