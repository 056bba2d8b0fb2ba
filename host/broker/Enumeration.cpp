#include "host/broker/Slot.h"
#include "host/broker/Values.h"

#include <algorithm>

namespace marlo::broker {

namespace {

CMPIData getNext(CMPIStatus& status, EnumerationObject& enumeration) {
    if (enumeration.next >= enumeration.count) {
        status.rc = CMPI_RC_NO_MORE_ELEMENTS;
        return noData();
    }
    return enumeration.elements[enumeration.next++];
}

CMPIBoolean hasNext(CMPIStatus&, EnumerationObject& enumeration) {
    return enumeration.next < enumeration.count ? 1 : 0;
}

/** All elements, also those that were read already. */
CMPIArray* toArray(CMPIStatus&, EnumerationObject& enumeration) {
    Arena& arena = currentArena();
    ArrayObject* array = ArrayObject::make(arena, enumeration.count, enumeration.elementType);
    for (CMPICount i = 0; i < enumeration.count; ++i) {
        array->elements[i] = copyData(arena, enumeration.elements[i]);
    }
    return &array->handle;
}

} // namespace

EnumerationObject* EnumerationObject::make(Arena& arena, CMPIType elementType) {
    return arena.make<EnumerationObject>(arena, elementType);
}

void EnumerationObject::add(const CMPIData& element) {
    if (count == _capacity) {
        _capacity = std::max<CMPICount>(16, _capacity * 2);
        auto* larger = arena().makeArray<CMPIData>(_capacity);
        std::copy_n(elements, count, larger);
        elements = larger;
    }
    elements[count++] = element;
}

EnumerationObject* EnumerationObject::copyTo(Arena& target) const {
    EnumerationObject* copied = make(target, elementType);
    for (CMPICount i = 0; i < count; ++i) {
        copied->add(copyData(target, elements[i]));
    }
    copied->next = next;
    return copied;
}

const CMPIEnumerationFT enumerationTable = {
    CMPI_VERSION,
    releaseSlot<EnumerationObject>,
    slot<cloneOperation<EnumerationObject>>,
    slot<getNext>,
    slot<hasNext>,
    slot<toArray>,
};

} // namespace marlo::broker
