#include "host/broker/Slot.h"
#include "host/broker/Values.h"

namespace marlo::broker {

namespace {

CMPICount getSize(CMPIStatus&, ArrayObject& array) {
    return array.count;
}

CMPIType getSimpleType(CMPIStatus&, ArrayObject& array) {
    return array.elementType;
}

CMPIData getElementAt(CMPIStatus& status, ArrayObject& array, CMPICount index) {
    if (index >= array.count) {
        status.rc = CMPI_RC_ERR_NO_SUCH_PROPERTY;
        return noData();
    }
    return array.elements[index];
}

CMPIrc setElementAt(ArrayObject& array, CMPICount index, const CMPIValue* value, CMPIType type) {
    if (index >= array.count) {
        return CMPI_RC_ERR_NO_SUCH_PROPERTY;
    }
    CMPIData taken;
    const CMPIrc code = takeValue(array.arena(), value, type, Accepted::cim, taken);
    if (code != CMPI_RC_OK) {
        return code;
    }
    if (taken.type == CMPI_null) {
        taken.type = array.elementType;
    }
    if (taken.type != array.elementType) {
        return CMPI_RC_ERR_TYPE_MISMATCH;
    }
    array.elements[index] = taken;
    return CMPI_RC_OK;
}

} // namespace

ArrayObject* ArrayObject::make(Arena& arena, CMPICount count, CMPIType elementType) {
    auto* array = arena.make<ArrayObject>(arena);
    array->elementType = storedType(elementType);
    array->elements = arena.makeArray<CMPIData>(count);
    array->count = count;
    for (CMPICount i = 0; i < count; ++i) {
        array->elements[i] = nullData(array->elementType);
    }
    return array;
}

ArrayObject* ArrayObject::copyTo(Arena& target) const {
    ArrayObject* copied = make(target, count, elementType);
    for (CMPICount i = 0; i < count; ++i) {
        copied->elements[i] = copyData(target, elements[i]);
    }
    return copied;
}

const CMPIArrayFT arrayTable = {
    CMPI_VERSION,       releaseSlot<ArrayObject>, slot<cloneOperation<ArrayObject>>,
    slot<getSize>,      slot<getSimpleType>,      slot<getElementAt>,
    slot<setElementAt>,
};

} // namespace marlo::broker
