/**
 * @file
 * Operations that read instances.
 *
 * LocalOnly is read and then overlooked: an instance always has all of its properties. Later versions of the standard
 * tell servers to do so, since nobody could tell from such an answer which properties there are.
 */
#include "host/wbem/Instances.h"

namespace marlo::wbem {

namespace {

using cimxml::PathWrap;
using cimxml::Wrap;

} // namespace

Status getInstance(Call& call) {
    const ObjectPath path = call.arguments.instanceName("InstanceName");
    static_cast<void>(call.arguments.boolean("LocalOnly", true));
    InstanceOutput output(call, Wrap::instance, readForm(call.arguments));
    return call.manager.getInstance(path, readProperties(call, path.className),
                                    [&output](Instance&& instance) { output.write(instance); });
}

Status enumerateInstances(Call& call) {
    const std::string className = call.arguments.className("ClassName");
    static_cast<void>(call.arguments.boolean("LocalOnly", true));
    const Class& definition = requireClass(call.manager.schema(), call.nameSpace, className);
    const bool deep = call.arguments.boolean("DeepInheritance", true);
    InstanceOutput output(call, Wrap::namedInstance, readForm(call.arguments));
    Status status = call.manager.enumerateInstances(call.nameSpace, className, readProperties(call, className),
                                                    [&](Instance&& instance) {
                                                        if (!deep) {
                                                            cutToClass(definition, instance);
                                                        }
                                                        output.write(instance);
                                                    });
    if (status.ok()) {
        call.reply.returned();
    }
    return status;
}

Status enumerateInstanceNames(Call& call) {
    const std::string className = call.arguments.className("ClassName");
    Status status = call.manager.enumerateInstanceNames(
        call.nameSpace, className, [&call](ObjectPath&& path) { call.reply.returned().path(path, PathWrap::name); });
    if (status.ok()) {
        call.reply.returned();
    }
    return status;
}

Status getProperty(Call& call) {
    const ObjectPath path = call.arguments.instanceName("InstanceName");
    const std::string name = call.arguments.text("PropertyName");
    Status status =
        call.manager.getInstance(path, std::vector<std::string>{name}, [&call, &name](Instance&& instance) {
            const NamedValue* property = findName(instance.properties, name);
            if (property != nullptr) {
                call.reply.returned().value(property->value);
            }
        });
    if (status.ok()) {
        call.reply.returned(); // of NULL nothing is written
    }
    return status;
}

Status execQuery(Call& call) {
    const std::string language = call.arguments.text("QueryLanguage");
    const std::string query = call.arguments.text("Query");
    InstanceOutput output(call, Wrap::object, {});
    Status status = call.manager.execQuery(call.nameSpace, query, language,
                                           [&output](Instance&& instance) { output.write(instance); });
    if (status.ok()) {
        call.reply.returned();
    }
    return status;
}

} // namespace marlo::wbem
