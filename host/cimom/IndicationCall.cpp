#include "host/cimom/IndicationCall.h"

#include "host/broker/Scope.h"
#include "host/cimom/CallContext.h"

namespace marlo {

namespace {

/** Calls a function that a provider may do without. */
template <typename Slot, typename... Arguments>
CMPIStatus callIfAny(Slot slot, CMPIIndicationMI& mi, Arguments... arguments) {
    return slot == nullptr ? CMPIStatus{CMPI_RC_OK, nullptr} : slot(&mi, arguments...);
}

} // namespace

Status IndicationCall::call(const std::string& function, const std::function<CMPIStatus(const Arguments&)>& slot) {
    const broker::CallScope scope;
    const CMPIContext* context = newCallContext(_broker, _principal, _nameSpace);
    const std::string& name = _provider.registration().name;
    Status status;
    try {
        CMPIIndicationMI& mi = _provider.indicationMI(*context);
        status = statusOf(slot({&mi, context, _broker.newObjectPath({"", _nameSpace, _className, {}})}), name);
    } catch (const LoadError& error) {
        return {CMPI_RC_ERR_FAILED, error.what(), {}};
    } catch (...) {
        status = statusOfException(name);
    }
    if (!status.ok()) {
        status.message = function + " of provider " + name + " for " + _className + ": " + status.message;
    }
    return status;
}

Status IndicationCall::authorize() {
    return call("authorizeFilter", [this](const Arguments& arguments) {
        return callIfAny(arguments.mi->ft->authorizeFilter, *arguments.mi, arguments.context, _filter,
                         _fromClass.c_str(), arguments.classPath, _principal.c_str());
    });
}

Status IndicationCall::askWhetherToPoll() {
    return call("mustPoll", [this](const Arguments& arguments) {
        callIfAny(arguments.mi->ft->mustPoll, *arguments.mi, arguments.context, _filter, _fromClass.c_str(),
                  arguments.classPath);
        return CMPIStatus{CMPI_RC_OK, nullptr};
    });
}

Status IndicationCall::activate(bool first) {
    return call("activateFilter", [this, first](const Arguments& arguments) {
        return callSlot(arguments.mi->ft->activateFilter, *arguments.mi, arguments.context, _filter,
                        _fromClass.c_str(), arguments.classPath, static_cast<CMPIBoolean>(first));
    });
}

Status IndicationCall::deactivate(bool last) {
    return call("deActivateFilter", [this, last](const Arguments& arguments) {
        return callSlot(arguments.mi->ft->deActivateFilter, *arguments.mi, arguments.context, _filter,
                        _fromClass.c_str(), arguments.classPath, static_cast<CMPIBoolean>(last));
    });
}

Status IndicationCall::enable() {
    return call("enableIndications", [](const Arguments& arguments) {
        return callIfAny(arguments.mi->ft->enableIndications, *arguments.mi, arguments.context);
    });
}

Status IndicationCall::disable() {
    return call("disableIndications", [](const Arguments& arguments) {
        return callIfAny(arguments.mi->ft->disableIndications, *arguments.mi, arguments.context);
    });
}

} // namespace marlo
