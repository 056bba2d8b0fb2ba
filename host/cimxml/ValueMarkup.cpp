#include "host/cimxml/ValueMarkup.h"

#include "host/cimxml/Escape.h"
#include "host/cimxml/ObjectMarkup.h"
#include "host/schema/Utf8.h"

#include <array>
#include <charconv>
#include <cmath>

namespace marlo::cimxml {

namespace {

template <typename Number>
void appendNumber(std::string& out, Number number) {
    std::array<char, 32> digits{};
    const auto result = std::to_chars(digits.data(), digits.data() + digits.size(), number);
    out.append(digits.data(), result.ptr);
}

/** The shortest digits that give the number back; DSP0201 wants a point among them. */
template <typename Real>
void appendReal(std::string& out, Real number) {
    if (!std::isfinite(number)) {
        out += std::isnan(number) ? "NaN" : number > 0 ? "INF" : "-INF";
        return;
    }
    std::string digits;
    appendNumber(digits, number);
    if (digits.find('.') == std::string::npos) {
        digits.insert(std::min(digits.find('e'), digits.size()), ".0");
    }
    out += digits;
}

/** The text of each kind of value. */
struct TextMarkup {
    std::string& out;
    CMPIType type;

    void operator()(std::monostate) const {}

    void operator()(bool truth) const { out += truth ? "TRUE" : "FALSE"; }

    void operator()(char16_t unit) const {
        std::string character;
        appendUtf8(character, unit);
        appendText(out, character);
    }

    void operator()(std::uint64_t number) const { appendNumber(out, number); }

    void operator()(std::int64_t number) const { appendNumber(out, number); }

    void operator()(double number) const {
        if ((type & ~CMPI_ARRAY) == CMPI_real32) {
            appendReal(out, static_cast<float>(number));
        } else {
            appendReal(out, number);
        }
    }

    void operator()(const std::string& text) const { appendText(out, text); }

    void operator()(const DateTime& moment) const { appendText(out, moment.text); }

    void operator()(const std::shared_ptr<const ObjectPath>& path) const {
        if (path) {
            appendText(out, path->toString());
        }
    }

    void operator()(const std::shared_ptr<const Instance>& instance) const {
        if (instance) {
            std::string document;
            appendInstance(document, *instance);
            appendText(out, document);
        }
    }

    void operator()(const Value::Array& /*elements*/) const {}
};

void appendNameSpace(std::string& out, std::string_view nameSpace) {
    out += "<LOCALNAMESPACEPATH>";
    while (!nameSpace.empty()) {
        const std::string_view part = nameSpace.substr(0, nameSpace.find('/'));
        nameSpace.remove_prefix(std::min(part.size() + 1, nameSpace.size()));
        out += "<NAMESPACE";
        appendAttribute(out, "NAME", part);
        out += "/>";
    }
    out += "</LOCALNAMESPACEPATH>";
}

void appendLocation(std::string& out, const std::string& host, const std::string& nameSpace) {
    out += "<NAMESPACEPATH><HOST>";
    appendText(out, host);
    out += "</HOST>";
    appendNameSpace(out, nameSpace);
    out += "</NAMESPACEPATH>";
}

/** A path as far as it is given: a class where there are no keys. */
void appendReference(std::string& out, const ObjectPath& path) {
    const bool isLocal = path.host.empty();
    out += "<VALUE.REFERENCE>";
    if (!path.keys.empty()) {
        appendPath(out, path,
                   path.nameSpace.empty() ? PathWrap::name
                   : isLocal              ? PathWrap::local
                                          : PathWrap::path,
                   path.host);
    } else if (path.nameSpace.empty()) {
        appendClassName(out, path.className);
    } else if (isLocal) {
        out += "<LOCALCLASSPATH>";
        appendNameSpace(out, path.nameSpace);
        appendClassName(out, path.className);
        out += "</LOCALCLASSPATH>";
    } else {
        appendClassPath(out, path.host, path.nameSpace, path.className);
    }
    out += "</VALUE.REFERENCE>";
}

const ObjectPath* referenceIn(const Value& value) {
    const auto* path = std::get_if<std::shared_ptr<const ObjectPath>>(&value.data);
    return path == nullptr ? nullptr : path->get();
}

void appendScalar(std::string& out, const Value& value) {
    if (const ObjectPath* path = referenceIn(value)) {
        appendReference(out, *path);
        return;
    }
    out += "<VALUE>";
    appendValueText(out, value);
    out += "</VALUE>";
}

void appendKey(std::string& out, const Value& value) {
    if (const ObjectPath* path = referenceIn(value)) {
        appendReference(out, *path);
        return;
    }
    const bool isBoolean = value.type == CMPI_boolean;
    const bool isNumber = (value.type & CMPI_ENC) == 0 && (value.type & (CMPI_INTEGER | CMPI_REAL)) != 0;
    out += isBoolean  ? "<KEYVALUE VALUETYPE=\"boolean\""
           : isNumber ? "<KEYVALUE VALUETYPE=\"numeric\""
                      : "<KEYVALUE VALUETYPE=\"string\"";
    appendAttribute(out, "TYPE", typeAttribute(value.type));
    out += '>';
    appendValueText(out, value);
    out += "</KEYVALUE>";
}

void appendInstanceName(std::string& out, const ObjectPath& path) {
    out += "<INSTANCENAME";
    appendAttribute(out, "CLASSNAME", path.className);
    out += '>';
    for (const NamedValue& key : path.keys) {
        out += "<KEYBINDING";
        appendAttribute(out, "NAME", key.name);
        out += '>';
        appendKey(out, key.value);
        out += "</KEYBINDING>";
    }
    out += "</INSTANCENAME>";
}

/**
 * An element of an array. VALUE.NULL came with version 2.2 of the representation, and answers are of version 2.0,
 * whose clients may know no such element and give up on the whole answer: a text that is NULL goes out empty. For
 * other types there is no other way to say it.
 */
void appendElement(std::string& out, const Value& element) {
    if (!element.isNull()) {
        appendScalar(out, element);
    } else if (element.type == CMPI_string) {
        out += "<VALUE></VALUE>";
    } else {
        out += "<VALUE.NULL/>";
    }
}

} // namespace

void appendValueText(std::string& out, const Value& value) {
    std::visit(TextMarkup{out, value.type}, value.data);
}

void appendValue(std::string& out, const Value& value) {
    const auto* elements = std::get_if<Value::Array>(&value.data);
    if (elements == nullptr) {
        if (!value.isNull()) {
            appendScalar(out, value);
        }
        return;
    }
    const bool areReferences = (value.type & ~CMPI_ARRAY) == CMPI_ref;
    out += areReferences ? "<VALUE.REFARRAY>" : "<VALUE.ARRAY>";
    for (const Value& element : *elements) {
        appendElement(out, element);
    }
    out += areReferences ? "</VALUE.REFARRAY>" : "</VALUE.ARRAY>";
}

void appendClassName(std::string& out, const std::string& name) {
    out += "<CLASSNAME";
    appendAttribute(out, "NAME", name);
    out += "/>";
}

void appendPath(std::string& out, const ObjectPath& path, PathWrap wrap, const std::string& host) {
    switch (wrap) {
    case PathWrap::name:
        appendInstanceName(out, path);
        break;
    case PathWrap::local:
        out += "<LOCALINSTANCEPATH>";
        appendNameSpace(out, path.nameSpace);
        appendInstanceName(out, path);
        out += "</LOCALINSTANCEPATH>";
        break;
    case PathWrap::path:
        out += "<INSTANCEPATH>";
        appendLocation(out, host, path.nameSpace);
        appendInstanceName(out, path);
        out += "</INSTANCEPATH>";
        break;
    case PathWrap::object:
        out += "<OBJECTPATH>";
        appendPath(out, path, PathWrap::path, host);
        out += "</OBJECTPATH>";
        break;
    }
}

void appendClassPath(std::string& out, const std::string& host, const std::string& nameSpace,
                     const std::string& name) {
    out += "<CLASSPATH>";
    appendLocation(out, host, nameSpace);
    appendClassName(out, name);
    out += "</CLASSPATH>";
}

std::string typeAttribute(CMPIType type) {
    const auto plain = static_cast<CMPIType>(type & ~CMPI_ARRAY);
    const std::string name = plain == CMPI_instance ? "string" : typeName(plain);
    return name.empty() ? "string" : name;
}

} // namespace marlo::cimxml
