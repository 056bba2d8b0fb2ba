#include "host/wbem/Arguments.h"

#include "host/cimom/References.h"

#include <algorithm>
#include <array>
#include <utility>

namespace marlo::wbem {

namespace {

[[noreturn]] void refuse(const std::string& reason) {
    throw RequestError(CMPI_RC_ERR_INVALID_PARAMETER, reason);
}

[[noreturn]] void refuseType(const cimxml::IntrinsicCall& call, std::string_view name, const std::string& wanted) {
    refuse("the parameter " + std::string(name) + " of " + call.method + " is to be " + wanted);
}

bool isListed(std::string_view names, std::string_view name) {
    while (!names.empty()) {
        const auto end = std::min(names.find(' '), names.size());
        if (equalNames(names.substr(0, end), name)) {
            return true;
        }
        names.remove_prefix(std::min(end + 1, names.size()));
    }
    return false;
}

} // namespace

Arguments::Arguments(const cimxml::IntrinsicCall& call, std::string_view parameters, const Schema& schema,
                     std::string nameSpace)
    : _call(call), _schema(schema), _nameSpace(std::move(nameSpace)) {
    for (auto argument = call.arguments.begin(); argument != call.arguments.end(); ++argument) {
        if (!isListed(parameters, argument->name)) {
            refuse(call.method + " has no parameter '" + argument->name + "'");
        }
        const bool doubled = std::any_of(call.arguments.begin(), argument, [&argument](const auto& former) {
            return equalNames(former.name, argument->name);
        });
        if (doubled) {
            refuse("the parameter " + argument->name + " of " + call.method + " is given twice");
        }
    }
}

const cimxml::Argument* Arguments::find(std::string_view name) const {
    for (const cimxml::NamedArgument& argument : _call.arguments) {
        if (equalNames(argument.name, name) && !std::holds_alternative<std::monostate>(argument.value)) {
            return &argument.value;
        }
    }
    return nullptr;
}

const cimxml::Argument& Arguments::require(std::string_view name) const {
    const cimxml::Argument* argument = find(name);
    if (argument == nullptr) {
        refuse(_call.method + " needs the parameter " + std::string(name));
    }
    return *argument;
}

const cimxml::Argument& Arguments::raw(std::string_view name) const {
    static const cimxml::Argument none;
    const cimxml::Argument* argument = find(name);
    return argument == nullptr ? none : *argument;
}

std::string Arguments::className(std::string_view name) const {
    const cimxml::Argument& argument = require(name);
    if (const auto* className = std::get_if<cimxml::ClassName>(&argument)) {
        return className->name;
    }
    return text(name);
}

std::string Arguments::optionalClassName(std::string_view name) const {
    return has(name) ? className(name) : std::string();
}

std::string Arguments::text(std::string_view name) const {
    const auto value = cimxml::readArgument(require(name), CMPI_string);
    if (!value) {
        refuseType(_call, name, "a string");
    }
    return std::get<std::string>(value->data);
}

std::string Arguments::optionalText(std::string_view name) const {
    return has(name) ? text(name) : std::string();
}

bool Arguments::boolean(std::string_view name, bool otherwise) const {
    const cimxml::Argument* argument = find(name);
    if (argument == nullptr) {
        return otherwise;
    }
    const auto value = cimxml::readArgument(*argument, CMPI_boolean);
    if (!value) {
        refuseType(_call, name, "a boolean");
    }
    return std::get<bool>(value->data);
}

std::optional<std::uint32_t> Arguments::number(std::string_view name) const {
    const cimxml::Argument* argument = find(name);
    if (argument == nullptr) {
        return std::nullopt;
    }
    const auto value = cimxml::readArgument(*argument, CMPI_uint32);
    if (!value) {
        refuseType(_call, name, "a uint32");
    }
    return static_cast<std::uint32_t>(std::get<std::uint64_t>(value->data));
}

PropertyList Arguments::propertyList() const {
    const cimxml::Argument* argument = find("PropertyList");
    if (argument == nullptr) {
        return std::nullopt;
    }
    const auto value = cimxml::readArgument(*argument, CMPI_stringA);
    const auto* elements = value ? std::get_if<Value::Array>(&value->data) : nullptr;
    if (elements == nullptr) {
        refuseType(_call, "PropertyList", "an array of strings");
    }
    std::vector<std::string> names;
    for (const Value& element : *elements) {
        const auto* name = std::get_if<std::string>(&element.data);
        if (name == nullptr) {
            refuseType(_call, "PropertyList", "an array of strings without NULL");
        }
        names.push_back(*name);
    }
    return names;
}

ObjectPath Arguments::local(std::string_view name, ObjectPath path) const {
    if (!path.nameSpace.empty() && spellNameSpace(_schema, path.nameSpace) != _nameSpace) {
        refuse("the parameter " + std::string(name) + " of " + _call.method + " is of the namespace " +
               path.nameSpace + ", but the call of " + _call.nameSpace);
    }
    path.nameSpace = _nameSpace;
    path.host.clear();
    nameLoneKey(_schema, path);
    return path;
}

ObjectPath Arguments::instanceName(std::string_view name) const {
    const auto* path = std::get_if<ObjectPath>(&require(name));
    if (path == nullptr) {
        refuseType(_call, name, "the name of an instance");
    }
    return local(name, *path);
}

ObjectPath Arguments::objectName(std::string_view name) const {
    if (const auto* className = std::get_if<cimxml::ClassName>(&require(name))) {
        return {"", _nameSpace, className->name, {}};
    }
    return instanceName(name);
}

Instance Arguments::instance(std::string_view name) const {
    const auto* instance = std::get_if<Instance>(&require(name));
    if (instance == nullptr) {
        refuseType(_call, name, "an instance");
    }
    return {local(name, instance->path), instance->properties};
}

AssociationFilter readAssociatorFilter(const Arguments& arguments) {
    return {arguments.optionalClassName("AssocClass"), arguments.optionalClassName("ResultClass"),
            arguments.optionalText("Role"), arguments.optionalText("ResultRole")};
}

AssociationFilter readReferenceFilter(const Arguments& arguments) {
    return {arguments.optionalClassName("ResultClass"), "", arguments.optionalText("Role"), ""};
}

void nameLoneKey(const Schema& schema, ObjectPath& path) {
    if (path.keys.size() != 1 || !path.keys[0].name.empty()) {
        return;
    }
    const Class* definition = schema.findClass(path.nameSpace, path.className);
    const auto keys = definition == nullptr ? std::vector<const Property*>() : definition->keys();
    if (keys.size() == 1) {
        path.keys[0].name = keys[0]->name;
    }
}

std::string subjectOf(const cimxml::IntrinsicCall& call) {
    static constexpr std::array<std::string_view, 5> names{"ClassName", "InstanceName", "ObjectName", "NewInstance",
                                                           "ModifiedInstance"};
    for (const cimxml::NamedArgument& argument : call.arguments) {
        const bool named = std::any_of(names.begin(), names.end(), [&argument](std::string_view name) {
            return equalNames(argument.name, name);
        });
        if (!named) {
            continue;
        }
        if (const auto* className = std::get_if<cimxml::ClassName>(&argument.value)) {
            return className->name;
        }
        if (const auto* path = std::get_if<ObjectPath>(&argument.value)) {
            return path->className;
        }
        if (const auto* instance = std::get_if<Instance>(&argument.value)) {
            return instance->path.className;
        }
    }
    return {};
}

} // namespace marlo::wbem
