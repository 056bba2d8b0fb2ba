#include "host/cimom/InstanceChecks.h"

#include "host/cimom/ChangeChecks.h"
#include "host/cimom/References.h"

#include <algorithm>

namespace marlo {

namespace {

/** Embedded instances are texts to the schema; what qualifies a text as such a one is not checked. */
bool isOfType(const Value& value, CMPIType type) {
    return value.type == type ||
           ((type & ~CMPI_ARRAY) == CMPI_string && (value.type & ~CMPI_ARRAY) == CMPI_instance &&
            (type & CMPI_ARRAY) == (value.type & CMPI_ARRAY));
}

} // namespace

bool isAsked(const PropertyList& properties, const std::string& name) {
    return !properties || std::any_of(properties->begin(), properties->end(),
                                      [&name](const std::string& asked) { return equalNames(asked, name); });
}

void OnceLog::say(const std::string& text) {
    {
        const std::lock_guard lock(_mutex);
        if (!_said.insert(text).second) {
            return;
        }
    }
    _log(text);
}

void InstanceChecks::say(const std::string& text) {
    _log.say("provider " + _provider + ": " + text);
}

const Class* InstanceChecks::classOf(const std::string& className) {
    if (_lastClass == nullptr || _lastName != className) {
        const Class* found = _schema.findClass(_nameSpace, className);
        if (found == nullptr || !_schema.isA(_nameSpace, className, _definition.name)) {
            say("left out an answer of class '" + className + "': it was asked for " + _definition.name);
            return nullptr;
        }
        _lastName = className;
        _lastClass = found;
    }
    return _lastClass;
}

std::optional<ObjectPath> InstanceChecks::checkPath(const ObjectPath& path) {
    const Class* definition = classOf(path.className);
    if (definition == nullptr) {
        return std::nullopt;
    }
    try {
        return requireKeys(_schema, *definition, _nameSpace, path);
    } catch (const RequestError& error) {
        say("left out an answer: " + std::string(error.what()));
        return std::nullopt;
    }
}

/** False when it is to be dropped. */
bool InstanceChecks::checkProperty(const Class& definition, NamedValue& property) {
    const Property* known = definition.findProperty(property.name);
    if (known == nullptr) {
        say("left out the property '" + property.name + "', which " + definition.name + " does not have");
        return false;
    }
    if (property.value.isNull()) {
        property.value = Value::null(known->type);
    } else if (!isOfType(property.value, known->type)) {
        say("left out the value of " + definition.name + "." + known->name + ", which is of type " +
            fullTypeName(property.value.type) + " and not " + fullTypeName(known->type));
        return false;
    } else if ((known->type & ~CMPI_ARRAY) == CMPI_ref) {
        property.value = spellReferences(_schema, _nameSpace, property.value);
    }
    property.name = known->name;
    return true;
}

std::optional<Instance> InstanceChecks::checkInstance(Instance&& instance, const PropertyList& properties) {
    auto path = checkPath(instance.path);
    if (!path) {
        return std::nullopt;
    }
    Instance checked{*std::move(path), {}};
    checked.properties.reserve(instance.properties.size());
    for (NamedValue& property : instance.properties) {
        if (isAsked(properties, property.name) && checkProperty(*_lastClass, property)) {
            checked.properties.push_back(std::move(property));
        }
    }
    return checked;
}

} // namespace marlo
