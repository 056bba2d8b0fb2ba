#include "host/cimxml/ObjectMarkup.h"

#include "host/cimxml/ClassMarkup.h"
#include "host/cimxml/Escape.h"
#include "host/cimxml/ValueMarkup.h"

namespace marlo::cimxml {

namespace {

/** EmbeddedObject="instance" tells of an instance of a class that the schema names, "object" of any. */
std::string_view embeddedKind(const Property* property) {
    const bool isAny = property != nullptr && findQualifier(property->qualifiers, "EmbeddedObject") != nullptr;
    return isAny ? "object" : "instance";
}

std::string_view elementOf(CMPIType type) {
    return (type & CMPI_ARRAY) != 0 ? "PROPERTY.ARRAY" : type == CMPI_ref ? "PROPERTY.REFERENCE" : "PROPERTY";
}

void appendBegin(std::string& out, const std::string& name, CMPIType type, const Property* property,
                 const Form& form) {
    out += '<';
    out += elementOf(type);
    appendAttribute(out, "NAME", name);
    if (type != CMPI_ref) {
        appendAttribute(out, "TYPE", typeAttribute(type));
    } else if (property != nullptr && !property->referenceClass.empty()) {
        appendAttribute(out, "REFERENCECLASS", property->referenceClass);
    }
    if (form.classOrigin && property != nullptr) {
        appendAttribute(out, "CLASSORIGIN", property->origin);
    }
    if ((type & ~CMPI_ARRAY) == CMPI_instance) {
        appendAttribute(out, "EmbeddedObject", embeddedKind(property));
    }
    out += '>';
    if (form.qualifiers && property != nullptr) {
        appendQualifiers(out, property->qualifiers);
    }
}

void appendEnd(std::string& out, CMPIType type) {
    out += "</";
    out += elementOf(type);
    out += '>';
}

void appendInstanceBegin(std::string& out, const Instance& instance) {
    out += "<INSTANCE";
    appendAttribute(out, "CLASSNAME", instance.path.className);
    out += '>';
}

} // namespace

void appendInstance(std::string& out, const Instance& instance) {
    appendInstanceBegin(out, instance);
    for (const auto& [name, value] : instance.properties) {
        appendBegin(out, name, value.type, nullptr, {});
        appendValue(out, value);
        appendEnd(out, value.type);
    }
    out += "</INSTANCE>";
}

InstanceMarkup::InstanceMarkup(const Class& definition, const Form& form) : _definition(definition), _form(form) {
    for (const Property& property : definition.properties) {
        Prepared prepared{&property, {}};
        appendBegin(prepared.begin, property.name, property.type, &property, form);
        _properties.push_back(std::move(prepared));
    }
    if (form.qualifiers) {
        appendQualifiers(_qualifiers, definition.qualifiers);
    }
}

void InstanceMarkup::append(std::string& out, const Instance& instance) const {
    appendInstanceBegin(out, instance);
    out += _qualifiers;
    std::size_t place = 0;
    for (const auto& [name, value] : instance.properties) {
        const Prepared* prepared = find(name, place);
        if (prepared != nullptr && prepared->property->type == value.type) {
            out += prepared->begin;
        } else {
            appendBegin(out, name, value.type, prepared == nullptr ? nullptr : prepared->property, _form);
        }
        appendValue(out, value);
        appendEnd(out, value.type);
    }
    out += "</INSTANCE>";
}

const InstanceMarkup::Prepared* InstanceMarkup::find(std::string_view name, std::size_t& place) const {
    for (std::size_t tried = 0; tried < _properties.size(); ++tried) {
        const std::size_t i = (place + tried) % _properties.size();
        if (equalNames(_properties[i].property->name, name)) {
            place = i + 1;
            return &_properties[i];
        }
    }
    return nullptr;
}

} // namespace marlo::cimxml
