#include "host/wbem/ClassAssociations.h"

#include <algorithm>

namespace marlo::wbem {

namespace {

bool isNamed(const std::string& filter, const std::string& name) {
    return filter.empty() || equalNames(filter, name);
}

/** An association class and the reference in it that the class in question fits into. */
struct Place {
    const Class* association;
    const Property* reference;
};

std::vector<Place> placesOf(const Schema& schema, std::string_view nameSpace, std::string_view className,
                            const AssociationFilter& filter) {
    std::vector<Place> places;
    for (const Class* association : schema.classes(nameSpace)) {
        const bool wanted =
            association->isAssociation &&
            (filter.associationClass.empty() || schema.isA(nameSpace, association->name, filter.associationClass));
        for (const Property& property : association->properties) {
            if (wanted && property.type == CMPI_ref && isNamed(filter.role, property.name) &&
                schema.isA(nameSpace, className, property.referenceClass)) {
                places.push_back({association, &property});
            }
        }
    }
    return places;
}

void addOnce(std::vector<const Class*>& classes, const Class* definition) {
    if (definition != nullptr && std::find(classes.begin(), classes.end(), definition) == classes.end()) {
        classes.push_back(definition);
    }
}

} // namespace

std::vector<const Class*> referencesOf(const Schema& schema, std::string_view nameSpace, std::string_view className,
                                       const AssociationFilter& filter) {
    std::vector<const Class*> found;
    for (const Place& place : placesOf(schema, nameSpace, className, filter)) {
        addOnce(found, place.association);
    }
    return found;
}

std::vector<const Class*> associatorsOf(const Schema& schema, std::string_view nameSpace, std::string_view className,
                                        const AssociationFilter& filter) {
    std::vector<const Class*> found;
    for (const Place& place : placesOf(schema, nameSpace, className, filter)) {
        for (const Property& other : place.association->properties) {
            const bool wanted =
                &other != place.reference && other.type == CMPI_ref && isNamed(filter.resultRole, other.name) &&
                (filter.resultClass.empty() || schema.isA(nameSpace, other.referenceClass, filter.resultClass));
            if (wanted) {
                addOnce(found, schema.findClass(nameSpace, other.referenceClass));
            }
        }
    }
    return found;
}

} // namespace marlo::wbem
