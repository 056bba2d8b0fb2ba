#include "host/cimom/ChangeChecks.h"

#include "host/cimom/InstanceChecks.h"
#include "host/cimom/References.h"

#include <algorithm>

namespace marlo {

namespace {

bool isTrue(const Qualifiers& qualifiers, std::string_view name) {
    const Qualifier* found = findQualifier(qualifiers, name);
    const bool* truth = found == nullptr ? nullptr : std::get_if<bool>(&found->value.data);
    return truth != nullptr && *truth;
}

[[noreturn]] void refuse(const std::string& reason) {
    throw RequestError(CMPI_RC_ERR_INVALID_PARAMETER, reason);
}

const Property& requireProperty(const Class& definition, const std::string& name) {
    const Property* property = definition.findProperty(name);
    if (property == nullptr) {
        throw RequestError(CMPI_RC_ERR_NO_SUCH_PROPERTY, definition.name + " has no property '" + name + "'");
    }
    return *property;
}

Value requireType(const std::string& what, const Value& value, CMPIType type) {
    auto converted = convertValue(value, type);
    if (!converted) {
        refuse(what + " is of type " + fullTypeName(type) + ", which " + toText(value) + " is not");
    }
    return *std::move(converted);
}

/** The value of a property as its class has it. */
NamedValue requireValue(const Schema& schema, const std::string& nameSpace, const Class& definition,
                        const Property& property, const Value& value) {
    return {property.name, spellReferences(schema, nameSpace,
                                           requireType(definition.name + "." + property.name, value, property.type))};
}

/** The names to be changed. */
std::vector<std::string> namesToChange(const Class& definition, const Instance& modified,
                                       const PropertyList& properties) {
    std::vector<std::string> names;
    const auto add = [&names](const std::string& name) {
        if (std::find(names.begin(), names.end(), name) == names.end()) {
            names.push_back(name);
        }
    };
    if (!properties) {
        for (const NamedValue& given : modified.properties) {
            const Property& property = requireProperty(definition, given.name);
            if (isTrue(property.qualifiers, "Write") && !property.key) {
                add(property.name);
            }
        }
        return names;
    }
    for (const std::string& name : *properties) {
        const Property& property = requireProperty(definition, name);
        if (!property.key && !isTrue(property.qualifiers, "Write")) {
            refuse(definition.name + "." + property.name + " cannot be changed");
        }
        if (!property.key) {
            add(property.name);
        }
    }
    return names;
}

void requireSameKey(const Schema& schema, const Class& definition, const Property& key, const NamedValue& given,
                    const ObjectPath& path) {
    const NamedValue* inPath = findName(path.keys, key.name);
    if (inPath == nullptr ||
        !(inPath->value == requireValue(schema, path.nameSpace, definition, key, given.value).value)) {
        refuse("the key " + key.name + " of an instance of " + definition.name + " cannot be changed");
    }
}

void requireInstantiable(const Class& definition) {
    if (definition.isAbstract || definition.isIndication) {
        throw RequestError(CMPI_RC_ERR_INVALID_CLASS,
                           "there are no instances of " + definition.name + " itself, which is " +
                               (definition.isAbstract ? "abstract" : "a class of indications"));
    }
}

void requireOnce(const std::vector<NamedValue>& values, const NamedValue& value, const std::string& what) {
    if (findName(values, value.name) != &value) {
        refuse(what + " " + value.name + " is given twice");
    }
}

/** The keys of a new instance that its path gives, checked against those that its properties give. */
std::vector<NamedValue> requireKeysOf(const Schema& schema, const Class& definition, const std::string& nameSpace,
                                      const Instance& instance, const std::vector<NamedValue>& properties) {
    std::vector<NamedValue> keys;
    for (const NamedValue& given : instance.path.keys) {
        const Property* key = definition.findProperty(given.name);
        if (key == nullptr || !key->key) {
            refuse(definition.name + " has no key '" + given.name + "'");
        }
        requireOnce(instance.path.keys, given, "the key");
        keys.push_back(requireValue(schema, nameSpace, definition, *key, given.value));
        const NamedValue* property = findName(properties, key->name);
        if (property != nullptr && !property->value.isNull() && !(property->value == keys.back().value)) {
            refuse("the key " + key->name + " is another in the path than among the properties");
        }
    }
    return keys;
}

/** What a new instance has of a property: what was given, else the default; nothing where there is neither. */
std::optional<Value> initialValue(const Property& property, const std::vector<NamedValue>& given,
                                  const std::vector<NamedValue>& keys) {
    const NamedValue* value = findName(given, property.name);
    if (value == nullptr || value->value.isNull()) {
        const NamedValue* inPath = findName(keys, property.name);
        value = inPath == nullptr ? value : inPath;
    }
    if (value != nullptr) {
        return value->value;
    }
    return property.defaultValue.isNull() ? std::nullopt : std::optional(property.defaultValue);
}

/** The schema has no type for embedded instances but string, with a qualifier, which is not looked at. */
bool isEmbedded(const Value& value, CMPIType type) {
    return (type & ~CMPI_ARRAY) == CMPI_string && (value.type & ~CMPI_ARRAY) == CMPI_instance &&
           (type & CMPI_ARRAY) == (value.type & CMPI_ARRAY);
}

} // namespace

std::string fullTypeName(CMPIType type) {
    const std::string name = type == CMPI_null ? "none" : typeName(type);
    return (type & CMPI_ARRAY) != 0 ? name + "[]" : name;
}

std::optional<Value> convertValue(const Value& value, CMPIType type) {
    if (value.isNull()) {
        return Value::null(type);
    }
    if (isEmbedded(value, type)) {
        return value;
    }
    if ((type & CMPI_ARRAY) == 0) {
        // Embedded instances are texts to the schema, and CMPI has them as instances.
        const bool isEmbedded = type == CMPI_string && value.type == CMPI_instance;
        return value.isArray() ? std::nullopt : isEmbedded ? value : convertKey(value, type);
    }
    const auto* given = std::get_if<Value::Array>(&value.data);
    if (given == nullptr) {
        return std::nullopt;
    }
    Value::Array elements;
    for (const Value& element : *given) {
        auto converted = convertValue(element, static_cast<CMPIType>(type & ~CMPI_ARRAY));
        if (!converted) {
            return std::nullopt;
        }
        elements.push_back(*std::move(converted));
    }
    return Value{type, std::move(elements)};
}

Modification requireModification(const Schema& schema, const Class& definition, const Instance& modified,
                                 const PropertyList& properties) {
    const std::string& nameSpace = modified.path.nameSpace;
    Modification modification;
    modification.instance.path = modified.path;
    modification.names = namesToChange(definition, modified, properties);
    for (const NamedValue& given : modified.properties) {
        const Property& property = requireProperty(definition, given.name);
        if (property.key) {
            requireSameKey(schema, definition, property, given, modified.path);
        }
    }
    for (const Property& property : definition.properties) {
        const NamedValue* given = findName(property.key ? modified.path.keys : modified.properties, property.name);
        const bool isChanged = property.key || isAsked(modification.names, property.name);
        modification.instance.properties.push_back(
            given != nullptr && isChanged ? requireValue(schema, nameSpace, definition, property, given->value)
                                          : NamedValue{property.name, Value::null(property.type)});
    }
    return modification;
}

Instance requireCreation(const Schema& schema, const Class& definition, const std::string& nameSpace,
                         const Instance& instance) {
    requireInstantiable(definition);
    std::vector<NamedValue> given;
    for (const NamedValue& value : instance.properties) {
        const Property& property = requireProperty(definition, value.name);
        requireOnce(instance.properties, value, "the property");
        given.push_back(requireValue(schema, nameSpace, definition, property, value.value));
    }
    const auto keys = requireKeysOf(schema, definition, nameSpace, instance, given);
    Instance created{{"", nameSpace, definition.name, {}}, {}};
    for (const Property& property : definition.properties) {
        if (auto value = initialValue(property, given, keys)) {
            if (property.key && !value->isNull()) {
                created.path.keys.push_back({property.name, *value});
            }
            created.properties.push_back({property.name, *std::move(value)});
        }
    }
    return created;
}

const Method& requireMethod(const Class& definition, const std::string& name) {
    const Method* method = definition.findMethod(name);
    if (method == nullptr) {
        throw RequestError(CMPI_RC_ERR_METHOD_NOT_FOUND, definition.name + " has no method '" + name + "'");
    }
    return *method;
}

ObjectPath requireMethodPath(const Schema& schema, const Class& definition, const Method& method,
                             const ObjectPath& path) {
    if (path.keys.empty() && isTrue(method.qualifiers, "Static")) {
        return {"", path.nameSpace, definition.name, {}};
    }
    return requireKeys(schema, definition, path.nameSpace, path);
}

std::vector<NamedValue> requireArguments(const Schema& schema, const std::string& nameSpace, const Method& method,
                                         const std::vector<NamedValue>& arguments) {
    for (auto argument = arguments.begin(); argument != arguments.end(); ++argument) {
        const bool isTaken =
            std::any_of(method.parameters.begin(), method.parameters.end(), [&](const Parameter& parameter) {
                return parameter.in && equalNames(parameter.name, argument->name);
            });
        if (!isTaken) {
            refuse(method.name + " takes no parameter '" + argument->name + "'");
        }
        if (findName(arguments, argument->name) != &*argument) {
            refuse(method.name + " takes one parameter " + argument->name + ", which is given twice");
        }
    }
    std::vector<NamedValue> checked;
    for (const Parameter& parameter : method.parameters) {
        if (const NamedValue* given = findName(arguments, parameter.name); given != nullptr) {
            checked.push_back(
                {parameter.name, spellReferences(schema, nameSpace,
                                                 requireType("the parameter " + parameter.name + " of " + method.name,
                                                             given->value, parameter.type))});
        }
    }
    return checked;
}

} // namespace marlo
