#include "host/subscriptions/Properties.h"

#include "host/model/DateTimeText.h"

#include <memory>
#include <utility>

namespace marlo::subscriptions {

std::string textOf(const Instance& instance, std::string_view name) {
    const NamedValue* found = findName(instance.properties, name);
    const auto* text = found == nullptr ? nullptr : std::get_if<std::string>(&found->value.data);
    return text == nullptr ? "" : *text;
}

std::optional<std::uint64_t> numberOf(const Instance& instance, std::string_view name) {
    const NamedValue* found = findName(instance.properties, name);
    if (found == nullptr) {
        return std::nullopt;
    }
    if (const auto* truth = std::get_if<bool>(&found->value.data)) {
        return *truth ? 1U : 0U;
    }
    const auto* number = std::get_if<std::uint64_t>(&found->value.data);
    return number == nullptr ? std::nullopt : std::optional(*number);
}

std::vector<std::string> textsOf(const Instance& instance, std::string_view name) {
    std::vector<std::string> texts;
    const NamedValue* found = findName(instance.properties, name);
    if (const auto* elements = found == nullptr ? nullptr : std::get_if<Value::Array>(&found->value.data)) {
        for (const Value& element : *elements) {
            if (const auto* text = std::get_if<std::string>(&element.data)) {
                texts.push_back(*text);
            }
        }
    }
    return texts;
}

const ObjectPath* referenceOf(const Instance& instance, std::string_view name) {
    const NamedValue* found = findName(instance.properties, name);
    const auto* path =
        found == nullptr ? nullptr : std::get_if<std::shared_ptr<const ObjectPath>>(&found->value.data);
    return path == nullptr ? nullptr : path->get();
}

void set(Instance& instance, const std::string& name, Value value) {
    for (NamedValue& property : instance.properties) {
        if (equalNames(property.name, name)) {
            property.value = std::move(value);
            return;
        }
    }
    instance.properties.push_back({name, std::move(value)});
}

Value textArray(const std::vector<std::string>& texts) {
    Value::Array elements;
    for (const std::string& text : texts) {
        elements.push_back(Value::string(text));
    }
    return {CMPI_stringA, std::move(elements)};
}

Value reference(ObjectPath path) {
    return {CMPI_ref, std::make_shared<const ObjectPath>(std::move(path))};
}

Value number16(std::uint64_t number) {
    return Value::uint(CMPI_uint16, number);
}

Value number64(std::uint64_t number) {
    return Value::uint(CMPI_uint64, number);
}

Value timeValue(Time time) {
    const auto since = std::chrono::duration_cast<std::chrono::microseconds>(time.time_since_epoch());
    const auto text = writeDateTime({static_cast<std::uint64_t>(since.count()), false});
    return text ? Value{CMPI_dateTime, DateTime{*text}} : Value::null(CMPI_dateTime);
}

} // namespace marlo::subscriptions
