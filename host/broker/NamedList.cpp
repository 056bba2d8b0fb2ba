#include "host/broker/NamedList.h"

#include "host/broker/Objects.h"
#include "host/broker/Values.h"
#include "host/model/Instance.h"

#include <algorithm>

namespace marlo::broker {

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
        grow(_capacity == 0 ? _firstCapacity : _capacity * 2);
    }
    _entries[_size] = {StringObject::makeName(*_arena, name), data};
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
