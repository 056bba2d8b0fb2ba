#include "host/wbem/MethodCall.h"

#include "host/cimom/ChangeChecks.h"
#include "host/wbem/Arguments.h"

#include <algorithm>

namespace marlo::wbem {

namespace {

NamedValue readNamed(const Method& method, const cimxml::NamedArgument& argument) {
    const auto parameter =
        std::find_if(method.parameters.begin(), method.parameters.end(),
                     [&argument](const Parameter& known) { return equalNames(known.name, argument.name); });
    if (parameter == method.parameters.end()) {
        throw RequestError(CMPI_RC_ERR_INVALID_PARAMETER, method.name + " has no parameter '" + argument.name + "'");
    }
    auto value = cimxml::readArgument(argument.value, parameter->type);
    if (!value) {
        throw RequestError(CMPI_RC_ERR_INVALID_PARAMETER, "the parameter " + parameter->name + " of " + method.name +
                                                              " is of type " + fullTypeName(parameter->type) +
                                                              ", which the argument is not");
    }
    return {parameter->name, *std::move(value)};
}

} // namespace

Status callMethod(ObjectManager& manager, const cimxml::ExtrinsicCall& call, Reply& reply) {
    ObjectPath path = call.path;
    path.nameSpace = manager.spell(path.nameSpace);
    const Class& definition = requireClass(manager.schema(), path.nameSpace, path.className);
    nameLoneKey(manager.schema(), path);
    const Method& method = requireMethod(definition, call.method);
    std::vector<NamedValue> arguments;
    for (const cimxml::NamedArgument& argument : call.arguments) {
        arguments.push_back(readNamed(method, argument));
    }
    MethodAnswer answer;
    Status status = manager.invokeMethod(path, call.method, arguments, answer);
    if (status.ok()) {
        cimxml::Writer& writer = reply.behind();
        writer.returnValue(answer.returned);
        for (const NamedValue& value : answer.out) {
            writer.outParameter(value);
        }
    }
    return status;
}

} // namespace marlo::wbem
