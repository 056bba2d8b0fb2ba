#include "host/broker/NamedList.h"

#include "host/broker/Objects.h"
#include "host/broker/Values.h"
#include "host/model/Instance.h"

#include <algorithm>

namespace marlo::broker {

namespace {

/** Holds the properties of an ordinary class without growing again. */
constexpr CMPICount firstCapacity = 12;

/** FNV-1a. */
std::size_t hashOf(std::string_view name) {
    std::uint32_t hash = 2166136261U;
    for (const char c : name) {
        hash = (hash ^ static_cast<unsigned char>(c)) * 16777619U;
    }
    return hash;
}

/** The same few names recur in every instance of a call: one string for all of them. */
StringObject* nameString(Arena& arena, std::string_view name) {
    StringObject** cache = arena.nameCache();
    if (cache == nullptr) {
        return StringObject::make(arena, name);
    }
    StringObject*& slot = cache[hashOf(name) % Arena::nameCacheSize];
    if (slot == nullptr || slot->text() != name) {
        slot = StringObject::make(arena, name);
    }
    return slot;
}

} // namespace

const NamedData* NamedList::find(std::string_view name) const {
    const auto* found =
        std::find_if(begin(), end(), [name](const NamedData& entry) { return equalNames(entry.name->text(), name); });
    return found == end() ? nullptr : found;
}

void NamedList::set(std::string_view name, const CMPIData& data) {
    if (const NamedData* entry = find(name)) {
        _entries[entry - _entries].data = data;
        return;
    }
    if (_size == _capacity) {
        grow(_capacity == 0 ? firstCapacity : _capacity * 2);
    }
    _entries[_size] = {nameString(*_arena, name), data};
    ++_size;
}

void NamedList::grow(CMPICount capacity) {
    auto* larger = _arena->makeArray<NamedData>(capacity);
    std::copy(begin(), end(), larger);
    _entries = larger;
    _capacity = capacity;
}

void NamedList::copyTo(NamedList& target) const {
    if (_size > target._capacity) {
        target.grow(_size);
    }
    for (const NamedData& entry : *this) {
        target.set(entry.name->text(), copyData(*target._arena, entry.data));
    }
}

} // namespace marlo::broker
