#include "host/schema/ClassView.h"

#include <algorithm>
#include <utility>

namespace marlo {

namespace {

bool isAsked(const ClassFilter& filter, const std::string& name) {
    return !filter.properties || std::any_of(filter.properties->begin(), filter.properties->end(),
                                             [&name](const std::string& asked) { return equalNames(asked, name); });
}

Qualifiers viewQualifiers(const Qualifiers& qualifiers, const ClassFilter& filter) {
    Qualifiers seen;
    if (filter.includeQualifiers) {
        std::copy_if(qualifiers.begin(), qualifiers.end(), std::back_inserter(seen),
                     [&filter](const Qualifier& each) { return !filter.localOnly || !each.propagated; });
    }
    return seen;
}

/** A property or method with the qualifiers that are left of it. */
template <typename Feature>
Feature viewFeature(const Feature& feature, const ClassFilter& filter) {
    Feature seen = feature;
    seen.qualifiers = viewQualifiers(feature.qualifiers, filter);
    if (!filter.includeClassOrigin) {
        seen.origin.clear();
    }
    return seen;
}

Method viewMethod(const Method& method, const ClassFilter& filter) {
    Method seen = viewFeature(method, filter);
    for (Parameter& parameter : seen.parameters) {
        parameter.qualifiers = viewQualifiers(parameter.qualifiers, filter);
    }
    return seen;
}

} // namespace

Class viewClass(const Class& definition, const ClassFilter& filter) {
    Class seen;
    seen.name = definition.name;
    seen.superClass = definition.superClass;
    seen.isAbstract = definition.isAbstract;
    seen.isAssociation = definition.isAssociation;
    seen.isIndication = definition.isIndication;
    seen.file = definition.file;
    seen.line = definition.line;
    seen.qualifiers = viewQualifiers(definition.qualifiers, filter);
    for (const Property& property : definition.properties) {
        if (isAsked(filter, property.name) && !(filter.localOnly && property.propagated)) {
            seen.properties.push_back(viewFeature(property, filter));
        }
    }
    for (const Method& method : definition.methods) {
        if (!(filter.localOnly && method.propagated)) {
            seen.methods.push_back(viewMethod(method, filter));
        }
    }
    return seen;
}

std::vector<const Class*> subclasses(const Schema& schema, std::string_view nameSpace, std::string_view className,
                                     bool deep) {
    std::vector<const Class*> found;
    for (const Class* each : schema.classes(nameSpace)) {
        const bool isBelow =
            className.empty() || (!equalNames(each->name, className) && schema.isA(nameSpace, each->name, className));
        if (isBelow && (deep || equalNames(each->superClass, className))) {
            found.push_back(each);
        }
    }
    return found;
}

} // namespace marlo
