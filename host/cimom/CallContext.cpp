#include "host/cimom/CallContext.h"

#include "host/cimom/Provider.h"
#include "host/cimom/StatusCodes.h"

#include <utility>

namespace marlo {

CMPIContext* newCallContext(const broker::Broker& broker, const std::string& principal,
                            const std::string& nameSpace) {
    CMPIContext* context = broker.newContext();
    broker.addEntry(context, CMPIInvocationFlags, Value::uint(CMPI_uint32, 0));
    broker.addEntry(context, CMPIPrincipal, Value::string(principal));
    broker.addEntry(context, CMPIInitNameSpace, Value::string(nameSpace));
    return context;
}

Status statusOf(const CMPIStatus& answered, const std::string& provider) {
    if (answered.rc == CMPI_RC_OK) {
        return {};
    }
    std::string message = broker::messageOf(answered);
    if (message.empty()) {
        message = "provider " + provider +
                  (answered.rc == CMPI_RC_ERR_NOT_SUPPORTED ? " does not support this" : " gave no reason");
    }
    if (isCimStatus(answered.rc)) {
        return {answered.rc, std::move(message), {}};
    }
    return {CMPI_RC_ERR_FAILED, message + " (CMPI return code " + std::to_string(answered.rc) + ")", {}};
}

Status statusOfException(const std::string& provider) {
    return {CMPI_RC_ERR_FAILED, "provider " + provider + " threw: " + currentExceptionText(), {}};
}

} // namespace marlo
