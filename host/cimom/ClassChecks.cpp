#include "host/cimom/ClassChecks.h"

#include "host/cimom/References.h"
#include "host/model/DateTimeText.h"

#include <algorithm>
#include <limits>
#include <stdexcept>

namespace marlo {

namespace {

std::string joined(const std::vector<std::string>& words) {
    std::string text;
    for (const std::string& word : words) {
        text += (text.empty() ? "" : ", ") + word;
    }
    return text.empty() ? "none" : text;
}

bool containsName(const std::vector<std::string>& names, std::string_view name) {
    return std::any_of(names.begin(), names.end(), [name](const auto& entry) { return equalNames(entry, name); });
}

struct IntegerRange {
    std::int64_t lowest;
    std::uint64_t highest;
};

std::optional<IntegerRange> rangeOf(CMPIType type) {
    switch (type) {
    case CMPI_uint8:
        return IntegerRange{0, std::numeric_limits<std::uint8_t>::max()};
    case CMPI_uint16:
        return IntegerRange{0, std::numeric_limits<std::uint16_t>::max()};
    case CMPI_uint32:
        return IntegerRange{0, std::numeric_limits<std::uint32_t>::max()};
    case CMPI_uint64:
        return IntegerRange{0, std::numeric_limits<std::uint64_t>::max()};
    case CMPI_sint8:
        return IntegerRange{std::numeric_limits<std::int8_t>::min(), std::numeric_limits<std::int8_t>::max()};
    case CMPI_sint16:
        return IntegerRange{std::numeric_limits<std::int16_t>::min(), std::numeric_limits<std::int16_t>::max()};
    case CMPI_sint32:
        return IntegerRange{std::numeric_limits<std::int32_t>::min(), std::numeric_limits<std::int32_t>::max()};
    case CMPI_sint64:
        return IntegerRange{std::numeric_limits<std::int64_t>::min(), std::numeric_limits<std::int64_t>::max()};
    default:
        return std::nullopt;
    }
}

bool isUnsigned(CMPIType type) {
    return type == CMPI_uint8 || type == CMPI_uint16 || type == CMPI_uint32 || type == CMPI_uint64;
}

std::optional<Value> convertInteger(const Value& value, CMPIType type, const IntegerRange& range) {
    if (const auto* number = std::get_if<std::uint64_t>(&value.data)) {
        if (*number > range.highest) {
            return std::nullopt;
        }
        return isUnsigned(type) ? Value::uint(type, *number) : Value::sint(type, static_cast<std::int64_t>(*number));
    }
    if (const auto* number = std::get_if<std::int64_t>(&value.data)) {
        if (*number < range.lowest || (*number > 0 && static_cast<std::uint64_t>(*number) > range.highest)) {
            return std::nullopt;
        }
        return isUnsigned(type) ? Value::uint(type, static_cast<std::uint64_t>(*number)) : Value::sint(type, *number);
    }
    return std::nullopt;
}

std::optional<Value> convertText(const std::string& text, CMPIType type) {
    if (type == CMPI_dateTime) {
        return readDateTime(text) ? std::optional(Value{type, DateTime{text}}) : std::nullopt;
    }
    if (type != CMPI_ref) {
        return std::nullopt;
    }
    try {
        return Value{type, std::make_shared<const ObjectPath>(ObjectPath::parse(text))};
    } catch (const std::invalid_argument&) {
        return std::nullopt;
    }
}

Value requireKey(const Class& definition, const Property& key, const ObjectPath& path) {
    const NamedValue* given = findName(path.keys, key.name);
    if (given == nullptr) {
        throw RequestError(CMPI_RC_ERR_INVALID_PARAMETER,
                           "the path lacks the key " + key.name + " of " + definition.name);
    }
    auto value = convertKey(given->value, key.type);
    if (!value) {
        throw RequestError(CMPI_RC_ERR_INVALID_PARAMETER, "the key " + key.name + " of " + definition.name +
                                                              " is of type " + typeName(key.type) + ", which " +
                                                              toText(given->value) + " is not");
    }
    return *std::move(value);
}

} // namespace

const Class& requireClass(const Schema& schema, const std::string& nameSpace, const std::string& className) {
    if (!schema.hasNameSpace(nameSpace)) {
        throw RequestError(CMPI_RC_ERR_INVALID_NAMESPACE,
                           "there is no namespace '" + nameSpace + "', but " + joined(schema.nameSpaces()));
    }
    const Class* definition = schema.findClass(nameSpace, className);
    if (definition == nullptr) {
        throw RequestError(CMPI_RC_ERR_INVALID_CLASS, "there is no class '" + className + "' in " + nameSpace);
    }
    return *definition;
}

void requireProperties(const Schema& schema, const std::string& nameSpace, const Class& definition,
                       const PropertyList& properties) {
    if (!properties) {
        return;
    }
    const auto classes = schema.withSubclasses(nameSpace, definition.name);
    for (const std::string& name : *properties) {
        const bool known = std::any_of(classes.begin(), classes.end(), [&name](const Class* candidate) {
            return candidate->findProperty(name) != nullptr;
        });
        if (!known) {
            throw RequestError(CMPI_RC_ERR_NO_SUCH_PROPERTY, definition.name + " has no property '" + name + "'");
        }
    }
}

PropertyList namesToAsk(const Class& definition, const PropertyList& properties) {
    if (!properties) {
        return std::nullopt;
    }
    std::vector<std::string> names;
    const auto add = [&names](const Property* property) {
        if (property != nullptr && !containsName(names, property->name)) {
            names.push_back(property->name);
        }
    };
    for (const std::string& name : *properties) {
        add(definition.findProperty(name));
    }
    for (const Property* key : definition.keys()) {
        add(key);
    }
    return names;
}

std::optional<Value> convertKey(const Value& value, CMPIType type) {
    if (value.isNull()) {
        return std::nullopt;
    }
    if (value.type == type) {
        return value;
    }
    if (const auto range = rangeOf(type)) {
        return convertInteger(value, type, *range);
    }
    if (const auto* text = std::get_if<std::string>(&value.data)) {
        return convertText(*text, type);
    }
    return std::nullopt;
}

ObjectPath requireKeys(const Schema& schema, const Class& definition, const std::string& nameSpace,
                       const ObjectPath& path) {
    ObjectPath checked{"", nameSpace, definition.name, {}};
    const auto keys = definition.keys();
    for (const NamedValue& given : path.keys) {
        const Property* property = definition.findProperty(given.name);
        if (property == nullptr || !property->key) {
            throw RequestError(CMPI_RC_ERR_INVALID_PARAMETER, definition.name + " has no key '" + given.name + "'");
        }
    }
    for (const Property* key : keys) {
        checked.keys.push_back({key->name, spellReferences(schema, nameSpace, requireKey(definition, *key, path))});
    }
    return checked;
}

} // namespace marlo
