#include "host/cimom/References.h"

#include "host/cimom/ClassChecks.h"

#include <memory>
#include <utility>

namespace marlo {

namespace {

constexpr std::string_view interopAlias = "interop";
constexpr std::string_view interopNameSpace = "root/interop";

std::string_view withoutSlashes(std::string_view text) {
    while (!text.empty() && text.front() == '/') {
        text.remove_prefix(1);
    }
    while (!text.empty() && text.back() == '/') {
        text.remove_suffix(1);
    }
    return text;
}

/** The namespace of a path's text form, in which the name of a host may have been taken for its beginning. */
std::string spellPathNameSpace(const Schema& schema, const std::string& nameSpace) {
    std::string spelled = spellNameSpace(schema, nameSpace);
    const auto slash = spelled.find('/');
    if (!schema.hasNameSpace(spelled) && slash != std::string::npos) {
        std::string behindHost = spellNameSpace(schema, std::string_view(spelled).substr(slash));
        if (schema.hasNameSpace(behindHost)) {
            return behindHost;
        }
    }
    return spelled;
}

/** wbemcli writes a reference's namespace, and a host before that, into the name of its class. */
ObjectPath withPlainClassName(ObjectPath path) {
    const auto colon = path.className.rfind(':');
    if (colon != std::string::npos) {
        path.nameSpace = path.className.substr(0, colon);
        path.className.erase(0, colon + 1);
    }
    return path;
}

} // namespace

std::string spellNameSpace(const Schema& schema, std::string_view nameSpace) {
    const std::string_view name = withoutSlashes(nameSpace);
    const std::string* known = schema.findNameSpace(name);
    if (known == nullptr && equalNames(name, interopAlias)) {
        known = schema.findNameSpace(interopNameSpace);
    }
    return known == nullptr ? std::string(name) : *known;
}

ObjectPath spellPath(const Schema& schema, const std::string& nameSpace, const ObjectPath& written) {
    const ObjectPath path = withPlainClassName(written);
    ObjectPath spelled{
        "", path.nameSpace.empty() ? nameSpace : spellPathNameSpace(schema, path.nameSpace), path.className, {}};
    const Class* definition = schema.findClass(spelled.nameSpace, path.className);
    if (definition == nullptr) {
        spelled.keys = path.keys;
        return spelled;
    }
    spelled.className = definition->name;
    for (const Property* key : definition->keys()) {
        if (const NamedValue* given = findName(path.keys, key->name)) {
            spelled.keys.push_back(
                {key->name, spellReferences(schema, spelled.nameSpace,
                                            convertKey(given->value, key->type).value_or(given->value))});
        }
    }
    for (const NamedValue& given : path.keys) {
        if (findName(spelled.keys, given.name) == nullptr) {
            spelled.keys.push_back(given);
        }
    }
    return spelled;
}

Value spellReferences(const Schema& schema, const std::string& nameSpace, Value value) {
    if (const auto* path = std::get_if<std::shared_ptr<const ObjectPath>>(&value.data)) {
        if (*path != nullptr) {
            value.data = std::make_shared<const ObjectPath>(spellPath(schema, nameSpace, **path));
        }
    } else if (auto* elements = std::get_if<Value::Array>(&value.data);
               elements != nullptr && value.type == CMPI_refA) {
        for (Value& element : *elements) {
            element = spellReferences(schema, nameSpace, std::move(element));
        }
    }
    return value;
}

} // namespace marlo
