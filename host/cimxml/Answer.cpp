#include "host/cimxml/Answer.h"

#include "host/cimxml/Document.h"
#include "host/cimxml/ObjectReader.h"
#include "host/cimxml/PathReader.h"

#include <cstdlib>

namespace marlo::cimxml {

namespace {

/** The child of a node, which must be this element. */
Node descend(const Node& node, std::string_view element) {
    const Node child = node.onlyChild();
    if (!child.is(element)) {
        child.failMisplaced();
    }
    return child;
}

void readReturned(const Node& node, const Limits& limits, IntrinsicAnswer& answer) {
    for (const Node& each : node.children()) {
        if (each.is("VALUE.NAMEDINSTANCE")) {
            answer.instances.push_back(readNamedInstance(each, {limits}));
        } else {
            answer.paths.push_back(readInstanceName(each, limits));
        }
    }
}

} // namespace

IntrinsicAnswer readIntrinsicAnswer(std::string_view text, const Limits& limits) {
    const Document document = Document::read(text, limits);
    const Node root = document.root();
    if (!root.is("CIM")) {
        root.failMisplaced();
    }
    IntrinsicAnswer answer;
    const Node response = descend(descend(descend(root, "MESSAGE"), "SIMPLERSP"), "IMETHODRESPONSE");
    for (const Node& part : response.children()) {
        if (part.is("ERROR")) {
            answer.code = static_cast<unsigned>(std::strtoul(part.require("CODE").c_str(), nullptr, 10));
            answer.description = part.attribute("DESCRIPTION").value_or("");
        } else if (part.is("IRETURNVALUE")) {
            readReturned(part, limits, answer);
        } else {
            part.failMisplaced();
        }
    }
    return answer;
}

} // namespace marlo::cimxml
