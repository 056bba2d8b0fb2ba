/** @file Operations that follow associations. */
#include "host/cimom/ClassChecks.h"
#include "host/cimom/Operations.h"
#include "host/cimom/References.h"

#include <algorithm>
#include <set>
#include <utility>

namespace marlo {

namespace {

bool isRole(const Property& property, const std::string& role) {
    return property.type == CMPI_ref && (role.empty() || equalNames(property.name, role));
}

bool hasRole(const Class& definition, const std::string& role) {
    return std::any_of(definition.properties.begin(), definition.properties.end(),
                       [&role](const Property& property) { return isRole(property, role); });
}

[[noreturn]] void refuse(const std::string& reason) {
    throw RequestError(CMPI_RC_ERR_INVALID_PARAMETER, reason);
}

/** The association classes of a namespace that a filter lets pass. */
std::vector<const Class*> associationsOf(const Schema& schema, const std::string& nameSpace,
                                         const std::string& associationClass) {
    std::vector<const Class*> found;
    for (const Class* each : schema.classes(nameSpace)) {
        if (each->isAssociation &&
            (associationClass.empty() || schema.isA(nameSpace, each->name, associationClass))) {
            found.push_back(each);
        }
    }
    return found;
}

void requireRole(const std::vector<const Class*>& associations, const std::string& role) {
    const bool exists = role.empty() || std::any_of(associations.begin(), associations.end(),
                                                    [&role](const Class* each) { return hasRole(*each, role); });
    if (!exists) {
        refuse("no association has a reference '" + role + "'");
    }
}

void requireKnownClass(const Schema& schema, const std::string& nameSpace, const std::string& name) {
    if (schema.findClass(nameSpace, name) == nullptr) {
        refuse("there is no class '" + name + "' in " + nameSpace);
    }
}

/** The same once more, after the filter has been compared with the schema. */
std::vector<const Class*> requireAssociations(const Schema& schema, const std::string& nameSpace,
                                              const AssociationFilter& filter) {
    for (const std::string& name : {filter.associationClass, filter.resultClass}) {
        if (!name.empty()) {
            requireKnownClass(schema, nameSpace, name);
        }
    }
    if (!filter.associationClass.empty() && !schema.findClass(nameSpace, filter.associationClass)->isAssociation) {
        refuse(filter.associationClass + " is not a class of associations");
    }
    auto associations = associationsOf(schema, nameSpace, filter.associationClass);
    requireRole(associations, filter.role);
    requireRole(associations, filter.resultRole);
    return associations;
}

/** What a reference of an instance points at, or null. */
const ObjectPath* targetOf(const Instance& instance, const Property& reference) {
    const NamedValue* value = findName(instance.properties, reference.name);
    const auto* path =
        value == nullptr ? nullptr : std::get_if<std::shared_ptr<const ObjectPath>>(&value->value.data);
    return path == nullptr ? nullptr : path->get();
}

bool pointsAt(const Instance& instance, const Property& reference, const ObjectPath& start) {
    const ObjectPath* target = targetOf(instance, reference);
    return target != nullptr && *target == start;
}

/** True when instances of the association may have a reference to instances of a class. */
bool mayPointAt(const Schema& schema, const std::string& nameSpace, const Class& association, const std::string& role,
                const std::string& className) {
    return std::any_of(association.properties.begin(), association.properties.end(), [&](const Property& property) {
        return isRole(property, role) && schema.isA(nameSpace, className, property.referenceClass);
    });
}

/** Calls `sink` with what the references at the other ends of an association point at. */
void forOtherEnds(const Class& definition, const Instance& association, const ObjectPath& start,
                  const AssociationFilter& filter, const std::function<void(const ObjectPath&)>& sink) {
    for (const Property& near : definition.properties) {
        if (!isRole(near, filter.role) || !pointsAt(association, near, start)) {
            continue;
        }
        for (const Property& far : definition.properties) {
            const ObjectPath* target = targetOf(association, far);
            if (&far != &near && isRole(far, filter.resultRole) && target != nullptr) {
                sink(*target);
            }
        }
    }
}

} // namespace

/** All associations of a start, with all their properties. */
Status Operations::findAssociations(
    const ObjectPath& given, const AssociationFilter& filter,
    const std::function<void(const Class& definition, Instance&& association, const ObjectPath& start)>& sink) {
    const ObjectPath path = spelled(given);
    const Class& startClass = requireClass(_core.schema, path.nameSpace, path.className);
    const auto associations = requireAssociations(_core.schema, path.nameSpace, filter);
    const ObjectPath start = requireKeys(_core.schema, startClass, path.nameSpace, path);
    for (const Class* definition : associations) {
        const auto servant = _core.findServant(ProviderKind::instance, path.nameSpace, definition->name);
        if (!servant || !mayPointAt(_core.schema, path.nameSpace, *definition, filter.role, startClass.name)) {
            continue;
        }
        InstanceChecks checks(_core.schema, path.nameSpace, *definition, servant->name(), _core.onceLog);
        Status status =
            servant->enumerateInstances(*definition, path.nameSpace, std::nullopt, [&](Instance&& instance) {
                auto checked = checks.checkInstance(std::move(instance), std::nullopt);
                if (checked && std::any_of(definition->properties.begin(), definition->properties.end(),
                                           [&](const Property& each) {
                                               return isRole(each, filter.role) && pointsAt(*checked, each, start);
                                           })) {
                    sink(*definition, *std::move(checked), start);
                }
            });
        if (!status.ok() && status.code != CMPI_RC_ERR_NOT_SUPPORTED) {
            return status;
        }
    }
    return {};
}

/** The paths at the other ends, each once. */
Status Operations::findOtherEnds(const ObjectPath& path, const AssociationFilter& filter,
                                 std::vector<ObjectPath>& ends) {
    std::set<std::string> known;
    return findAssociations(
        path, filter, [&](const Class& definition, Instance&& association, const ObjectPath& start) {
            forOtherEnds(definition, association, start, filter, [&](const ObjectPath& end) {
                const bool isResult =
                    filter.resultClass.empty() || _core.schema.isA(end.nameSpace, end.className, filter.resultClass);
                if (isResult && known.insert(end.toString()).second) {
                    ends.push_back(end);
                }
            });
        });
}

Status Operations::associators(const ObjectPath& path, const AssociationFilter& filter,
                               const PropertyList& properties, const InstanceSink& sink) {
    std::vector<ObjectPath> ends;
    Status status = findOtherEnds(path, filter, ends);
    for (auto end = ends.begin(); status.ok() && end != ends.end(); ++end) {
        try {
            const Class& definition = requireClass(_core.schema, end->nameSpace, end->className);
            status =
                getChecked(definition, requireKeys(_core.schema, definition, end->nameSpace, *end), properties, sink);
            if (status.code == CMPI_RC_ERR_NOT_FOUND) {
                status = {};
            }
        } catch (const RequestError& error) {
            _core.onceLog.say("left out what an association points at, " + end->toString() + ": " + error.what());
        }
    }
    return status;
}

Status Operations::associatorNames(const ObjectPath& path, const AssociationFilter& filter, const PathSink& sink) {
    std::vector<ObjectPath> ends;
    Status status = findOtherEnds(path, filter, ends);
    if (status.ok()) {
        for (ObjectPath& end : ends) {
            sink(std::move(end));
        }
    }
    return status;
}

Status Operations::references(const ObjectPath& path, const AssociationFilter& filter, const PropertyList& properties,
                              const InstanceSink& sink) {
    return findAssociations(path, filter,
                            [&](const Class& /*definition*/, Instance&& association, const ObjectPath& /*start*/) {
                                cutTo(properties, association);
                                sink(std::move(association));
                            });
}

Status Operations::referenceNames(const ObjectPath& path, const AssociationFilter& filter, const PathSink& sink) {
    return findAssociations(path, filter,
                            [&](const Class& /*definition*/, Instance&& association, const ObjectPath& /*start*/) {
                                sink(std::move(association.path));
                            });
}

} // namespace marlo
