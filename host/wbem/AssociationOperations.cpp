/**
 * @file
 * Operations along associations: of instances, and of classes where the object is the name of one.
 */
#include "host/schema/ClassView.h"
#include "host/wbem/ClassAssociations.h"
#include "host/wbem/Instances.h"

namespace marlo::wbem {

namespace {

using cimxml::PathWrap;
using cimxml::Wrap;
using Classes = std::vector<const Class*>;

/** Classes that are named must be there: that of an object, and those of a filter, which are but parameters. */
void requireClasses(const Call& call, const ObjectPath& object, const AssociationFilter& filter) {
    requireClass(call.manager.schema(), call.nameSpace, object.className);
    for (const std::string& name : {filter.associationClass, filter.resultClass}) {
        if (!name.empty() && call.manager.schema().findClass(call.nameSpace, name) == nullptr) {
            throw RequestError(CMPI_RC_ERR_INVALID_PARAMETER,
                               "there is no class '" + name + "' in " + call.nameSpace);
        }
    }
}

Status writeClasses(Call& call, const Classes& classes) {
    const cimxml::Form form = readForm(call.arguments);
    ClassFilter filter;
    filter.localOnly = false;
    filter.includeQualifiers = form.qualifiers;
    filter.includeClassOrigin = form.classOrigin;
    filter.properties = call.arguments.propertyList();
    for (const Class* definition : classes) {
        call.reply.returned().classWithPath(call.nameSpace, viewClass(*definition, filter), form);
    }
    call.reply.returned();
    return {};
}

Status writeClassPaths(Call& call, const Classes& classes) {
    for (const Class* definition : classes) {
        call.reply.returned().classPath(call.nameSpace, definition->name);
    }
    call.reply.returned();
    return {};
}

Status ended(Call& call, Status status) {
    if (status.ok()) {
        call.reply.returned();
    }
    return status;
}

} // namespace

Status associators(Call& call) {
    const ObjectPath object = call.arguments.objectName("ObjectName");
    const AssociationFilter filter = readAssociatorFilter(call.arguments);
    if (object.keys.empty()) {
        requireClasses(call, object, filter);
        return writeClasses(call, associatorsOf(call.manager.schema(), call.nameSpace, object.className, filter));
    }
    InstanceOutput output(call, Wrap::objectWithPath, readForm(call.arguments));
    return ended(call, call.manager.associators(object, filter, call.arguments.propertyList(),
                                                [&output](Instance&& instance) { output.write(instance); }));
}

Status associatorNames(Call& call) {
    const ObjectPath object = call.arguments.objectName("ObjectName");
    const AssociationFilter filter = readAssociatorFilter(call.arguments);
    if (object.keys.empty()) {
        requireClasses(call, object, filter);
        return writeClassPaths(call, associatorsOf(call.manager.schema(), call.nameSpace, object.className, filter));
    }
    return ended(call, call.manager.associatorNames(object, filter, [&call](ObjectPath&& path) {
        call.reply.returned().path(path, PathWrap::object);
    }));
}

Status references(Call& call) {
    const ObjectPath object = call.arguments.objectName("ObjectName");
    const AssociationFilter filter = readReferenceFilter(call.arguments);
    if (object.keys.empty()) {
        requireClasses(call, object, filter);
        return writeClasses(call, referencesOf(call.manager.schema(), call.nameSpace, object.className, filter));
    }
    InstanceOutput output(call, Wrap::objectWithPath, readForm(call.arguments));
    return ended(call, call.manager.references(object, filter, call.arguments.propertyList(),
                                               [&output](Instance&& instance) { output.write(instance); }));
}

Status referenceNames(Call& call) {
    const ObjectPath object = call.arguments.objectName("ObjectName");
    const AssociationFilter filter = readReferenceFilter(call.arguments);
    if (object.keys.empty()) {
        requireClasses(call, object, filter);
        return writeClassPaths(call, referencesOf(call.manager.schema(), call.nameSpace, object.className, filter));
    }
    return ended(call, call.manager.referenceNames(object, filter, [&call](ObjectPath&& path) {
        call.reply.returned().path(path, PathWrap::object);
    }));
}

} // namespace marlo::wbem
