#include "host/broker/Slot.h"

#include <algorithm>
#include <limits>
#include <new>

namespace marlo::broker {

namespace {

/** Longer values are hardly the same twice. */
constexpr std::size_t longestRecurring = 64;

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

StringObject* StringObject::findOrMake(Arena& arena, StringObject** known, std::string_view text) {
    StringObject*& slot = known[hashOf(text) % Arena::RecurringTexts::size];
    if (slot == nullptr || slot->text() != text) {
        slot = make(arena, text);
    }
    return slot;
}

StringObject* StringObject::makeName(Arena& arena, std::string_view name) {
    auto* known = arena.recurringTexts();
    return known == nullptr ? make(arena, name) : findOrMake(arena, known->names, name);
}

StringObject* StringObject::makeValue(Arena& arena, std::string_view value) {
    auto* known = value.size() > longestRecurring ? nullptr : arena.recurringTexts();
    return known == nullptr ? make(arena, value) : findOrMake(arena, known->values, value);
}

StringObject* StringObject::copyTo(Arena& target) {
    return &arena() == &target ? this : make(target, text());
}

const CMPIStringFT stringTable = {CMPI_VERSION, releaseSlot<StringObject>, slot<cloneOperation<StringObject>>,
                                  slot<getCharPtr>};

} // namespace marlo::broker
