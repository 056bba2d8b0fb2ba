#include "host/cimxml/ObjectReader.h"

#include "host/cimxml/PathReader.h"
#include "host/cimxml/TypedText.h"

namespace marlo::cimxml {

namespace {

using Kind = MessageError::Kind;

CMPIType arrayOf(CMPIType type) {
    return static_cast<CMPIType>(type | CMPI_ARRAY);
}

Value readReference(const std::optional<Node>& node, const Limits& limits) {
    return node ? Value{CMPI_ref, std::make_shared<const ObjectPath>(readPath(node->onlyChild(), limits))}
                : Value::null(CMPI_ref);
}

NamedValue readProperty(const Node& node, const Within& within) {
    const std::string name = node.require("NAME");
    if (node.is("PROPERTY.REFERENCE")) {
        return {name, readReference(findValue(node, "VALUE.REFERENCE"), within.limits)};
    }
    const bool isArray = node.is("PROPERTY.ARRAY");
    if (!isArray && !node.is("PROPERTY")) {
        node.failMisplaced();
    }
    const CMPIType type = isEmbedded(node) ? CMPI_instance : readType(node);
    const auto value = findValue(node, isArray ? "VALUE.ARRAY" : "VALUE");
    if (!value) {
        return {name, Value::null(isArray ? arrayOf(type) : type)};
    }
    return {name, type == CMPI_instance ? readEmbeddedValue(*value, within) : readTyped(*value, type)};
}

} // namespace

Instance readInstance(const Node& node, const Within& within) {
    if (!node.is("INSTANCE")) {
        node.failMisplaced();
    }
    Instance instance;
    instance.path.className = node.require("CLASSNAME");
    for (const Node& child : node.children()) {
        if (!child.is("QUALIFIER")) {
            node.requireAtMost(instance.properties.size() + 1, within.limits.properties, "properties");
            instance.properties.push_back(readProperty(child, within));
        }
    }
    return instance;
}

Instance readNamedInstance(const Node& node, const Within& within) {
    const auto children = node.children();
    if (children.size() != 2 || !children[0].is("INSTANCENAME")) {
        node.fail("VALUE.NAMEDINSTANCE holds INSTANCENAME and INSTANCE");
    }
    ObjectPath path = readInstanceName(children[0], within.limits);
    Instance instance = readInstance(children[1], within);
    if (!equalNames(path.className, instance.path.className)) {
        node.fail("the name of an instance of " + path.className + " with an instance of " + instance.path.className);
    }
    instance.path = std::move(path);
    return instance;
}

std::shared_ptr<const Instance> readEmbedded(std::string_view text, const Within& within) {
    if (within.embedded == within.limits.embedded) {
        throw MessageError(Kind::notValid, "more than " + std::to_string(within.limits.embedded) +
                                               " embedded objects within each other");
    }
    const Document document = Document::read(text, within.limits);
    return std::make_shared<const Instance>(readInstance(document.root(), {within.limits, within.embedded + 1}));
}

Value readEmbeddedValue(const Node& node, const Within& within) {
    const auto read = [&](std::string_view text) {
        try {
            return Value{CMPI_instance, readEmbedded(text, within)};
        } catch (const MessageError& error) {
            node.fail(std::string("embedded object: ") + error.what(), Kind::notLooselyValid);
        }
    };
    if (node.is("VALUE")) {
        return read(node.text());
    }
    Value::Array elements;
    for (const auto& text : readTexts(node)) {
        elements.push_back(text ? read(*text) : Value::null(CMPI_instance));
    }
    return {arrayOf(CMPI_instance), std::move(elements)};
}

std::vector<std::optional<std::string>> readTexts(const Node& node) {
    std::vector<std::optional<std::string>> texts;
    for (const Node& element : node.children()) {
        if (element.is("VALUE")) {
            texts.emplace_back(element.text());
        } else if (element.is("VALUE.NULL")) {
            texts.emplace_back();
        } else {
            element.failMisplaced();
        }
    }
    return texts;
}

Value readTyped(const Node& node, CMPIType type) {
    if (node.is("VALUE")) {
        return readOrKeep(std::string(node.text()), type);
    }
    Value::Array elements;
    for (const auto& text : readTexts(node)) {
        elements.push_back(text ? readOrKeep(*text, type) : Value::null(type));
    }
    return {arrayOf(type), std::move(elements)};
}

bool isEmbedded(const Node& node) {
    const auto embedded = node.attribute("EmbeddedObject");
    return embedded && !embedded->empty();
}

std::optional<Node> findValue(const Node& node, std::string_view element) {
    std::optional<Node> found;
    for (const Node& child : node.children()) {
        if (child.is("QUALIFIER") && !found) {
            continue;
        }
        if (found || !child.is(element)) {
            child.failMisplaced();
        }
        found = child;
    }
    return found;
}

} // namespace marlo::cimxml
