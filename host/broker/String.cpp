#include "host/broker/Slot.h"

namespace marlo::broker {

namespace {

const char* getCharPtr(CMPIStatus&, StringObject& string) {
    return string.characters();
}

} // namespace

StringObject* StringObject::make(Arena& arena, std::string_view text) {
    const char* copied = arena.copy(text);
    return arena.make<StringObject>(arena, copied, text.size());
}

StringObject* StringObject::copyTo(Arena& target) {
    return &arena() == &target ? this : make(target, text());
}

const CMPIStringFT stringTable = {CMPI_VERSION, releaseSlot<StringObject>, slot<cloneOperation<StringObject>>,
                                  slot<getCharPtr>};

} // namespace marlo::broker
