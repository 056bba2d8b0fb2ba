#include "host/broker/BrokerState.h"
#include "host/broker/ListSlots.h"

namespace marlo::broker {

namespace {

CMPIData getEntry(CMPIStatus& status, ContextObject& context, const char* name) {
    return getNamed(status, context.entries, name, CMPI_RC_ERR_NOT_FOUND);
}

CMPIData getEntryAt(CMPIStatus& status, ContextObject& context, CMPICount index, CMPIString** name) {
    return getNamedAt(status, context.entries, index, name, CMPI_RC_ERR_NOT_FOUND);
}

CMPICount getEntryCount(CMPIStatus&, ContextObject& context) {
    return context.entries.size();
}

CMPIrc addEntry(ContextObject& context, const char* name, const CMPIValue* value, CMPIType type) {
    return setNamed(context.arena(), context.entries, name, value, type, Accepted::cimAndPointers);
}

/** A context prepared for a thread is the broker's until it is released or detached, whichever is first. */
CMPIStatus releaseContext(CMPIContext* handle) {
    auto* context = objectOf<ContextObject>(handle);
    if (context != nullptr && context->preparedBy != nullptr) {
        context->preparedBy->releasePrepared(*context);
        return statusOf(CMPI_RC_OK);
    }
    return releaseSlot<ContextObject>(handle);
}

} // namespace

ContextObject* ContextObject::copyTo(Arena& target) const {
    ContextObject* copied = make(target);
    entries.copyTo(copied->entries);
    return copied;
}

const CMPIContextFT contextTable = {
    CMPI_VERSION,        releaseContext, slot<cloneOperation<ContextObject>>, slot<getEntry>, slot<getEntryAt>,
    slot<getEntryCount>, slot<addEntry>,
};

} // namespace marlo::broker
