/**
 * @file
 * Instances as filters see them.
 */
#pragma once

#include "host/broker/SchemaView.h"
#include "host/filter/Filter.h"
#include "host/model/Instance.h"

namespace marlo::broker {

/** Both live as long as this. */
class InstanceSubject final : public filter::Subject {
  public:
    InstanceSubject(const Instance& instance, const SchemaView& schema) : _instance(instance), _schema(schema) {}

    [[nodiscard]] const Value* property(std::string_view name) const override {
        const NamedValue* found = findName(_instance.properties, name);
        return found == nullptr ? nullptr : &found->value;
    }

    [[nodiscard]] std::string_view className() const override { return _instance.path.className; }

    [[nodiscard]] bool isA(std::string_view className, std::string_view ancestor) const override {
        return equalNames(className, ancestor) || _schema.isA(_instance.path.nameSpace, className, ancestor);
    }

  private:
    const Instance& _instance;
    const SchemaView& _schema;
};

} // namespace marlo::broker
