#include "host/schema/ClassBuilder.h"

#include "host/schema/Literals.h"

#include <algorithm>
#include <utility>

namespace marlo::mof {

namespace {

bool isTrue(const Qualifiers& qualifiers, std::string_view name, bool otherwise = false) {
    const Qualifier* const qualifier = findQualifier(qualifiers, name);
    const bool* const value = qualifier == nullptr ? nullptr : std::get_if<bool>(&qualifier->value.data);
    return value == nullptr ? otherwise : *value;
}

bool uses(const QualifierUses& qualifiers, std::string_view name) {
    return std::any_of(qualifiers.begin(), qualifiers.end(),
                       [name](const QualifierUse& use) { return equalNames(use.name, name); });
}

/** What a subclass has of a qualifier list when it says nothing of its own. */
Qualifiers propagate(const Qualifiers& inherited) {
    Qualifiers result;
    for (const Qualifier& qualifier : inherited) {
        if (qualifier.toSubclass) {
            result.push_back(qualifier);
            result.back().propagated = true;
        }
    }
    return result;
}

/** The element of a name in a list of properties, methods or parameters, or null. */
template <class Element>
Element* findElement(std::vector<Element>& elements, std::string_view name) {
    const auto found = std::find_if(elements.begin(), elements.end(),
                                    [name](const Element& element) { return equalNames(element.name, name); });
    return found == elements.end() ? nullptr : &*found;
}

bool sameSignature(const Method& left, const Method& right) {
    return left.returnType == right.returnType &&
           std::equal(left.parameters.begin(), left.parameters.end(), right.parameters.begin(),
                      right.parameters.end(), [](const Parameter& one, const Parameter& other) {
                          return one.type == other.type && equalNames(one.name, other.name);
                      });
}

std::string joinScopes(const std::vector<std::string>& scopes) {
    std::string joined;
    for (const std::string& scope : scopes) {
        joined += (joined.empty() ? "" : ", ") + scope;
    }
    return joined;
}

} // namespace

ClassBuilder::ClassBuilder(const ClassDeclaration& declaration, const Class* superClass, const NameSpace& nameSpace)
    : _declaration(declaration), _superClass(superClass), _nameSpace(nameSpace) {}

Class ClassBuilder::build() {
    _class.name = _declaration.name;
    _class.file = *_declaration.at.file;
    _class.line = _declaration.at.line;
    if (_superClass != nullptr) {
        inherit();
    }
    const Qualifiers none;
    _class.qualifiers =
        mergeQualifiers(_declaration.qualifiers, _superClass == nullptr ? none : _superClass->qualifiers,
                        classScopes(), "class " + _class.name);
    _class.isAbstract = isTrue(_class.qualifiers, "Abstract");
    _class.isAssociation = isTrue(_class.qualifiers, "Association");
    _class.isIndication = isTrue(_class.qualifiers, "Indication");
    for (const FeatureDeclaration& feature : _declaration.features) {
        if (!_seen.insert(feature.name).second) {
            throw Error(feature.at, "class " + _class.name + " has " + feature.name + " already");
        }
        if (feature.isMethod) {
            addMethod(feature);
        } else {
            addProperty(feature);
        }
    }
    return std::move(_class);
}

void ClassBuilder::inherit() {
    _class.superClass = _superClass->name;
    _class.properties = _superClass->properties;
    for (Property& property : _class.properties) {
        property.qualifiers = propagate(property.qualifiers);
        property.propagated = true;
    }
    _class.methods = _superClass->methods;
    for (Method& method : _class.methods) {
        method.qualifiers = propagate(method.qualifiers);
        method.propagated = true;
        for (Parameter& parameter : method.parameters) {
            parameter.qualifiers = propagate(parameter.qualifiers);
        }
    }
}

void ClassBuilder::addProperty(const FeatureDeclaration& feature) {
    const std::string element = "property " + _class.name + "." + feature.name;
    Property* const inherited = findElement(_class.properties, feature.name);
    Property property;
    property.name = feature.name;
    property.type = feature.type.type;
    property.referenceClass = feature.type.referenceClass;
    const bool isReference = property.type == CMPI_ref;
    property.qualifiers =
        mergeQualifiers(feature.qualifiers, inherited == nullptr ? Qualifiers{} : inherited->qualifiers,
                        {isReference ? "reference" : "property"}, element);
    property.key = isTrue(property.qualifiers, "Key");
    property.origin = inherited == nullptr ? _class.name : inherited->origin;
    checkOverride(feature, property.qualifiers, inherited != nullptr, property.origin);
    if (inherited != nullptr && inherited->type != property.type) {
        throw Error(feature.type.at, element + " is of type " + showType(property.type) + ", but overrides one of " +
                                         showType(inherited->type) + " of class " + inherited->origin);
    }
    checkKeys(property, feature);
    if (feature.defaultValue) {
        property.defaultValue = makeValue(property.type, *feature.defaultValue, "the default of " + element);
    } else {
        property.defaultValue = inherited == nullptr ? Value::null(property.type) : inherited->defaultValue;
    }
    if (inherited == nullptr) {
        _class.properties.push_back(std::move(property));
    } else {
        *inherited = std::move(property);
    }
}

void ClassBuilder::addMethod(const FeatureDeclaration& feature) {
    const std::string element = "method " + _class.name + "." + feature.name;
    Method* const inherited = findElement(_class.methods, feature.name);
    Method method;
    method.name = feature.name;
    method.returnType = feature.type.type;
    method.qualifiers = mergeQualifiers(
        feature.qualifiers, inherited == nullptr ? Qualifiers{} : inherited->qualifiers, {"method"}, element);
    method.origin = inherited == nullptr ? _class.name : inherited->origin;
    method.parameters = buildParameters(feature, inherited);
    checkOverride(feature, method.qualifiers, inherited != nullptr, method.origin);
    if (inherited == nullptr) {
        _class.methods.push_back(std::move(method));
    } else if (sameSignature(*inherited, method)) {
        *inherited = std::move(method);
    } else {
        throw Error(feature.type.at, element + " has not the type and parameters of the one of class " +
                                         inherited->origin + " that it overrides");
    }
}

std::vector<Parameter> ClassBuilder::buildParameters(const FeatureDeclaration& feature,
                                                     const Method* inherited) const {
    std::vector<Parameter> parameters;
    for (const ParameterDeclaration& declaration : feature.parameters) {
        if (findElement(parameters, declaration.name) != nullptr) {
            throw Error(declaration.at, "method " + _class.name + "." + feature.name + " has a parameter " +
                                            declaration.name + " already");
        }
        parameters.push_back(buildParameter(declaration, feature.name, inherited));
    }
    return parameters;
}

Parameter ClassBuilder::buildParameter(const ParameterDeclaration& declaration, const std::string& method,
                                       const Method* inherited) const {
    Qualifiers inheritedQualifiers;
    if (inherited != nullptr) {
        for (const Parameter& other : inherited->parameters) {
            if (equalNames(other.name, declaration.name)) {
                inheritedQualifiers = other.qualifiers;
            }
        }
    }
    Parameter parameter;
    parameter.name = declaration.name;
    parameter.type = declaration.type.type;
    parameter.referenceClass = declaration.type.referenceClass;
    parameter.qualifiers = mergeQualifiers(declaration.qualifiers, inheritedQualifiers, {"parameter"},
                                           "parameter " + _class.name + "." + method + "." + declaration.name);
    parameter.in = isTrue(parameter.qualifiers, "In", true);
    parameter.out = isTrue(parameter.qualifiers, "Out");
    return parameter;
}

/** An element takes the place of an inherited one only when its Override qualifier says so, and names it. */
void ClassBuilder::checkOverride(const FeatureDeclaration& feature, const Qualifiers& qualifiers, bool isInherited,
                                 const std::string& origin) const {
    const Qualifier* const qualifier = findQualifier(qualifiers, "Override");
    if (qualifier == nullptr || qualifier->value.isNull()) {
        if (isInherited) {
            throw Error(feature.at, _class.name + "." + feature.name + " is inherited from " + origin +
                                        ": it takes its place only with Override(\"" + feature.name + "\")");
        }
        return;
    }
    const auto& target = std::get<std::string>(qualifier->value.data);
    const bool namesIt = equalNames(target.substr(target.rfind('.') + 1), feature.name);
    if (!namesIt || !isInherited) {
        throw Error(feature.at, _class.name + "." + feature.name + " overrides \"" + target +
                                    "\", which is not the inherited element of its name");
    }
}

/** The keys of a class are settled where they first appear: a subclass has no further ones. */
void ClassBuilder::checkKeys(const Property& property, const FeatureDeclaration& feature) const {
    if (!property.key) {
        return;
    }
    if ((property.type & CMPI_ARRAY) != 0) {
        throw Error(feature.at, "property " + _class.name + "." + property.name + " is an array and cannot be a key");
    }
    const auto isKey = [](const Property& other) { return other.key; };
    if (_superClass == nullptr ||
        std::none_of(_superClass->properties.begin(), _superClass->properties.end(), isKey)) {
        return;
    }
    const Property* const inherited = _superClass->findProperty(property.name);
    if (inherited == nullptr || !inherited->key) {
        throw Error(feature.at, "class " + _class.name + " inherits its keys from " + _superClass->name + ": " +
                                    property.name + " cannot be a further one");
    }
}

/** What the class is, for the scopes of its qualifiers: an association is a class too. */
std::vector<std::string_view> ClassBuilder::classScopes() const {
    std::vector<std::string_view> scopes = {"class"};
    if (uses(_declaration.qualifiers, "Association") || (_superClass != nullptr && _superClass->isAssociation)) {
        scopes.emplace_back("association");
    }
    if (uses(_declaration.qualifiers, "Indication") || (_superClass != nullptr && _superClass->isIndication)) {
        scopes.emplace_back("indication");
    }
    return scopes;
}

Qualifiers ClassBuilder::mergeQualifiers(const QualifierUses& uses, const Qualifiers& inherited,
                                         const std::vector<std::string_view>& scopes,
                                         const std::string& element) const {
    Qualifiers result;
    for (const QualifierUse& use : uses) {
        if (findQualifier(result, use.name) != nullptr) {
            throw Error(use.at, element + " has qualifier " + use.name + " already");
        }
        result.push_back(makeQualifier(use, scopes, element));
    }
    for (Qualifier& qualifier : propagate(inherited)) {
        Qualifier* const own = findElement(result, qualifier.name);
        if (own == nullptr) {
            result.push_back(std::move(qualifier));
        } else if (!qualifier.overridable && !(own->value == qualifier.value)) {
            const auto use = std::find_if(uses.begin(), uses.end(),
                                          [&](const auto& other) { return equalNames(other.name, own->name); });
            throw Error(use->at, element + " inherits another value of qualifier " + own->name +
                                     ", which cannot be overridden");
        }
    }
    return result;
}

Qualifier ClassBuilder::makeQualifier(const QualifierUse& use, const std::vector<std::string_view>& scopes,
                                      const std::string& element) const {
    const QualifierType* const type = _nameSpace.findQualifierType(use.name);
    if (type == nullptr) {
        throw Error(use.at, "qualifier " + use.name + " of " + element + " is not declared");
    }
    const bool inScope = std::any_of(type->scopes.begin(), type->scopes.end(), [&scopes](const std::string& scope) {
        return scope == "any" || std::find(scopes.begin(), scopes.end(), scope) != scopes.end();
    });
    if (!inScope) {
        throw Error(use.at,
                    "qualifier " + type->name + " is for " + joinScopes(type->scopes) + ", not for " + element);
    }
    Qualifier qualifier;
    qualifier.name = type->name;
    qualifier.overridable = use.flavors.overridable.value_or(type->overridable);
    qualifier.toSubclass = use.flavors.toSubclass.value_or(type->toSubclass);
    qualifier.translatable = use.flavors.translatable.value_or(type->translatable);
    const CMPIType valueType = type->defaultValue.type;
    if (use.value) {
        qualifier.value = makeValue(valueType, *use.value, "qualifier " + type->name);
    } else {
        qualifier.value = valueType == CMPI_boolean ? Value::boolean(true) : Value::null(valueType);
    }
    return qualifier;
}

} // namespace marlo::mof
