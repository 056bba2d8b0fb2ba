#include "host/cimxml/ClassReader.h"
#include "host/cimxml/ObjectReader.h"
#include "host/cimxml/PathReader.h"

namespace marlo::cimxml {

namespace {

using Kind = MessageError::Kind;

void requireVersion(const Node& node, std::string_view attribute, std::string_view major, Kind kind) {
    const std::string version = node.require(attribute);
    if (!version.starts_with(major)) {
        node.fail(std::string(attribute) + " is '" + version + "', not " + std::string(major) + "x", kind);
    }
}

Argument readTextArgument(const Node& node) {
    if (node.is("VALUE")) {
        return Untyped{std::string(node.text())};
    }
    UntypedArray elements;
    for (auto& text : readTexts(node)) {
        elements.push_back(text ? std::optional(Untyped{*std::move(text)}) : std::nullopt);
    }
    return elements;
}

Value readReferences(const Node& node, const Limits& limits) {
    Value::Array elements;
    for (const Node& element : node.children()) {
        if (element.is("VALUE.REFERENCE")) {
            elements.push_back({CMPI_ref, std::make_shared<const ObjectPath>(readPath(element.onlyChild(), limits))});
        } else if (element.is("VALUE.NULL")) {
            elements.push_back(Value::null(CMPI_ref));
        } else {
            element.failMisplaced();
        }
    }
    return {CMPI_refA, std::move(elements)};
}

Argument readObjectArgument(const Node& node, const Limits& limits) {
    if (node.is("VALUE.REFERENCE")) {
        return readPath(node.onlyChild(), limits);
    }
    if (node.is("VALUE.REFARRAY")) {
        return readReferences(node, limits);
    }
    if (node.is("CLASSNAME")) {
        return ClassName{node.require("NAME")};
    }
    if (node.is("INSTANCE")) {
        return readInstance(node, {limits});
    }
    if (node.is("VALUE.NAMEDINSTANCE")) {
        return readNamedInstance(node, {limits});
    }
    if (node.is("CLASS")) {
        return readClass(node, {limits});
    }
    if (node.is("QUALIFIER.DECLARATION")) {
        return readQualifierType(node);
    }
    return readPath(node, limits);
}

NamedArgument readNamedArgument(const Node& node, std::string_view element, const Limits& limits) {
    if (!node.is(element)) {
        node.failMisplaced();
    }
    NamedArgument argument{node.require("NAME"), {}};
    if (node.children().empty()) {
        return argument;
    }
    const Node value = node.onlyChild();
    if (!value.is("VALUE") && !value.is("VALUE.ARRAY")) {
        argument.value = readObjectArgument(value, limits);
    } else if (isEmbedded(node)) {
        argument.value = readEmbeddedValue(value, {limits});
    } else {
        argument.value = readTextArgument(value);
    }
    return argument;
}

/** The arguments among the children of a call, behind the first so many. */
std::vector<NamedArgument> readArguments(const std::vector<Node>& children, std::size_t behind, const char* element,
                                         const Limits& limits) {
    std::vector<NamedArgument> arguments;
    for (std::size_t i = behind; i < children.size(); ++i) {
        arguments.push_back(readNamedArgument(children[i], element, limits));
    }
    return arguments;
}

IntrinsicCall readIntrinsicCall(const Node& node, const Limits& limits) {
    const auto children = node.children();
    if (children.empty() || !children[0].is("LOCALNAMESPACEPATH")) {
        node.fail("IMETHODCALL without LOCALNAMESPACEPATH");
    }
    return {node.require("NAME"), readNameSpace(children[0]), readArguments(children, 1, "IPARAMVALUE", limits)};
}

ExtrinsicCall readExtrinsicCall(const Node& node, const Limits& limits) {
    const auto children = node.children();
    if (children.empty() || (!children[0].is("LOCALINSTANCEPATH") && !children[0].is("LOCALCLASSPATH"))) {
        node.fail("METHODCALL without LOCALINSTANCEPATH or LOCALCLASSPATH");
    }
    return {node.require("NAME"), readPath(children[0], limits), readArguments(children, 1, "PARAMVALUE", limits)};
}

decltype(Message::call) readCall(const Node& node, const Limits& limits) {
    if (node.is("IMETHODCALL")) {
        return readIntrinsicCall(node, limits);
    }
    if (node.is("METHODCALL")) {
        return readExtrinsicCall(node, limits);
    }
    if (node.is("EXPMETHODCALL")) {
        return ExportCall{node.require("NAME"), readArguments(node.children(), 0, "EXPPARAMVALUE", limits)};
    }
    node.failMisplaced();
}

/** The call of a SIMPLEREQ or SIMPLEEXPREQ; correlators (DSP0201 2.4) are for logs of both sides, and overlooked. */
Node requireCall(const Node& message) {
    const Node request = message.onlyChild();
    if (request.is("MULTIREQ") || request.is("MULTIEXPREQ")) {
        request.fail("several requests in a message", Kind::multipleRequestsUnsupported);
    }
    if (!request.is("SIMPLEREQ") && !request.is("SIMPLEEXPREQ")) {
        request.fail(std::string(request.name()) + " is no request");
    }
    std::optional<Node> call;
    for (const Node& child : request.children()) {
        if (call || child.is("EXPMETHODCALL") != request.is("SIMPLEEXPREQ")) {
            child.failMisplaced();
        }
        if (!child.is("CORRELATOR")) {
            call = child;
        }
    }
    if (!call) {
        request.fail(std::string(request.name()) + " without a call");
    }
    return *call;
}

} // namespace

Message readMessage(std::string_view text, const Limits& limits) {
    const Document document = Document::read(text, limits);
    const Node root = document.root();
    if (!root.is("CIM")) {
        root.failMisplaced();
    }
    requireVersion(root, "CIMVERSION", "2.", Kind::unsupportedCimVersion);
    requireVersion(root, "DTDVERSION", "2.", Kind::unsupportedDtdVersion);
    const Node node = root.onlyChild();
    if (!node.is("MESSAGE")) {
        node.fail(std::string(node.name()) + " is no message");
    }
    requireVersion(node, "PROTOCOLVERSION", "1.", Kind::unsupportedProtocolVersion);
    return {node.require("ID"), node.require("PROTOCOLVERSION"), readCall(requireCall(node), limits)};
}

} // namespace marlo::cimxml
