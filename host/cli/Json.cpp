#include "host/cli/Json.h"

#include "host/schema/Utf8.h"

#include <nlohmann/json.hpp>

namespace marlo::cli {

namespace {

using Json = nlohmann::ordered_json;

Json makeObject(const Instance& instance);
Json makeJson(const Value& value);

struct ToJson {
    Json operator()(std::monostate) const { return nullptr; }

    Json operator()(char16_t value) const {
        std::string text;
        appendUtf8(text, value);
        return text;
    }

    Json operator()(const DateTime& value) const { return value.text; }

    Json operator()(const std::shared_ptr<const ObjectPath>& value) const {
        return value ? Json(value->toString()) : Json(nullptr);
    }

    Json operator()(const std::shared_ptr<const Instance>& value) const {
        return value ? makeObject(*value) : Json(nullptr);
    }

    Json operator()(const Value::Array& value) const {
        Json array = Json::array();
        for (const Value& element : value) {
            array.push_back(makeJson(element));
        }
        return array;
    }

    /** Booleans, numbers and texts are what they are. */
    template <class Plain>
    Json operator()(const Plain& value) const {
        return value;
    }
};

Json makeJson(const Value& value) {
    return std::visit(ToJson{}, value.data);
}

Json makeJson(const std::vector<NamedValue>& values) {
    Json object = Json::object();
    for (const NamedValue& value : values) {
        object[value.name] = makeJson(value.value);
    }
    return object;
}

Json makeObject(const Instance& instance) {
    return {{"path", instance.path.toString()},
            {"class", instance.path.className},
            {"properties", makeJson(instance.properties)}};
}

Json makeCall(const Call& call) {
    Json object = {{"call", call.name}};
    if (!call.status.ok()) {
        object["error"] = {
            {"code", call.status.code}, {"name", statusName(call.status.code)}, {"message", call.status.message}};
    } else if (!call.answer.returned.isNull()) {
        object["returned"] = makeJson(call.answer.returned);
        object["out"] = makeJson(call.answer.out);
    }
    if (!call.status.reported.empty()) {
        object["reported"] = call.status.reported;
    }
    return object;
}

/** Bytes that are no UTF-8 become U+FFFD: JSON has no way to carry them. */
std::string print(const Json& json) {
    return json.dump(-1, ' ', false, Json::error_handler_t::replace);
}

} // namespace

std::string toJson(const Instance& instance) {
    return print(makeObject(instance));
}

std::string toJson(const ObjectPath& path) {
    return print({{"path", path.toString()}, {"class", path.className}, {"keys", makeJson(path.keys)}});
}

std::string toJson(const ChangeReport& report) {
    Json calls = Json::array();
    for (const Call& call : report.calls) {
        calls.push_back(makeCall(call));
    }
    Json changes = Json::array();
    for (const Difference& difference : report.differences) {
        changes.push_back({{"adapter", difference.adapter},
                           {"property", difference.property},
                           {"before", makeJson(difference.before)},
                           {"after", makeJson(difference.after)}});
    }
    return print({{"calls", calls}, {"changes", changes}});
}

std::string toJson(const Class& schemaClass) {
    Json keys = Json::array();
    for (const Property* key : schemaClass.keys()) {
        keys.push_back(key->name);
    }
    return print({{"class", schemaClass.name},
                  {"superclass", schemaClass.superClass.empty() ? Json(nullptr) : Json(schemaClass.superClass)},
                  {"abstract", schemaClass.isAbstract},
                  {"keys", keys}});
}

} // namespace marlo::cli
