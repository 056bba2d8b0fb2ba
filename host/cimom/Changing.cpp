/** @file Operations that change something. */
#include "host/cimom/ChangeChecks.h"
#include "host/cimom/ClassChecks.h"
#include "host/cimom/Operations.h"
#include "host/cimom/References.h"

#include <algorithm>
#include <utility>

namespace marlo {

Status Operations::modify(const Instance& modified, const PropertyList& properties) {
    const ObjectPath given = spelled(modified.path);
    const Class& definition = requireClass(_core.schema, given.nameSpace, given.className);
    const ObjectPath path = requireKeys(_core.schema, definition, given.nameSpace, given);
    const Modification modification =
        requireModification(_core.schema, definition, {path, modified.properties}, properties);
    return _core.servantOf(ProviderKind::instance, path.nameSpace, definition, CMPI_RC_ERR_NOT_SUPPORTED, "instances")
        .modifyInstance(definition, modification.instance, modification.names);
}

Status Operations::create(const Instance& instance, ObjectPath& created) {
    created = {};
    const std::string nameSpace = spellNameSpace(_core.schema, instance.path.nameSpace);
    const Class& definition = requireClass(_core.schema, nameSpace, instance.path.className);
    const Instance wanted = requireCreation(_core.schema, definition, nameSpace, instance);
    const Servant servant =
        _core.servantOf(ProviderKind::instance, nameSpace, definition, CMPI_RC_ERR_NOT_SUPPORTED, "instances");
    ObjectPath path = wanted.path; // for a provider that gives none of its own
    Status status = servant.createInstance(definition, wanted, path);
    if (!status.ok()) {
        return status;
    }
    InstanceChecks checks(_core.schema, nameSpace, definition, servant.name(), _core.onceLog);
    const auto checked = checks.checkPath(path);
    if (!checked) {
        return {CMPI_RC_ERR_FAILED,
                "provider " + servant.name() + " made an instance of " + definition.name +
                    " and gave back a path that is none of one: " + path.toString(),
                {}};
    }
    created = *checked;
    return status;
}

Status Operations::remove(const ObjectPath& given) {
    const ObjectPath path = spelled(given);
    const Class& definition = requireClass(_core.schema, path.nameSpace, path.className);
    const ObjectPath checked = requireKeys(_core.schema, definition, path.nameSpace, path);
    return _core.servantOf(ProviderKind::instance, path.nameSpace, definition, CMPI_RC_ERR_NOT_SUPPORTED, "instances")
        .deleteInstance(definition, checked);
}

/** A value that a method gave back, as one of a type; nothing when it cannot be that. */
std::optional<Value> Operations::convertOut(const std::string& nameSpace, const Value& value, CMPIType type) const {
    auto converted = convertValue(value, type);
    if (converted) {
        converted = spellReferences(_core.schema, nameSpace, *std::move(converted));
    }
    return converted;
}

/** Leaves those that the method has, spelled as it has them; what is wrong with the others is logged. */
void Operations::checkOut(const std::string& nameSpace, const Method& method, const std::string& servant,
                          std::vector<NamedValue>& out) {
    std::vector<NamedValue> checked;
    for (NamedValue& value : out) {
        const auto parameter =
            std::find_if(method.parameters.begin(), method.parameters.end(), [&value](const Parameter& known) {
                return known.out && equalNames(known.name, value.name);
            });
        auto converted =
            parameter == method.parameters.end() ? std::nullopt : convertOut(nameSpace, value.value, parameter->type);
        if (converted) {
            checked.push_back({parameter->name, *std::move(converted)});
        } else {
            _core.onceLog.say("provider " + servant + ": left out the parameter '" + value.name + "' of type " +
                              fullTypeName(value.value.type) + ", which " + method.name + " does not give back");
        }
    }
    out = std::move(checked);
}

Status Operations::invoke(const ObjectPath& given, const std::string& name, const std::vector<NamedValue>& arguments,
                          MethodAnswer& answer) {
    const ObjectPath path = spelled(given);
    const Class& definition = requireClass(_core.schema, path.nameSpace, path.className);
    const Method& method = requireMethod(definition, name);
    const ObjectPath checkedPath = requireMethodPath(_core.schema, definition, method, path);
    const auto checked = requireArguments(_core.schema, path.nameSpace, method, arguments);
    const Servant servant = _core.servantOf(ProviderKind::method, path.nameSpace, definition,
                                            CMPI_RC_ERR_METHOD_NOT_AVAILABLE, "methods");
    Status status = servant.invokeMethod(definition, checkedPath, method, checked, answer);
    if (!status.ok()) {
        return status;
    }
    const auto returned = convertOut(path.nameSpace, answer.returned, method.returnType);
    if (!returned || returned->isNull()) {
        return {CMPI_RC_ERR_FAILED,
                "provider " + servant.name() + " returned " + toText(answer.returned) + " of type " +
                    fullTypeName(answer.returned.type) + " from " + method.name + ", which is " +
                    fullTypeName(method.returnType),
                {}};
    }
    answer.returned = *returned;
    checkOut(path.nameSpace, method, servant.name(), answer.out);
    return status;
}

} // namespace marlo
