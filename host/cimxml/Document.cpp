#include "host/cimxml/Document.h"

#include "host/cimxml/Names.h"
#include "host/cimxml/Scan.h"

#include <memory>

#include <libxml/parser.h>
#include <libxml/parserInternals.h>

namespace marlo::cimxml {

namespace {

using Kind = MessageError::Kind;

constexpr std::string_view byteOrderMark = "\xEF\xBB\xBF";

std::string_view viewOf(const xmlChar* text) {
    return reinterpret_cast<const char*>(text); // NOLINT: libxml2's bytes of UTF-8
}

std::string_view viewOf(const xmlChar* begin, const xmlChar* end) {
    return {reinterpret_cast<const char*>(begin), static_cast<std::size_t>(end - begin)}; // NOLINT: as above
}

struct FreeContext {
    void operator()(xmlParserCtxt* context) const { xmlFreeParserCtxt(context); }
};

using Context = std::unique_ptr<xmlParserCtxt, FreeContext>;

} // namespace

/** Receives the parser's events (SAX2). No exception crosses the parser: the first one waits until it has returned.
 */
class DocumentBuilder {
  public:
    DocumentBuilder(Document& document, const Limits& limits) : _document(document), _limits(limits) {}

    void parse() {
        xmlInitParser(); // does nothing when it was called before, from any thread
        _context.reset(xmlNewParserCtxt());
        if (!_context) {
            throw std::bad_alloc();
        }
        *_context->sax = handlers();
        _context->userData = this;
        const std::string_view text = _document._text;
        // Entities are to be put in place, so that the predefined ones are in attributes: of others there are none.
        xmlCtxtReadMemory(_context.get(), text.data(), static_cast<int>(text.size()), nullptr, nullptr,
                          XML_PARSE_NOENT | XML_PARSE_NONET | XML_PARSE_IGNORE_ENC);
        if (_failure) {
            std::rethrow_exception(_failure);
        }
        if (_context->wellFormed == 0 || _document._elements.empty()) {
            failAt(text, text.size(), Kind::notWellFormed, "the document ends too early");
        }
    }

  private:
    struct Open {
        std::size_t element = 0;
        std::size_t lastChild = 0;
        bool holdsText = false;
    };

    static DocumentBuilder& self(void* builder) { return *static_cast<DocumentBuilder*>(builder); }

    static xmlSAXHandler handlers() {
        xmlSAXHandler handler{};
        handler.initialized = XML_SAX2_MAGIC;
        handler.startElementNs = [](void* builder, const xmlChar* name, const xmlChar* prefix, const xmlChar* /*uri*/,
                                    int /*nameSpaces*/, const xmlChar** /*nameSpaceList*/, int attributes,
                                    int /*defaulted*/, const xmlChar** attributeList) {
            self(builder).guarded([&] { self(builder).start(name, prefix, attributes, attributeList); });
        };
        handler.endElementNs = [](void* builder, const xmlChar* /*name*/, const xmlChar* /*prefix*/,
                                  const xmlChar* /*uri*/) { self(builder).guarded([&] { self(builder).end(); }); };
        handler.characters = [](void* builder, const xmlChar* text, int length) {
            self(builder).guarded([&] { self(builder).append(viewOf(text, text + length)); });
        };
        handler.ignorableWhitespace = handler.characters;
        handler.cdataBlock = handler.characters;
        handler.getEntity = [](void* builder, const xmlChar* name) -> xmlEntityPtr {
            self(builder).guarded(
                [&] { self(builder).fail(Kind::notWellFormed, "the entity '" + std::string(viewOf(name)) + "'"); });
            return nullptr;
        };
        handler.serror = [](void* builder, xmlErrorPtr error) {
            self(builder).guarded([&] { self(builder).onError(*error); });
        };
        return handler;
    }

    template <typename Action>
    void guarded(Action action) {
        if (_failure) {
            return;
        }
        try {
            action();
        } catch (...) {
            _failure = std::current_exception();
            // The parser looks at this state wherever it goes on; xmlStopParser would free what it is reading from.
            _context->instate = XML_PARSER_EOF;
            _context->disableSAX = 1;
        }
    }

    [[nodiscard]] std::size_t offset() const {
        const long consumed = xmlByteConsumed(_context.get());
        return consumed < 0 ? _document._text.size()
                            : std::min(static_cast<std::size_t>(consumed), _document._text.size());
    }

    [[noreturn]] void fail(Kind kind, const std::string& reason) const {
        failAt(_document._text, _place, kind, reason);
    }

    [[noreturn]] void failLimit(std::size_t limit, const char* what) const {
        fail(Kind::notValid, "more than " + std::to_string(limit) + " " + what);
    }

    /** Namespaces are none of DSP0201's; what is wrong with them is no reason to refuse a document. */
    void onError(const xmlError& error) {
        if (error.level == XML_ERR_FATAL) {
            _place = offset();
            std::string reason = error.message == nullptr ? "not well-formed" : error.message;
            reason.erase(reason.find_last_not_of(" \n") + 1);
            fail(Kind::notWellFormed, reason);
        }
    }

    void start(const xmlChar* name, const xmlChar* prefix, int attributes, const xmlChar** attributeList) {
        std::vector<Document::Element>& elements = _document._elements;
        Document::Element element;
        _place = element.offset = _document._text.rfind('<', offset()); // events come at the end of a tag
        element.name = prefix == nullptr ? findElementName(viewOf(name)) : std::string_view();
        if (element.name.empty()) {
            fail(Kind::notValid, "the element '" + std::string(viewOf(name)) + "' is none of DSP0201");
        }
        if (elements.size() == _limits.elements) {
            failLimit(_limits.elements, "elements");
        }
        if (_open.size() == _limits.depth) {
            failLimit(_limits.depth, "elements within each other");
        }
        element.firstAttribute = _document._attributes.size();
        for (int i = 0; i < attributes; ++i) {
            addAttribute(attributeList + std::ptrdiff_t{5} * i);
        }
        element.attributes = _document._attributes.size() - element.firstAttribute;
        element.textBegin = _document._values.size();
        link(elements.size());
        _open.push_back({elements.size(), 0, holdsText(element.name)});
        elements.push_back(element);
    }

    void link(std::size_t element) {
        if (_open.empty()) {
            return;
        }
        Open& parent = _open.back();
        if (parent.holdsText) {
            fail(Kind::notValid, "an element within " + std::string(_document._elements[parent.element].name));
        }
        (parent.lastChild == 0 ? _document._elements[parent.element].firstChild
                               : _document._elements[parent.lastChild].next) = element;
        parent.lastChild = element;
    }

    /** `parts`: name, prefix, URI, begin and end of the value. */
    void addAttribute(const xmlChar** parts) {
        const std::string_view value = viewOf(parts[3], parts[4]);
        if (value.size() > _limits.textBytes) {
            failLimit(_limits.textBytes, "bytes of an attribute");
        }
        const std::string_view name = parts[1] == nullptr ? findAttributeName(viewOf(parts[0])) : std::string_view();
        if (!name.empty()) {
            _document._attributes.push_back({name, _document._values.size(), value.size()});
            _document._values += value;
        }
    }

    void append(std::string_view text) {
        _place = offset();
        if (_open.empty() || !_open.back().holdsText) {
            if (text.find_first_not_of(" \t\r\n") != std::string_view::npos) {
                fail(Kind::notValid, "text that is no value's");
            }
            return;
        }
        Document::Element& element = _document._elements[_open.back().element];
        element.textLength += text.size();
        if (element.textLength > _limits.textBytes) {
            failLimit(_limits.textBytes, "bytes of a value");
        }
        _document._values += text;
    }

    void end() { _open.pop_back(); }

    Document& _document;
    const Limits& _limits;
    Context _context;
    std::vector<Open> _open;
    std::size_t _place = 0; ///< that the event is about
    std::exception_ptr _failure;
};

Document Document::read(std::string_view text, const Limits& limits) {
    if (text.starts_with(byteOrderMark)) {
        text.remove_prefix(byteOrderMark.size());
    }
    Document document;
    document._text = text;
    scan(text, limits);
    DocumentBuilder(document, limits).parse();
    return document;
}

std::string_view Node::name() const {
    return _document->_elements[_index].name;
}

std::optional<std::string_view> Node::attribute(std::string_view attributeName) const {
    const Document::Element& element = _document->_elements[_index];
    for (std::size_t i = 0; i < element.attributes; ++i) {
        const Document::Attribute& candidate = _document->_attributes[element.firstAttribute + i];
        if (candidate.name == attributeName) {
            return std::string_view(_document->_values).substr(candidate.begin, candidate.length);
        }
    }
    return std::nullopt;
}

std::string Node::require(std::string_view attributeName) const {
    const auto value = attribute(attributeName);
    if (!value) {
        fail(std::string(name()) + " without " + std::string(attributeName));
    }
    return std::string(*value);
}

bool Node::isTrue(std::string_view attributeName, bool otherwise) const {
    const auto value = attribute(attributeName);
    return value ? equalNames(*value, "true") : otherwise;
}

std::string_view Node::text() const {
    const Document::Element& element = _document->_elements[_index];
    return std::string_view(_document->_values).substr(element.textBegin, element.textLength);
}

std::vector<Node> Node::children() const {
    std::vector<Node> nodes;
    for (std::size_t i = _document->_elements[_index].firstChild; i != 0; i = _document->_elements[i].next) {
        nodes.push_back({*_document, i});
    }
    return nodes;
}

Node Node::onlyChild() const {
    const std::vector<Node> nodes = children();
    if (nodes.size() != 1) {
        fail(std::string(name()) + " holds " + std::to_string(nodes.size()) + " elements instead of one");
    }
    return nodes.front();
}

void Node::fail(const std::string& reason, Kind kind) const {
    failAt(_document->_text, _document->_elements[_index].offset, kind, reason);
}

void Node::failMisplaced() const {
    fail(std::string(name()) + " out of place");
}

void Node::requireAtMost(std::size_t count, std::size_t limit, const char* what) const {
    if (count > limit) {
        fail("more than " + std::to_string(limit) + " " + what);
    }
}

} // namespace marlo::cimxml
