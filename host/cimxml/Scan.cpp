#include "host/cimxml/Scan.h"

#include "host/schema/Utf8.h"

#include <algorithm>

namespace marlo::cimxml {

namespace {

using Kind = MessageError::Kind;

/** Goes from tag to tag. */
class TagScan {
  public:
    TagScan(std::string_view text, const Limits& limits) : _text(text), _limits(limits) {}

    void run() {
        while ((_at = _text.find('<', _at)) != std::string_view::npos) {
            if (startsWith("<!--")) {
                skipBehind("-->", 4);
            } else if (startsWith("<![CDATA[")) {
                skipBehind("]]>", 9);
            } else if (startsWith("<?")) {
                skipBehind("?>", 2);
            } else if (startsWith("<!DOCTYPE")) {
                scanDoctype();
            } else if (startsWith("<!")) {
                failAt(_text, _at, Kind::notWellFormed, "markup that begins with '<!' and is none");
            } else {
                scanTag();
            }
        }
    }

  private:
    [[nodiscard]] bool startsWith(std::string_view start) const { return _text.substr(_at).starts_with(start); }

    /** What never ends is left to the parser to complain about. */
    void skipBehind(std::string_view end, std::size_t least) {
        const std::size_t found = _text.find(end, _at + least);
        _at = found == std::string_view::npos ? _text.size() : found + end.size();
    }

    [[nodiscard]] std::size_t behindQuotes(std::size_t at) const {
        const std::size_t end = _text.find(_text[at], at + 1);
        return end == std::string_view::npos ? _text.size() : end + 1;
    }

    void scanDoctype() {
        std::size_t at = _text.find_first_of("\"'>[", _at);
        while (at < _text.size() && _text[at] != '>') {
            if (_text[at] == '[') {
                failAt(_text, at, Kind::notValid, "declarations in a DOCTYPE are not read");
            }
            at = _text.find_first_of("\"'>[", behindQuotes(at));
        }
        _at = std::min(at, _text.size());
    }

    void scanTag() {
        std::size_t attributes = 0;
        std::size_t at = _text.find_first_of("\"'=<>", _at + 1);
        while (at < _text.size() && _text[at] != '>') {
            if (_text[at] == '<') {
                failAt(_text, at, Kind::notWellFormed, "'<' within a tag");
            }
            if (_text[at] == '=' && ++attributes > _limits.attributes) {
                failAt(_text, _at, Kind::notValid,
                       "more than " + std::to_string(_limits.attributes) + " attributes of an element");
            }
            at = _text.find_first_of("\"'=<>", _text[at] == '=' ? at + 1 : behindQuotes(at));
        }
        if (at >= _text.size()) {
            failAt(_text, _at, Kind::notWellFormed, "a tag that does not end");
        }
        _at = at;
    }

    std::string_view _text;
    const Limits& _limits;
    std::size_t _at = 0;
};

void requireUtf8(std::string_view document) {
    std::string_view rest = document;
    while (!rest.empty()) {
        const auto plain = std::find_if(rest.begin(), rest.end(), [](char c) { return c <= 0; });
        rest.remove_prefix(static_cast<std::size_t>(plain - rest.begin()));
        const std::size_t offset = document.size() - rest.size();
        if (rest.starts_with('\0')) {
            failAt(document, offset, Kind::notWellFormed, "a NUL");
        }
        if (!rest.empty() && !takeUtf8(rest)) {
            failAt(document, offset, Kind::notWellFormed, "bytes that are not UTF-8");
        }
    }
}

/** The encoding that an XML declaration names; empty where there is none. */
std::string_view declaredEncoding(std::string_view document) {
    if (!document.starts_with("<?xml")) {
        return {};
    }
    std::string_view declaration = document.substr(0, document.find("?>"));
    const std::size_t word = declaration.find("encoding");
    const std::size_t quote = word == std::string_view::npos ? word : declaration.find_first_of("\"'", word);
    if (quote == std::string_view::npos) {
        return {};
    }
    const std::string_view value = declaration.substr(quote + 1);
    return value.substr(0, value.find(declaration[quote]));
}

} // namespace

std::string placeOf(std::string_view text, std::size_t offset) {
    const std::string_view before = text.substr(0, offset);
    const auto lines = std::count(before.begin(), before.end(), '\n');
    const std::size_t start = lines == 0 ? 0 : before.rfind('\n') + 1;
    const auto columns = std::count_if(before.begin() + static_cast<std::ptrdiff_t>(start), before.end(),
                                       [](char c) { return (static_cast<unsigned char>(c) & 0xC0U) != 0x80U; });
    return "line " + std::to_string(lines + 1) + ", column " + std::to_string(columns + 1);
}

void failAt(std::string_view text, std::size_t offset, Kind kind, const std::string& reason) {
    throw MessageError(kind, placeOf(text, offset) + ": " + reason);
}

void scan(std::string_view document, const Limits& limits) {
    requireUtf8(document);
    const std::string_view encoding = declaredEncoding(document);
    if (!encoding.empty() && !equalNames(encoding, "UTF-8")) {
        failAt(document, 0, Kind::notWellFormed, "the encoding '" + std::string(encoding) + "', which is not UTF-8");
    }
    TagScan(document, limits).run();
}

} // namespace marlo::cimxml
