#include "host/cimxml/ClassMarkup.h"

#include "host/cimxml/Escape.h"
#include "host/cimxml/ValueMarkup.h"

#include <algorithm>

namespace marlo::cimxml {

namespace {

void appendFlag(std::string& out, std::string_view name, bool flag, bool isDefault) {
    if (flag != isDefault) {
        appendAttribute(out, name, flag ? "true" : "false");
    }
}

/** The flavors that are not as DSP0201 has them where nothing is said. */
template <typename T>
void appendFlavors(std::string& out, const T& qualifier) {
    appendFlag(out, "OVERRIDABLE", qualifier.overridable, true);
    appendFlag(out, "TOSUBCLASS", qualifier.toSubclass, true);
    appendFlag(out, "TRANSLATABLE", qualifier.translatable, false);
}

void appendOrigin(std::string& out, const std::string& origin, bool isPropagated, const Form& form) {
    if (form.classOrigin && !origin.empty()) {
        appendAttribute(out, "CLASSORIGIN", origin);
    }
    appendFlag(out, "PROPAGATED", isPropagated, false);
}

void appendProperty(std::string& out, const Property& property, const Form& form) {
    const bool isReference = property.type == CMPI_ref;
    const std::string_view element = isReference                         ? "PROPERTY.REFERENCE"
                                     : (property.type & CMPI_ARRAY) != 0 ? "PROPERTY.ARRAY"
                                                                         : "PROPERTY";
    out += '<';
    out += element;
    appendAttribute(out, "NAME", property.name);
    if (!isReference) {
        appendAttribute(out, "TYPE", typeAttribute(property.type));
    } else if (!property.referenceClass.empty()) {
        appendAttribute(out, "REFERENCECLASS", property.referenceClass);
    }
    appendOrigin(out, property.origin, property.propagated, form);
    out += '>';
    if (form.qualifiers) {
        appendQualifiers(out, property.qualifiers);
    }
    appendValue(out, property.defaultValue);
    out += "</";
    out += element;
    out += '>';
}

std::string_view parameterElement(CMPIType type) {
    const bool isArray = (type & CMPI_ARRAY) != 0;
    if ((type & ~CMPI_ARRAY) == CMPI_ref) {
        return isArray ? "PARAMETER.REFARRAY" : "PARAMETER.REFERENCE";
    }
    return isArray ? "PARAMETER.ARRAY" : "PARAMETER";
}

void appendParameter(std::string& out, const Parameter& parameter, const Form& form) {
    const std::string_view element = parameterElement(parameter.type);
    out += '<';
    out += element;
    appendAttribute(out, "NAME", parameter.name);
    if ((parameter.type & ~CMPI_ARRAY) != CMPI_ref) {
        appendAttribute(out, "TYPE", typeAttribute(parameter.type));
    } else if (!parameter.referenceClass.empty()) {
        appendAttribute(out, "REFERENCECLASS", parameter.referenceClass);
    }
    out += '>';
    if (form.qualifiers) {
        appendQualifiers(out, parameter.qualifiers);
    }
    out += "</";
    out += element;
    out += '>';
}

void appendMethod(std::string& out, const Method& method, const Form& form) {
    out += "<METHOD";
    appendAttribute(out, "NAME", method.name);
    if (method.returnType != CMPI_null) {
        appendAttribute(out, "TYPE", typeAttribute(method.returnType));
    }
    appendOrigin(out, method.origin, method.propagated, form);
    out += '>';
    if (form.qualifiers) {
        appendQualifiers(out, method.qualifiers);
    }
    for (const Parameter& parameter : method.parameters) {
        appendParameter(out, parameter, form);
    }
    out += "</METHOD>";
}

void appendScopes(std::string& out, const std::vector<std::string>& scopes) {
    out += "<SCOPE";
    for (const char* scope : {"CLASS", "ASSOCIATION", "REFERENCE", "PROPERTY", "METHOD", "PARAMETER", "INDICATION"}) {
        const bool isGiven = std::any_of(scopes.begin(), scopes.end(), [scope](const std::string& given) {
            return equalNames(given, scope) || equalNames(given, "any");
        });
        appendFlag(out, scope, isGiven, false);
    }
    out += "/>";
}

} // namespace

void appendQualifiers(std::string& out, const Qualifiers& qualifiers) {
    for (const Qualifier& qualifier : qualifiers) {
        out += "<QUALIFIER";
        appendAttribute(out, "NAME", qualifier.name);
        appendAttribute(out, "TYPE", typeAttribute(qualifier.value.type));
        appendFlag(out, "PROPAGATED", qualifier.propagated, false);
        appendFlavors(out, qualifier);
        out += '>';
        appendValue(out, qualifier.value);
        out += "</QUALIFIER>";
    }
}

void appendClass(std::string& out, const Class& definition, const Form& form) {
    out += "<CLASS";
    appendAttribute(out, "NAME", definition.name);
    if (!definition.superClass.empty()) {
        appendAttribute(out, "SUPERCLASS", definition.superClass);
    }
    out += '>';
    if (form.qualifiers) {
        appendQualifiers(out, definition.qualifiers);
    }
    for (const Property& property : definition.properties) {
        appendProperty(out, property, form);
    }
    for (const Method& method : definition.methods) {
        appendMethod(out, method, form);
    }
    out += "</CLASS>";
}

void appendQualifierType(std::string& out, const QualifierType& type) {
    out += "<QUALIFIER.DECLARATION";
    appendAttribute(out, "NAME", type.name);
    appendAttribute(out, "TYPE", typeAttribute(type.defaultValue.type));
    appendAttribute(out, "ISARRAY", type.defaultValue.isArray() ? "true" : "false");
    appendFlavors(out, type);
    out += '>';
    appendScopes(out, type.scopes);
    appendValue(out, type.defaultValue);
    out += "</QUALIFIER.DECLARATION>";
}

} // namespace marlo::cimxml
