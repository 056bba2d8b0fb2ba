#include "host/broker/Slot.h"

#include <algorithm>

namespace marlo::broker {

namespace {

CMPIUint64 getBinaryFormat(CMPIStatus&, DateTimeObject& dateTime) {
    return dateTime.binary;
}

CMPIString* getStringFormat(CMPIStatus&, DateTimeObject& dateTime) {
    return &StringObject::make(currentArena(), dateTime.text())->handle;
}

CMPIBoolean isInterval(CMPIStatus&, DateTimeObject& dateTime) {
    return dateTime.interval ? 1 : 0;
}

} // namespace

DateTimeObject* DateTimeObject::make(Arena& arena, std::string_view text, std::uint64_t binary, bool interval) {
    auto* dateTime = arena.make<DateTimeObject>(arena);
    std::copy_n(text.begin(), std::min(text.size(), textLength), dateTime->_text);
    dateTime->binary = binary;
    dateTime->interval = interval;
    return dateTime;
}

DateTimeObject* DateTimeObject::copyTo(Arena& target) {
    return &arena() == &target ? this : make(target, text(), binary, interval);
}

const CMPIDateTimeFT dateTimeTable = {
    CMPI_VERSION,          releaseSlot<DateTimeObject>, slot<cloneOperation<DateTimeObject>>,
    slot<getBinaryFormat>, slot<getStringFormat>,       slot<isInterval>,
};

} // namespace marlo::broker
