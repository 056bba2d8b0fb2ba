/**
 * @file
 * Operations that change instances.
 */
#include "host/wbem/Operation.h"

namespace marlo::wbem {

namespace {

[[noreturn]] void typeMismatch(const Class& definition, const Property& property) {
    throw RequestError(CMPI_RC_ERR_TYPE_MISMATCH,
                       definition.name + "." + property.name + " is of type " + typeName(property.type) +
                           ((property.type & CMPI_ARRAY) != 0 ? "[]" : "") + ", which the parameter NewValue is not");
}

} // namespace

Status createInstance(Call& call) {
    ObjectPath created;
    Status status = call.manager.createInstance(call.arguments.instance("NewInstance"), created);
    if (status.ok()) {
        call.reply.returned().path(created, cimxml::PathWrap::name);
    }
    return status;
}

Status modifyInstance(Call& call) {
    static_cast<void>(call.arguments.boolean("IncludeQualifiers", true)); // instances have no qualifiers of their own
    return call.manager.modifyInstance(call.arguments.instance("ModifiedInstance"), call.arguments.propertyList());
}

Status deleteInstance(Call& call) {
    return call.manager.deleteInstance(call.arguments.instanceName("InstanceName"));
}

Status setProperty(Call& call) {
    const ObjectPath path = call.arguments.instanceName("InstanceName");
    const std::string name = call.arguments.text("PropertyName");
    const Class& definition = requireClass(call.manager.schema(), call.nameSpace, path.className);
    const Property* property = definition.findProperty(name);
    if (property == nullptr) {
        throw RequestError(CMPI_RC_ERR_NO_SUCH_PROPERTY, definition.name + " has no property '" + name + "'");
    }
    auto value = cimxml::readArgument(call.arguments.raw("NewValue"), property->type);
    if (!value) {
        typeMismatch(definition, *property);
    }
    return call.manager.modifyInstance({path, {{property->name, *std::move(value)}}},
                                       std::vector<std::string>{property->name});
}

} // namespace marlo::wbem
