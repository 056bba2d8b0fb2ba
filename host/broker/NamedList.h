/**
 * @file
 * Named values in the order in which they were first set: properties, keys, arguments, context entries.
 */
#pragma once

#include "host/broker/Arena.h"

#include <string_view>

#include <cmpidt.h>

namespace marlo::broker {

struct NamedData {
    StringObject* name;
    CMPIData data;
};

/** Names are compared without case (DSP0004) and keep the case in which they were first given. */
class NamedList {
  public:
    /** Holds the properties of an ordinary class without growing again. */
    static constexpr CMPICount ordinaryCapacity = 12;

    /** `firstCapacity`: the number of entries that there is room for once there are any. */
    explicit NamedList(Arena& arena, CMPICount firstCapacity = ordinaryCapacity)
        : _arena(&arena), _firstCapacity(firstCapacity) {}

    [[nodiscard]] CMPICount size() const { return _size; }

    [[nodiscard]] const NamedData* begin() const { return _entries; }

    [[nodiscard]] const NamedData* end() const { return _entries + _size; }

    /** Null when there is none. */
    [[nodiscard]] const NamedData* find(std::string_view name) const;

    [[nodiscard]] const NamedData* at(CMPICount index) const { return index < _size ? _entries + index : nullptr; }

    /** `data` lies in the list's arena already. */
    void set(std::string_view name, const CMPIData& data);

    /** Copies everything into an empty list. */
    void copyTo(NamedList& target) const;

  private:
    void grow(CMPICount capacity);

    Arena* _arena;
    NamedData* _entries = nullptr;
    CMPICount _size = 0;
    CMPICount _capacity = 0;
    CMPICount _firstCapacity;
};

} // namespace marlo::broker
