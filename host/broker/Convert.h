/**
 * @file
 * Between CMPI objects and the model's plain values.
 */
#pragma once

#include "host/broker/Objects.h"
#include "host/model/Instance.h"

namespace marlo::broker {

Value toModel(const CMPIData& data);
ObjectPath toModel(const ObjectPathObject& path);
std::vector<NamedValue> toModel(const NamedList& list);
/** With the completed path. */
Instance toModel(const InstanceObject& object);

/** A value whose alternative does not fit its type becomes NULL. */
CMPIData toData(Arena& arena, const BrokerState& broker, const Value& value);
ObjectPathObject* toObject(Arena& arena, const BrokerState& broker, const ObjectPath& path);
InstanceObject* toObject(Arena& arena, const BrokerState& broker, const Instance& instance);

} // namespace marlo::broker
