#include "host/cimom/SchemaKnowledge.h"

#include <algorithm>

namespace marlo {

namespace {

const Value* valueOf(const Qualifiers& qualifiers, std::string_view name) {
    const Qualifier* found = findQualifier(qualifiers, name);
    return found == nullptr ? nullptr : &found->value;
}

} // namespace

SchemaKnowledge::SchemaKnowledge(const Schema& schema) : _schema(schema) {
    for (const std::string& nameSpace : schema.nameSpaces()) {
        for (const Class* definition : schema.classes(nameSpace)) {
            std::vector<std::string>& names = _keys[definition];
            for (const Property* key : definition->keys()) {
                names.push_back(key->name);
            }
        }
    }
}

const std::vector<std::string>* SchemaKnowledge::keys(std::string_view nameSpace, std::string_view className) const {
    const auto found = _keys.find(_schema.findClass(nameSpace, className));
    return found == _keys.end() ? nullptr : &found->second;
}

bool SchemaKnowledge::isA(std::string_view nameSpace, std::string_view className, std::string_view ancestor) const {
    return _schema.isA(nameSpace, className, ancestor);
}

const Value* SchemaKnowledge::classQualifier(std::string_view nameSpace, std::string_view className,
                                             std::string_view qualifier) const {
    const Class* definition = _schema.findClass(nameSpace, className);
    return definition == nullptr ? nullptr : valueOf(definition->qualifiers, qualifier);
}

const Value* SchemaKnowledge::propertyQualifier(std::string_view nameSpace, std::string_view className,
                                                std::string_view property, std::string_view qualifier) const {
    const Class* definition = _schema.findClass(nameSpace, className);
    const Property* found = definition == nullptr ? nullptr : definition->findProperty(property);
    return found == nullptr ? nullptr : valueOf(found->qualifiers, qualifier);
}

const Value* SchemaKnowledge::methodQualifier(std::string_view nameSpace, std::string_view className,
                                              std::string_view method, std::string_view qualifier) const {
    const Class* definition = _schema.findClass(nameSpace, className);
    const Method* found = definition == nullptr ? nullptr : definition->findMethod(method);
    return found == nullptr ? nullptr : valueOf(found->qualifiers, qualifier);
}

const Value* SchemaKnowledge::parameterQualifier(std::string_view nameSpace, std::string_view className,
                                                 std::string_view method, std::string_view parameter,
                                                 std::string_view qualifier) const {
    const Class* definition = _schema.findClass(nameSpace, className);
    const Method* found = definition == nullptr ? nullptr : definition->findMethod(method);
    if (found == nullptr) {
        return nullptr;
    }
    const auto at = std::find_if(found->parameters.begin(), found->parameters.end(),
                                 [parameter](const Parameter& p) { return equalNames(p.name, parameter); });
    return at == found->parameters.end() ? nullptr : valueOf(at->qualifiers, qualifier);
}

} // namespace marlo
