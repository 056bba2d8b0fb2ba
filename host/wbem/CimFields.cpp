#include "host/wbem/CimFields.h"

#include "host/wbem/HttpError.h"

#include <algorithm>
#include <cctype>
#include <cstdlib>
#include <memory>
#include <stdexcept>
#include <vector>

namespace marlo::wbem {

namespace {

constexpr unsigned badRequest = 400;
constexpr unsigned methodNotAllowed = 405;
constexpr unsigned notAcceptable = 406;
constexpr unsigned unsupportedMediaType = 415;
constexpr unsigned notImplemented = 501;
constexpr unsigned notExtended = 510;

[[noreturn]] void mismatch(const std::string& reason) {
    throw HttpError(badRequest, "header-mismatch", reason);
}

std::string_view trimmed(std::string_view text) {
    const auto first = text.find_first_not_of(" \t");
    if (first == std::string_view::npos) {
        return {};
    }
    return text.substr(first, text.find_last_not_of(" \t") - first + 1);
}

/** The parts between a separator, trimmed; one within double quotes separates nothing. */
std::vector<std::string_view> split(std::string_view text, char separator) {
    std::vector<std::string_view> parts;
    std::size_t begin = 0;
    bool quoted = false;
    for (std::size_t i = 0; i <= text.size(); ++i) {
        if (i == text.size() || (text[i] == separator && !quoted)) {
            parts.push_back(trimmed(text.substr(begin, i - begin)));
            begin = i + 1;
        } else if (text[i] == '"') {
            quoted = !quoted;
        }
    }
    return parts;
}

/** The value of `name=value` or `name="value"`; nothing where the part is of another name. */
std::optional<std::string_view> parameter(std::string_view part, std::string_view name) {
    const auto equals = part.find('=');
    if (equals == std::string_view::npos || !equalNames(trimmed(part.substr(0, equals)), name)) {
        return std::nullopt;
    }
    std::string_view value = trimmed(part.substr(equals + 1));
    if (value.size() >= 2 && value.front() == '"' && value.back() == '"') {
        value = value.substr(1, value.size() - 2);
    }
    return value;
}

/** The quality among the parameters of a choice: how much it is liked, 0 rules it out. */
double qualityOf(const std::vector<std::string_view>& parts) {
    for (std::size_t i = 1; i < parts.size(); ++i) {
        if (const auto quality = parameter(parts[i], "q")) {
            return std::strtod(std::string(*quality).c_str(), nullptr);
        }
    }
    return 1;
}

/** How closely a choice, such as text/xml, text/<any> or <any>/<any>, names an offer: 0 where it does not. */
int closeness(std::string_view choice, std::string_view offer) {
    if (equalNames(choice, offer)) {
        return 3;
    }
    const auto slash = offer.find('/');
    if (slash != std::string_view::npos && choice.ends_with("/*") &&
        equalNames(choice.substr(0, choice.size() - 2), offer.substr(0, slash))) {
        return 2;
    }
    return choice == "*/*" || choice == "*" ? 1 : 0;
}

/**
 * How much a client likes an offer (RFC 9110 12.5.1): what the choice says that names it most closely. One without
 * the field, or with an empty one, takes anything.
 */
double likingOf(const http::RequestHead& head, std::string_view field, std::string_view offer) {
    int closest = 0;
    double liking = 0;
    bool anything = true;
    for (const std::string_view value : head.values(field)) {
        for (const std::string_view choice : split(value, ',')) {
            const auto parts = split(choice, ';');
            const int close = closeness(parts[0], offer);
            anything = anything && parts[0].empty();
            if (close > closest) {
                closest = close;
                liking = qualityOf(parts);
            }
        }
    }
    return anything ? 1 : liking;
}

bool isUtf8Xml(std::string_view contentType) {
    const auto parts = split(contentType, ';');
    if (!equalNames(parts[0], "application/xml") && !equalNames(parts[0], "text/xml")) {
        return false;
    }
    return std::all_of(parts.begin() + 1, parts.end(), [](std::string_view part) {
        const auto charset = parameter(part, "charset");
        return !charset || equalNames(*charset, "utf-8");
    });
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

int hexDigit(char digit) {
    if (digit >= '0' && digit <= '9') {
        return digit - '0';
    }
    const int lower = std::tolower(static_cast<unsigned char>(digit));
    return lower >= 'a' && lower <= 'f' ? lower - 'a' + 10 : -1;
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

} // namespace

std::optional<std::string> percentDecoded(std::string_view text) {
    std::string decoded;
    for (std::size_t i = 0; i < text.size(); ++i) {
        if (text[i] != '%') {
            decoded += text[i];
            continue;
        }
        const int high = i + 2 < text.size() ? hexDigit(text[i + 1]) : -1;
        const int low = high >= 0 ? hexDigit(text[i + 2]) : -1;
        if (low < 0) {
            return std::nullopt;
        }
        decoded += static_cast<char>(high * 16 + low);
        i += 2;
    }
    return decoded;
}

std::string percentEncoded(std::string_view text) {
    constexpr std::string_view digits = "0123456789ABCDEF";
    std::string encoded;
    for (const char character : text) {
        const auto byte = static_cast<unsigned char>(character);
        if (byte >= ' ' && byte < 0x7F && character != '%') {
            encoded += character;
        } else {
            encoded += {'%', digits[byte >> 4U], digits[byte & 0xFU]};
        }
    }
    return encoded;
}

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

std::string checkContent(const http::RequestHead& head) {
    const auto types = head.values("Content-Type");
    if (types.size() > 1 || (types.size() == 1 && !isUtf8Xml(types[0]))) {
        throw HttpError(unsupportedMediaType, "", "requests are application/xml or text/xml in UTF-8");
    }
    const double application = likingOf(head, "Accept", "application/xml");
    const double text = likingOf(head, "Accept", "text/xml");
    if (std::max(application, text) <= 0 || likingOf(head, "Accept-Charset", "utf-8") <= 0) {
        throw HttpError(notAcceptable, "", "answers are application/xml or text/xml in UTF-8");
    }
    return text > application ? "text/xml" : "application/xml";
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
        throw HttpError(notImplemented, "unsupported-protocol-version", "CIMProtocolVersion is 1.x, not " + *version);
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
    const auto* intrinsic = std::get_if<cimxml::IntrinsicCall>(&message.call);
    const auto* extrinsic = std::get_if<cimxml::ExtrinsicCall>(&message.call);
    const std::string& method = intrinsic != nullptr ? intrinsic->method : extrinsic->method;
    if (!equalNames(fields.method, method)) {
        mismatch("the field CIMMethod says " + fields.method + ", the body " + method);
    }
    const bool same = intrinsic != nullptr
                          ? equalNames(withoutSlashes(fields.object), withoutSlashes(intrinsic->nameSpace))
                          : sameObjects(fields.object, extrinsic->path);
    if (!same) {
        mismatch("the field CIMObject says " + fields.object + ", the body " +
                 (intrinsic != nullptr ? intrinsic->nameSpace : extrinsic->path.toString()));
    }
}

} // namespace marlo::wbem
