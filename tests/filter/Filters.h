/**
 * @file
 * A schema and an instance that filters are tried on.
 */
#pragma once

#include "host/filter/Filter.h"
#include "host/schema/Schema.h"

#include <string>
#include <vector>

namespace marlo::test {

/** The reason for which something was refused, with its place; "accepted" when it was not. */
template <typename Action>
std::string refusal(const Action& action) {
    try {
        action();
        return "accepted";
    } catch (const filter::Error& error) {
        return error.what();
    }
}

inline const Schema& exampleSchema() {
    static const Schema schema = Schema::readText(R"(
Qualifier EmbeddedInstance : string = null, Scope(property, method, parameter);
Qualifier EmbeddedObject : boolean = false, Scope(property, method, parameter), Flavor(DisableOverride);
Qualifier Indication : boolean = false, Scope(class, indication), Flavor(DisableOverride);
#pragma namespace ("root/test")
class Part { string Serial; uint32 Weight; };
class SpecialPart : Part { };
class Event {
    string Text; string Other; uint16 Severity; sint32 Delta; real64 Ratio; boolean Urgent; char16 Letter; datetime When;
    datetime Until; string Words[]; Part REF Place; uint64 Huge; string Nothing;
    [EmbeddedInstance("Part")] string Source; [EmbeddedObject] string Anything;
};
class SpecialEvent : Event { string Extra; };
)",
                                                  "example.mof");
    return schema;
}

/** An instance of SpecialEvent; properties without a value have none. */
inline const Instance& exampleEvent() {
    static const Instance part{{"", "root/test", "SpecialPart", {}},
                               {{"Serial", Value::string("S-1")}, {"Weight", Value::uint(CMPI_uint32, 12)}}};
    static const Instance event{{"", "root/test", "SpecialEvent", {}},
                                {{"Text", Value::string("link down")},
                                 {"Other", Value::string("link up")},
                                 {"Severity", Value::uint(CMPI_uint16, 3)},
                                 {"Delta", Value::sint(CMPI_sint32, -5)},
                                 {"Ratio", {CMPI_real64, 0.5}},
                                 {"Urgent", Value::boolean(true)},
                                 {"Letter", {CMPI_char16, char16_t{u'x'}}},
                                 {"When", {CMPI_dateTime, DateTime{"20260307050409.000250+060"}}},
                                 {"Until", {CMPI_dateTime, DateTime{"00000001000000.000000:000"}}},
                                 {"Huge", Value::uint(CMPI_uint64, 18446744073709551615ULL)},
                                 {"Nothing", Value::null(CMPI_string)},
                                 {"Source", {CMPI_instance, std::make_shared<const Instance>(part)}}}};
    return event;
}

class InstanceSubject final : public filter::Subject {
  public:
    explicit InstanceSubject(const Instance& instance) : _instance(instance) {}

    [[nodiscard]] const Value* property(std::string_view name) const override {
        const NamedValue* found = findName(_instance.properties, name);
        return found == nullptr ? nullptr : &found->value;
    }

    [[nodiscard]] std::string_view className() const override { return _instance.path.className; }

    [[nodiscard]] bool isA(std::string_view className, std::string_view ancestor) const override {
        return exampleSchema().isA("root/test", className, ancestor);
    }

  private:
    const Instance& _instance;
};

} // namespace marlo::test
