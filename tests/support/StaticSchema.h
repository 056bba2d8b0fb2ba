/**
 * @file
 * A schema for a broker under test: three classes, told in code.
 */
#pragma once

#include "host/broker/SchemaView.h"
#include "host/model/Instance.h"

namespace marlo::test {

/**
 * In "root/test": `Base`, `Thing` which derives from it and has the keys `Id` (string) and `Number` (uint16), and
 * `Other`. `Thing`, its property `Id`, its method `Do` and that method's parameter `What` have the qualifier
 * `Description`, whose value names the thing described.
 */
class StaticSchema final : public broker::SchemaView {
  public:
    [[nodiscard]] const std::vector<std::string>* keys(std::string_view nameSpace,
                                                       std::string_view className) const override {
        if (!equalNames(nameSpace, "root/test")) {
            return nullptr;
        }
        return equalNames(className, "Thing") ? &_thingKeys : equalNames(className, "Base") ? &_noKeys : nullptr;
    }

    [[nodiscard]] bool isA(std::string_view nameSpace, std::string_view className,
                           std::string_view ancestor) const override {
        return equalNames(nameSpace, "root/test") && equalNames(className, "Thing") && equalNames(ancestor, "Base");
    }

    [[nodiscard]] const Value* classQualifier(std::string_view nameSpace, std::string_view className,
                                              std::string_view qualifier) const override {
        return keys(nameSpace, className) == &_thingKeys && equalNames(qualifier, "Description") ? &_class : nullptr;
    }

    [[nodiscard]] const Value* propertyQualifier(std::string_view nameSpace, std::string_view className,
                                                 std::string_view property,
                                                 std::string_view qualifier) const override {
        return equalNames(property, "Id") && classQualifier(nameSpace, className, qualifier) != nullptr ? &_property
                                                                                                        : nullptr;
    }

    [[nodiscard]] const Value* methodQualifier(std::string_view nameSpace, std::string_view className,
                                               std::string_view method, std::string_view qualifier) const override {
        return equalNames(method, "Do") && classQualifier(nameSpace, className, qualifier) != nullptr ? &_method
                                                                                                      : nullptr;
    }

    [[nodiscard]] const Value* parameterQualifier(std::string_view nameSpace, std::string_view className,
                                                  std::string_view method, std::string_view parameter,
                                                  std::string_view qualifier) const override {
        return equalNames(parameter, "What") && methodQualifier(nameSpace, className, method, qualifier) != nullptr
                   ? &_parameter
                   : nullptr;
    }

  private:
    std::vector<std::string> _thingKeys{"Id", "Number"};
    std::vector<std::string> _noKeys;
    Value _class = Value::string("Thing");
    Value _property = Value::string("Thing.Id");
    Value _method = Value::string("Thing.Do");
    Value _parameter = Value::string("Thing.Do.What");
};

} // namespace marlo::test
