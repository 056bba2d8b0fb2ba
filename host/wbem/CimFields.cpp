#include "host/wbem/CimFields.h"

#include "host/wbem/FieldText.h"
#include "host/wbem/HttpError.h"

#include <algorithm>
#include <memory>
#include <stdexcept>
#include <vector>

namespace marlo::wbem {

namespace {

constexpr unsigned badRequest = 400;
constexpr unsigned methodNotAllowed = 405;
constexpr unsigned notImplemented = 501;
constexpr unsigned notExtended = 510;

[[noreturn]] void mismatch(const std::string& reason) {
    throw HttpError(badRequest, "header-mismatch", reason);
}

/** The one value of a field of CIM. Given with and without the prefix, or twice, it could say two things. */
std::optional<std::string> single(const http::RequestHead& head, const std::optional<std::string>& prefix,
                                  const std::string& name) {
    auto values = head.values(name);
    if (prefix) {
        const auto prefixed = head.values(*prefix + name);
        values.insert(values.end(), prefixed.begin(), prefixed.end());
    }
    if (values.size() > 1) {
        mismatch("the field " + name + " is given " + std::to_string(values.size()) + " times");
    }
    return values.empty() ? std::nullopt : std::optional(std::string(trimmed(values[0])));
}

std::string requireDecoded(const http::RequestHead& head, const std::optional<std::string>& prefix,
                           const std::string& name) {
    const auto value = single(head, prefix, name);
    if (!value || value->empty()) {
        mismatch("the field " + name + " is missing");
    }
    auto decoded = percentDecoded(*value);
    if (!decoded) {
        mismatch("the field " + name + " has a % that two hexadecimal digits do not follow");
    }
    return *std::move(decoded);
}

std::string_view withoutSlashes(std::string_view nameSpace) {
    while (nameSpace.starts_with('/')) {
        nameSpace.remove_prefix(1);
    }
    while (nameSpace.ends_with('/')) {
        nameSpace.remove_suffix(1);
    }
    return nameSpace;
}

bool samePaths(const ObjectPath& left, const ObjectPath& right);

std::optional<ObjectPath> readPath(std::string_view text) {
    if (text.starts_with('/') && !text.starts_with("//")) {
        text.remove_prefix(1); // "/root/cimv2:..." is a path without a host
    }
    try {
        return ObjectPath::parse(text);
    } catch (const std::invalid_argument&) {
        return std::nullopt;
    }
}

/** The path that a value is, or that its text tells. */
std::optional<ObjectPath> pathOf(const Value& value) {
    if (const auto* path = std::get_if<std::shared_ptr<const ObjectPath>>(&value.data)) {
        return **path;
    }
    const auto* text = std::get_if<std::string>(&value.data);
    return text == nullptr ? std::nullopt : readPath(*text);
}

std::string plainText(const Value& value) {
    if (const auto* text = std::get_if<std::string>(&value.data)) {
        return *text;
    }
    const auto* moment = std::get_if<DateTime>(&value.data);
    return moment != nullptr ? moment->text : toText(value);
}

/** The texts of a path have no types, elements of XML have some: 1 and "1" are the same here. */
bool sameKeys(const Value& left, const Value& right) {
    using Path = std::shared_ptr<const ObjectPath>;
    if (!std::holds_alternative<Path>(left.data) && !std::holds_alternative<Path>(right.data)) {
        return plainText(left) == plainText(right);
    }
    const auto leftPath = pathOf(left);
    const auto rightPath = pathOf(right);
    return leftPath && rightPath && samePaths(*leftPath, *rightPath);
}

bool samePaths(const ObjectPath& left, const ObjectPath& right) {
    const bool sameNameSpace = left.nameSpace.empty() || right.nameSpace.empty() ||
                               equalNames(withoutSlashes(left.nameSpace), withoutSlashes(right.nameSpace));
    return sameNameSpace && equalNames(left.className, right.className) && left.keys.size() == right.keys.size() &&
           std::all_of(left.keys.begin(), left.keys.end(), [&right](const NamedValue& key) {
               const NamedValue* other = findName(right.keys, key.name);
               return other != nullptr && sameKeys(key.value, other->value);
           });
}

bool sameObjects(const std::string& field, const ObjectPath& path) {
    const auto read = readPath(field);
    return read && samePaths(*read, path);
}

void compareMethods(const CimFields& fields, const std::string& method) {
    if (!equalNames(fields.method, method)) {
        mismatch("the field CIMMethod says " + fields.method + ", the body " + method);
    }
}

[[noreturn]] void differentObject(const CimFields& fields, const std::string& object) {
    mismatch("the field CIMObject says " + fields.object + ", the body " + object);
}

} // namespace

std::optional<std::string> readPrefix(const http::RequestHead& head) {
    if (head.method == "POST") {
        return std::nullopt;
    }
    if (head.method != "M-POST") {
        throw HttpError(methodNotAllowed, "", "operations are called by POST and M-POST, not by " + head.method,
                        {{"Allow", "POST, M-POST, OPTIONS"}});
    }
    for (const std::string_view value : head.values("Man")) {
        for (const std::string_view declaration : split(value, ',')) {
            const auto parts = split(declaration, ';');
            const bool quoted = parts[0].size() > 2 && parts[0].front() == '"' && parts[0].back() == '"';
            const auto uri = quoted ? parts[0].substr(1, parts[0].size() - 2) : parts[0];
            const auto number = std::find_if(parts.begin() + 1, parts.end(),
                                             [](std::string_view part) { return parameter(part, "ns").has_value(); });
            if (equalNames(uri, extensionUri) && number != parts.end()) {
                return std::string(*parameter(*number, "ns")) + "-";
            }
        }
    }
    throw HttpError(notExtended, "",
                    std::string("M-POST needs the extension of the field Man: ") + extensionUri + "; ns=NN");
}

CimFields readCimFields(const http::RequestHead& head, std::optional<std::string> prefix) {
    if (single(head, prefix, "CIMBatch")) {
        throw HttpError(notImplemented, "multiple-requests-unsupported",
                        "one request at a time, please: no CIMBatch");
    }
    const auto operation = single(head, prefix, "CIMOperation");
    if (!operation || !equalNames(*operation, "MethodCall")) {
        throw HttpError(badRequest, "unsupported-operation",
                        operation ? "CIMOperation is MethodCall, not " + *operation
                                  : "the field CIMOperation: MethodCall is missing");
    }
    const auto version = single(head, prefix, "CIMProtocolVersion");
    if (version && !version->starts_with("1.")) {
        throw HttpError(badRequest, "unsupported-protocol-version", "CIMProtocolVersion is 1.x, not " + *version);
    }
    CimFields fields;
    fields.method = requireDecoded(head, prefix, "CIMMethod");
    fields.object = requireDecoded(head, prefix, "CIMObject");
    fields.prefix = std::move(prefix);
    return fields;
}

void compareWithBody(const CimFields& fields, const cimxml::Message& message) {
    if (std::holds_alternative<cimxml::ExportCall>(message.call)) {
        throw HttpError(badRequest, "unsupported-operation", "no indications are received here");
    }
    if (const auto* intrinsic = std::get_if<cimxml::IntrinsicCall>(&message.call)) {
        compareMethods(fields, intrinsic->method);
        if (!equalNames(withoutSlashes(fields.object), withoutSlashes(intrinsic->nameSpace))) {
            differentObject(fields, intrinsic->nameSpace);
        }
        return;
    }
    const auto& extrinsic = std::get<cimxml::ExtrinsicCall>(message.call);
    compareMethods(fields, extrinsic.method);
    if (!sameObjects(fields.object, extrinsic.path)) {
        differentObject(fields, extrinsic.path.toString());
    }
}

} // namespace marlo::wbem
