#include "host/broker/Slot.h"

#include <algorithm>
#include <limits>
#include <new>

namespace marlo::broker {

namespace {

/** FNV-1a. */
std::size_t hashOf(std::string_view text) {
    std::uint32_t hash = 2166136261U;
    for (const char c : text) {
        hash = (hash ^ static_cast<unsigned char>(c)) * 16777619U;
    }
    return hash;
}

const char* getCharPtr(CMPIStatus&, StringObject& string) {
    return string.characters();
}

} // namespace

StringObject* StringObject::make(Arena& arena, std::string_view text) {
    if (text.size() > std::numeric_limits<std::uint32_t>::max()) {
        throw std::bad_alloc();
    }
    void* memory = arena.allocate(sizeof(StringObject) + text.size() + 1);
    auto* string = ::new (memory) StringObject(arena, static_cast<std::uint32_t>(text.size()));
    auto* characters = static_cast<char*>(memory) + sizeof(StringObject);
    std::copy(text.begin(), text.end(), characters);
    characters[text.size()] = '\0';
    return string;
}

StringObject* StringObject::makeRecurring(Arena& arena, std::string_view text) {
    StringObject** cache = arena.nameCache();
    if (cache == nullptr) {
        return make(arena, text);
    }
    StringObject*& slot = cache[hashOf(text) % Arena::nameCacheSize];
    if (slot == nullptr || slot->text() != text) {
        slot = make(arena, text);
    }
    return slot;
}

StringObject* StringObject::copyTo(Arena& target) {
    return &arena() == &target ? this : make(target, text());
}

const CMPIStringFT stringTable = {CMPI_VERSION, releaseSlot<StringObject>, slot<cloneOperation<StringObject>>,
                                  slot<getCharPtr>};

} // namespace marlo::broker
