#include "tests/cimxml/Validity.h"

#include <memory>
#include <stdexcept>

#include <libxml/parser.h>
#include <libxml/tree.h>
#include <libxml/valid.h>

namespace marlo::test {

namespace {

struct Free {
    void operator()(xmlDoc* document) const { xmlFreeDoc(document); }

    void operator()(xmlDtd* dtd) const { xmlFreeDtd(dtd); }

    void operator()(xmlParserCtxt* context) const { xmlFreeParserCtxt(context); }

    void operator()(xmlValidCtxt* context) const { xmlFreeValidCtxt(context); }

    void operator()(xmlChar* text) const { xmlFree(text); }
};

template <typename T>
using Owned = std::unique_ptr<T, Free>;

const char* chars(const xmlChar* text) {
    return reinterpret_cast<const char*>(text); // NOLINT: libxml2's bytes of UTF-8
}

const xmlChar* xmlChars(const char* text) {
    return reinterpret_cast<const xmlChar*>(text); // NOLINT: as above
}

/** Null with a reason where it is not well-formed. */
Owned<xmlDoc> parse(const std::string& document, std::string& reason) {
    const Owned<xmlParserCtxt> context(xmlNewParserCtxt());
    Owned<xmlDoc> tree(xmlCtxtReadMemory(context.get(), document.data(), static_cast<int>(document.size()), nullptr,
                                         nullptr, XML_PARSE_NOERROR | XML_PARSE_NOWARNING));
    if (!tree) {
        const xmlError* error = xmlCtxtGetLastError(context.get());
        reason = std::string("not well-formed: ") + (error == nullptr ? "?" : error->message);
    }
    return tree;
}

void note(void* reason, xmlErrorPtr error) {
    *static_cast<std::string*>(reason) += error->message;
}

const xmlNode* find(const xmlNode* node, const std::string& element) {
    for (; node != nullptr; node = node->next) {
        if (node->type == XML_ELEMENT_NODE && chars(node->name) == element) {
            return node;
        }
        if (const xmlNode* found = find(node->children, element)) {
            return found;
        }
    }
    return nullptr;
}

const xmlNode* require(const xmlDoc* tree, const std::string& element) {
    const xmlNode* found = tree == nullptr ? nullptr : find(xmlDocGetRootElement(tree), element);
    if (found == nullptr) {
        throw std::runtime_error("no element " + element);
    }
    return found;
}

} // namespace

std::string invalidity(const std::string& document) {
    std::string reason;
    const Owned<xmlDoc> tree = parse(document, reason);
    if (!tree) {
        return reason;
    }
    const Owned<xmlDtd> dtd(xmlParseDTD(nullptr, xmlChars(MARLO_CIM_DTD)));
    if (!dtd) {
        return "cim.dtd is not read";
    }
    const Owned<xmlValidCtxt> context(xmlNewValidCtxt());
    xmlSetStructuredErrorFunc(&reason, note);
    const int valid = xmlValidateDtd(context.get(), tree.get(), dtd.get());
    xmlSetStructuredErrorFunc(nullptr, nullptr);
    return valid == 1 ? "" : "not valid: " + reason;
}

std::string textOf(const std::string& document, const std::string& element) {
    std::string reason;
    const Owned<xmlDoc> tree = parse(document, reason);
    const Owned<xmlChar> text(xmlNodeGetContent(require(tree.get(), element)));
    return chars(text.get());
}

std::string attributeOf(const std::string& document, const std::string& element, const std::string& attribute) {
    std::string reason;
    const Owned<xmlDoc> tree = parse(document, reason);
    const Owned<xmlChar> text(xmlGetProp(require(tree.get(), element), xmlChars(attribute.c_str())));
    if (!text) {
        throw std::runtime_error("no attribute " + attribute);
    }
    return chars(text.get());
}

} // namespace marlo::test
