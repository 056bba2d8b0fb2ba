#include "host/cimxml/ClassReader.h"

#include "host/cimxml/PathReader.h"
#include "host/cimxml/TypedText.h"

namespace marlo::cimxml {

namespace {

CMPIType arrayOf(CMPIType type, bool isArray) {
    return isArray ? static_cast<CMPIType>(type | CMPI_ARRAY) : type;
}

std::string attributeOr(const Node& node, std::string_view name, const std::string& otherwise) {
    const auto value = node.attribute(name);
    return value ? std::string(*value) : otherwise;
}

/** Flavors of a qualifier or of its type (DSP0004 5.6.3), with the defaults of DSP0201. */
template <typename T>
void readFlavors(const Node& node, T& qualifier) {
    qualifier.overridable = node.isTrue("OVERRIDABLE", true);
    qualifier.toSubclass = node.isTrue("TOSUBCLASS", true);
    qualifier.translatable = node.isTrue("TRANSLATABLE", false);
}

Qualifier readQualifier(const Node& node) {
    Qualifier qualifier;
    qualifier.name = node.require("NAME");
    qualifier.propagated = node.isTrue("PROPAGATED", false);
    readFlavors(node, qualifier);
    const CMPIType type = readType(node);
    const auto children = node.children();
    if (children.empty()) {
        qualifier.value = Value::null(type);
        return qualifier;
    }
    const Node value = node.onlyChild();
    if (!value.is("VALUE") && !value.is("VALUE.ARRAY")) {
        value.failMisplaced();
    }
    qualifier.value = readTyped(value, type);
    return qualifier;
}

Qualifiers readQualifiers(const Node& node) {
    Qualifiers qualifiers;
    for (const Node& child : node.children()) {
        if (child.is("QUALIFIER")) {
            qualifiers.push_back(readQualifier(child));
        }
    }
    return qualifiers;
}

bool saysTrue(const Qualifiers& qualifiers, std::string_view name, bool otherwise) {
    const Qualifier* found = findQualifier(qualifiers, name);
    const bool* truth = found == nullptr ? nullptr : std::get_if<bool>(&found->value.data);
    return truth == nullptr ? otherwise : *truth;
}

Property readProperty(const Node& node, const std::string& className, const Within& within) {
    Property property;
    property.name = node.require("NAME");
    property.qualifiers = readQualifiers(node);
    property.key = saysTrue(property.qualifiers, "Key", false);
    property.origin = attributeOr(node, "CLASSORIGIN", className);
    if (node.is("PROPERTY.REFERENCE")) {
        property.type = CMPI_ref;
        property.referenceClass = attributeOr(node, "REFERENCECLASS", "");
        const auto value = findValue(node, "VALUE.REFERENCE");
        property.defaultValue =
            value ? Value{CMPI_ref, std::make_shared<const ObjectPath>(readPath(value->onlyChild(), within.limits))}
                  : Value::null(CMPI_ref);
        return property;
    }
    const bool isArray = node.is("PROPERTY.ARRAY");
    const CMPIType type = readType(node);
    property.type = arrayOf(type, isArray);
    const auto value = findValue(node, isArray ? "VALUE.ARRAY" : "VALUE");
    property.defaultValue = value ? readTyped(*value, type) : Value::null(property.type);
    return property;
}

Parameter readParameter(const Node& node) {
    Parameter parameter;
    parameter.name = node.require("NAME");
    parameter.qualifiers = readQualifiers(node);
    parameter.in = saysTrue(parameter.qualifiers, "In", true);
    parameter.out = saysTrue(parameter.qualifiers, "Out", false);
    const bool isArray = node.is("PARAMETER.ARRAY") || node.is("PARAMETER.REFARRAY");
    if (node.is("PARAMETER.REFERENCE") || node.is("PARAMETER.REFARRAY")) {
        parameter.type = arrayOf(CMPI_ref, isArray);
        parameter.referenceClass = attributeOr(node, "REFERENCECLASS", "");
    } else if (node.is("PARAMETER") || isArray) {
        parameter.type = arrayOf(readType(node), isArray);
    } else {
        node.failMisplaced();
    }
    return parameter;
}

Method readMethod(const Node& node, const std::string& className) {
    Method method;
    method.name = node.require("NAME");
    method.returnType = node.attribute("TYPE") ? readType(node) : CMPI_null;
    method.origin = attributeOr(node, "CLASSORIGIN", className);
    method.qualifiers = readQualifiers(node);
    for (const Node& child : node.children()) {
        if (!child.is("QUALIFIER")) {
            method.parameters.push_back(readParameter(child));
        }
    }
    return method;
}

std::vector<std::string> readScopes(const Node& node) {
    std::vector<std::string> scopes;
    for (const char* scope : {"CLASS", "ASSOCIATION", "REFERENCE", "PROPERTY", "METHOD", "PARAMETER", "INDICATION"}) {
        if (node.isTrue(scope, false)) {
            scopes.emplace_back(scope);
        }
    }
    return scopes;
}

} // namespace

Class readClass(const Node& node, const Within& within) {
    Class definition;
    definition.name = node.require("NAME");
    definition.superClass = attributeOr(node, "SUPERCLASS", "");
    definition.qualifiers = readQualifiers(node);
    definition.isAbstract = saysTrue(definition.qualifiers, "Abstract", false);
    definition.isAssociation = saysTrue(definition.qualifiers, "Association", false);
    definition.isIndication = saysTrue(definition.qualifiers, "Indication", false);
    for (const Node& child : node.children()) {
        if (child.name().starts_with("PROPERTY")) {
            node.requireAtMost(definition.properties.size() + 1, within.limits.properties, "properties");
            definition.properties.push_back(readProperty(child, definition.name, within));
        } else if (child.is("METHOD")) {
            definition.methods.push_back(readMethod(child, definition.name));
        } else if (!child.is("QUALIFIER")) {
            child.failMisplaced();
        }
    }
    return definition;
}

QualifierType readQualifierType(const Node& node) {
    QualifierType type;
    type.name = node.require("NAME");
    readFlavors(node, type);
    const CMPIType element = readType(node);
    type.defaultValue = Value::null(arrayOf(element, node.isTrue("ISARRAY", false)));
    for (const Node& child : node.children()) {
        if (child.is("SCOPE")) {
            type.scopes = readScopes(child);
        } else if (child.is("VALUE") || child.is("VALUE.ARRAY")) {
            type.defaultValue = readTyped(child, element);
        } else {
            child.failMisplaced();
        }
    }
    return type;
}

} // namespace marlo::cimxml
