/**
 * @file
 * An XML document (XML 1.0) of DSP0201's elements, read strictly and within limits.
 */
#pragma once

#include "host/cimxml/Message.h"

#include <cstddef>
#include <optional>
#include <string>
#include <string_view>
#include <vector>

namespace marlo::cimxml {

class Document;

/** An element of a document, which must outlive it. Views that it gives out live as long as the document. */
class Node {
  public:
    [[nodiscard]] std::string_view name() const;

    [[nodiscard]] bool is(std::string_view element) const { return name() == element; }

    [[nodiscard]] std::optional<std::string_view> attribute(std::string_view attributeName) const;
    /** The attribute; throws MessageError when there is none. */
    [[nodiscard]] std::string require(std::string_view attributeName) const;
    /** True where the attribute says so, and `otherwise` where there is none. */
    [[nodiscard]] bool isTrue(std::string_view attributeName, bool otherwise) const;
    /** The text of VALUE, KEYVALUE, HOST and ERROR, exactly; others have none. */
    [[nodiscard]] std::string_view text() const;
    [[nodiscard]] std::vector<Node> children() const;
    /** The one child; throws MessageError when there are more or fewer. */
    [[nodiscard]] Node onlyChild() const;

    /** Throws MessageError with the place of this element. */
    [[noreturn]] void fail(const std::string& reason, MessageError::Kind kind = MessageError::Kind::notValid) const;
    /** Fails since this element may not stand where it does. */
    [[noreturn]] void failMisplaced() const;
    /** Fails when `count` of `what` is more than a limit allows. */
    void requireAtMost(std::size_t count, std::size_t limit, const char* what) const;

  private:
    friend class Document;

    Node(const Document& document, std::size_t index) : _document(&document), _index(index) {}

    const Document* _document;
    std::size_t _index;
};

/** A document that has been read: well-formed, of known elements, and within the limits of a document. */
class Document {
  public:
    /** Throws MessageError. `text` must outlive the document. */
    static Document read(std::string_view text, const Limits& limits);

    [[nodiscard]] Node root() const { return {*this, 0}; }

  private:
    friend class Node;
    friend class DocumentBuilder;

    struct Attribute {
        std::string_view name; ///< of a table of all names
        std::size_t begin = 0; ///< of its value, in `_values`
        std::size_t length = 0;
    };

    /** Elements are linked by their places in `_elements`; 0, the root's, stands for none. */
    struct Element {
        std::string_view name;  ///< of a table of all names
        std::size_t offset = 0; ///< in `_text`
        std::size_t firstChild = 0;
        std::size_t next = 0;
        std::size_t firstAttribute = 0;
        std::size_t attributes = 0;
        std::size_t textBegin = 0; ///< in `_values`
        std::size_t textLength = 0;
    };

    Document() = default;

    std::string_view _text;
    std::vector<Element> _elements;
    std::vector<Attribute> _attributes;
    std::string _values; ///< of attributes and elements, one behind the other
};

} // namespace marlo::cimxml
