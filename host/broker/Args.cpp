#include "host/broker/ListSlots.h"

namespace marlo::broker {

namespace {

CMPIrc addArg(ArgsObject& args, const char* name, const CMPIValue* value, CMPIType type) {
    return setNamed(args.arena(), args.values, name, value, type, Accepted::cimAndPointers);
}

CMPIData getArg(CMPIStatus& status, ArgsObject& args, const char* name) {
    return getNamed(status, args.values, name, CMPI_RC_ERR_NOT_FOUND);
}

CMPIData getArgAt(CMPIStatus& status, ArgsObject& args, CMPICount index, CMPIString** name) {
    return getNamedAt(status, args.values, index, name, CMPI_RC_ERR_NOT_FOUND);
}

CMPICount getArgCount(CMPIStatus&, ArgsObject& args) {
    return args.values.size();
}

} // namespace

ArgsObject* ArgsObject::copyTo(Arena& target) const {
    ArgsObject* copied = make(target);
    values.copyTo(copied->values);
    return copied;
}

const CMPIArgsFT argsTable = {
    CMPI_VERSION,   releaseSlot<ArgsObject>, slot<cloneOperation<ArgsObject>>, slot<addArg>, slot<getArg>,
    slot<getArgAt>, slot<getArgCount>,
};

} // namespace marlo::broker
