#include "host/cimxml/PathReader.h"

#include "host/cimxml/TypedText.h"

#include <algorithm>

namespace marlo::cimxml {

namespace {

/** An integer of either sign, else a real; what is none stays a text, for the schema to refuse. */
Value readNumber(const std::string& text) {
    for (const CMPIType type : {CMPI_uint64, CMPI_sint64, CMPI_real64}) {
        if (auto value = readValue(text, type)) {
            return *std::move(value);
        }
    }
    return Value::string(text);
}

Value readKeyValue(const Node& node) {
    const std::string text(node.text());
    if (node.attribute("TYPE")) {
        return readOrKeep(text, readType(node));
    }
    const auto kind = node.attribute("VALUETYPE").value_or("string");
    if (kind == "numeric") {
        return readNumber(text);
    }
    if (kind != "string" && kind != "boolean") {
        node.fail("VALUETYPE is string, boolean or numeric");
    }
    return kind == "string" ? Value::string(text) : readOrKeep(text, CMPI_boolean);
}

Value readKey(const Node& node, const Limits& limits) {
    if (node.is("KEYVALUE")) {
        return readKeyValue(node);
    }
    if (!node.is("VALUE.REFERENCE")) {
        node.failMisplaced();
    }
    return {CMPI_ref, std::make_shared<const ObjectPath>(readPath(node.onlyChild(), limits))};
}

/** The words between slashes: clients write more of these than they should, and whole names into one element. */
std::vector<std::string_view> wordsOf(std::string_view text) {
    std::vector<std::string_view> words;
    while (!text.empty()) {
        const std::string_view word = text.substr(0, text.find('/'));
        text.remove_prefix(std::min(word.size() + 1, text.size()));
        if (!word.empty()) {
            words.push_back(word);
        }
    }
    return words;
}

/** The name behind a namespace: the second of two children. */
struct Located {
    std::string host;
    std::string nameSpace;
    Node name;
};

Located readLocated(const Node& node, const char* nameSpaceElement, const char* nameElement) {
    const auto children = node.children();
    if (children.size() != 2 || !children[0].is(nameSpaceElement) || !children[1].is(nameElement)) {
        node.fail(std::string(node.name()) + " holds " + nameSpaceElement + " and " + nameElement);
    }
    if (!children[0].is("NAMESPACEPATH")) {
        return {"", readNameSpace(children[0]), children[1]};
    }
    const auto parts = children[0].children();
    if (parts.size() != 2 || !parts[0].is("HOST") || !parts[1].is("LOCALNAMESPACEPATH")) {
        children[0].fail("NAMESPACEPATH holds HOST and LOCALNAMESPACEPATH");
    }
    return {std::string(parts[0].text()), readNameSpace(parts[1]), children[1]};
}

} // namespace

std::string readNameSpace(const Node& node) {
    std::string name;
    for (const Node& part : node.children()) {
        if (!part.is("NAMESPACE")) {
            part.failMisplaced();
        }
        const std::string given = part.require("NAME");
        for (const std::string_view word : wordsOf(given)) {
            name += name.empty() ? "" : "/";
            name += word;
        }
    }
    if (name.empty()) {
        node.fail("a namespace without a name");
    }
    return name;
}

ObjectPath readInstanceName(const Node& node, const Limits& limits) {
    ObjectPath path;
    path.className = node.require("CLASSNAME");
    const auto children = node.children();
    node.requireAtMost(children.size(), limits.keys, "keys");
    for (const Node& child : children) {
        if (child.is("KEYBINDING")) {
            path.keys.push_back({child.require("NAME"), readKey(child.onlyChild(), limits)});
        } else if (children.size() == 1) {
            path.keys.push_back({"", readKey(child, limits)});
        } else {
            child.failMisplaced();
        }
    }
    return path;
}

ObjectPath readPath(const Node& node, const Limits& limits) {
    if (node.is("INSTANCENAME")) {
        return readInstanceName(node, limits);
    }
    if (node.is("CLASSNAME")) {
        return {"", "", node.require("NAME"), {}};
    }
    const bool isLocal = node.is("LOCALINSTANCEPATH") || node.is("LOCALCLASSPATH");
    const bool isClass = node.is("CLASSPATH") || node.is("LOCALCLASSPATH");
    if (!isLocal && !isClass && !node.is("INSTANCEPATH")) {
        node.failMisplaced();
    }
    const Located located =
        readLocated(node, isLocal ? "LOCALNAMESPACEPATH" : "NAMESPACEPATH", isClass ? "CLASSNAME" : "INSTANCENAME");
    ObjectPath path = readPath(located.name, limits);
    path.host = located.host;
    path.nameSpace = located.nameSpace;
    return path;
}

} // namespace marlo::cimxml
