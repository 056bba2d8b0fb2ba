/**
 * @file
 * Object paths as text: the untyped form of DSP0004, printed and read.
 */
#include "host/model/Instance.h"

#include <cerrno>
#include <charconv>
#include <cmath>
#include <cstdlib>
#include <stdexcept>

namespace marlo {

namespace {

std::string quoted(std::string_view text) {
    std::string out = "\"";
    for (const char c : text) {
        if (c == '"' || c == '\\') {
            out += '\\';
        }
        out += c;
    }
    return out + '"';
}

std::string numberText(double value) {
    char buffer[32];
    const auto end = std::to_chars(buffer, buffer + sizeof buffer, value);
    std::string text(buffer, end.ptr);
    // A real keeps its look: "2" would be read back as an integer.
    return text.find_first_of(".en") == std::string::npos ? text + ".0" : text;
}

std::string char16Text(char16_t c) {
    if (c < 0x80) {
        return c == u'\'' || c == u'\\' ? std::string("'\\") + static_cast<char>(c) + '\''
                                        : std::string("'") + static_cast<char>(c) + '\'';
    }
    constexpr char digits[] = "0123456789ABCDEF";
    std::string text = "'\\x";
    for (int shift = 12; shift >= 0; shift -= 4) {
        text += digits[(c >> shift) & 0xF];
    }
    return text + '\'';
}

struct ValueText {
    std::string operator()(std::monostate) const { return "NULL"; }

    std::string operator()(bool value) const { return value ? "TRUE" : "FALSE"; }

    std::string operator()(char16_t value) const { return char16Text(value); }

    std::string operator()(std::uint64_t value) const { return std::to_string(value); }

    std::string operator()(std::int64_t value) const { return std::to_string(value); }

    std::string operator()(double value) const { return numberText(value); }

    std::string operator()(const std::string& value) const { return quoted(value); }

    std::string operator()(const DateTime& value) const { return quoted(value.text); }

    std::string operator()(const std::shared_ptr<const ObjectPath>& value) const {
        return value ? quoted(value->toString()) : "NULL";
    }

    std::string operator()(const std::shared_ptr<const Instance>& value) const {
        return value ? quoted(value->path.toString()) : "NULL";
    }

    std::string operator()(const Value::Array& value) const {
        std::string text = "{";
        for (const Value& element : value) {
            text += (text.size() > 1 ? "," : "") + toText(element);
        }
        return text + '}';
    }
};

bool isNameStart(char c) {
    return (c >= 'a' && c <= 'z') || (c >= 'A' && c <= 'Z') || c == '_' || static_cast<unsigned char>(c) >= 0x80;
}

bool isDigit(char c) {
    return c >= '0' && c <= '9';
}

bool isNameChar(char c) {
    return isNameStart(c) || isDigit(c);
}

/** Reads a path from front to back; every error tells the position, counted from 1. */
class PathReader {
  public:
    explicit PathReader(std::string_view text) : _text(text) {}

    ObjectPath read() {
        ObjectPath path;
        if (_text.substr(0, 2) == "//") {
            path.host = readHost(2);
            path.nameSpace = readNameSpace();
        } else if (namesHost()) {
            path.host = readHost(0);
            path.nameSpace = readNameSpace();
        } else if (namesNameSpace()) {
            path.nameSpace = readNameSpace();
        }
        path.className = readName("a class name");
        if (!atEnd()) {
            expect('.', "'.' and a key, or the end");
            readKeys(path.keys);
        }
        return path;
    }

  private:
    [[nodiscard]] bool atEnd() const { return _at == _text.size(); }

    [[nodiscard]] char peek() const { return atEnd() ? '\0' : _text[_at]; }

    [[noreturn]] void fail(const std::string& expected) const { fail(_at, expected); }

    [[noreturn]] static void fail(std::size_t at, const std::string& expected) {
        throw std::invalid_argument("position " + std::to_string(at + 1) + ": expected " + expected);
    }

    void expect(char c, const char* expected) {
        if (atEnd() || _text[_at] != c) {
            fail(expected);
        }
        ++_at;
    }

    /** A ':' before anything that can only follow a class name. */
    [[nodiscard]] bool namesNameSpace() const {
        const auto found = _text.find_first_of(":.=\",");
        return found != std::string_view::npos && _text[found] == ':';
    }

    /** A part before the first '/' that has what only hosts have: points, a port, or a digit in front. */
    [[nodiscard]] bool namesHost() const {
        const std::string_view first = _text.substr(0, _text.find_first_of("/=\"'"));
        return first.size() < _text.size() && _text[first.size()] == '/' && !first.empty() &&
               (isDigit(first.front()) || first.find_first_of(".:") != std::string_view::npos);
    }

    std::string readHost(std::size_t start) {
        _at = start;
        const auto end = _text.find('/', _at);
        if (end == std::string_view::npos) {
            _at = _text.size();
            fail("'/' after the host");
        }
        if (end == _at) {
            fail("a host");
        }
        std::string host(_text.substr(_at, end - _at));
        _at = end + 1;
        return host;
    }

    std::string readNameSpace() {
        const std::size_t start = _at;
        for (;;) {
            if (!isNameChar(peek())) {
                fail("a namespace");
            }
            while (isNameChar(peek()) || peek() == '-') {
                ++_at;
            }
            if (peek() != '/') {
                break;
            }
            ++_at;
        }
        std::string nameSpace(_text.substr(start, _at - start));
        expect(':', "':' after the namespace");
        return nameSpace;
    }

    std::string readName(const char* expected) {
        const std::size_t start = _at;
        if (!isNameStart(peek())) {
            fail(expected);
        }
        while (isNameChar(peek())) {
            ++_at;
        }
        return std::string(_text.substr(start, _at - start));
    }

    void readKeys(std::vector<NamedValue>& keys) {
        for (;;) {
            const std::size_t start = _at;
            NamedValue key{readName("a key name"), {}};
            if (findName(keys, key.name) != nullptr) {
                fail(start, "a key that was not given yet, found '" + key.name + "' again");
            }
            expect('=', "'=' after the key name");
            key.value = readValue();
            keys.push_back(std::move(key));
            if (atEnd()) {
                return;
            }
            expect(',', "',' and another key, or the end");
        }
    }

    Value readValue() {
        const char c = peek();
        if (c == '"') {
            return Value::string(readDelimited('"'));
        }
        if (c == '\'') {
            return readChar16();
        }
        if (isDigit(c) || c == '-' || c == '+' || c == '.') {
            return readNumber();
        }
        return readBoolean();
    }

    /** What lies between two delimiters, without the backslashes that protect delimiters and backslashes. */
    std::string readDelimited(char delimiter) {
        const std::size_t start = _at++;
        std::string text;
        while (peek() != delimiter || atEnd()) {
            if (atEnd()) {
                fail(std::string("the ") + delimiter + " that ends the value begun at position " +
                     std::to_string(start + 1));
            }
            if (_text[_at] == '\\') {
                if (++_at == _text.size()) {
                    fail("a character after the backslash");
                }
            }
            text += _text[_at++];
        }
        ++_at;
        return text;
    }

    Value readChar16() {
        const std::size_t start = _at;
        const std::string text = readDelimited('\'');
        if (text.size() == 1 && static_cast<unsigned char>(text[0]) < 0x80) {
            return {CMPI_char16, static_cast<char16_t>(text[0])};
        }
        unsigned code = 0;
        if (text.size() >= 2 && text[0] == 'x') {
            const auto end = std::from_chars(text.data() + 1, text.data() + text.size(), code, 16);
            if (end.ec == std::errc() && end.ptr == text.data() + text.size() && code <= 0xFFFF) {
                return {CMPI_char16, static_cast<char16_t>(code)};
            }
        }
        fail(start, "one character between ' and '");
    }

    Value readNumber() {
        const std::size_t start = _at;
        while (!atEnd() && _text[_at] != ',') {
            ++_at;
        }
        const std::string_view text = _text.substr(start, _at - start);
        if (text.find_first_of(".eE") != std::string_view::npos && text.find('x') == std::string_view::npos) {
            return readReal(start, std::string(text));
        }
        return readInteger(start, text);
    }

    static Value readReal(std::size_t start, const std::string& text) {
        char* end = nullptr;
        const double value = std::strtod(text.c_str(), &end);
        if (end != text.c_str() + text.size()) {
            fail(start, "a number, found '" + text + "'");
        }
        if (!std::isfinite(value)) {
            fail(start, "a real number of at most 64 bits, found '" + text + "'");
        }
        return {CMPI_real64, value};
    }

    static Value readInteger(std::size_t start, std::string_view text) {
        const bool negative = text.front() == '-';
        std::string_view digits = negative || text.front() == '+' ? text.substr(1) : text;
        const bool hexadecimal = digits.substr(0, 2) == "0x" || digits.substr(0, 2) == "0X";
        if (hexadecimal) {
            digits.remove_prefix(2);
        }
        std::uint64_t magnitude = 0;
        const char* end = digits.data() + digits.size();
        const auto result = std::from_chars(digits.data(), end, magnitude, hexadecimal ? 16 : 10);
        if (result.ec == std::errc::result_out_of_range || (negative && magnitude > std::uint64_t{1} << 63)) {
            fail(start, "an integer of at most 64 bits, found '" + std::string(text) + "'");
        }
        if (result.ec != std::errc() || result.ptr != end) {
            fail(start, "a number, found '" + std::string(text) + "'");
        }
        return negative && magnitude != 0 ? Value::sint(CMPI_sint64, static_cast<std::int64_t>(-magnitude))
                                          : Value::uint(CMPI_uint64, magnitude);
    }

    Value readBoolean() {
        const std::size_t start = _at;
        while (isNameChar(peek())) {
            ++_at;
        }
        const std::string_view word = _text.substr(start, _at - start);
        if (equalNames(word, "TRUE") || equalNames(word, "FALSE")) {
            return Value::boolean(equalNames(word, "TRUE"));
        }
        fail(start, "a value: a text in double quotes, a number, TRUE or FALSE");
    }

    std::string_view _text;
    std::size_t _at = 0;
};

} // namespace

std::string toText(const Value& value) {
    return std::visit(ValueText{}, value.data);
}

std::string ObjectPath::toString() const {
    std::string text;
    if (!host.empty()) {
        text = "//" + host + '/';
    }
    if (!nameSpace.empty()) {
        text += nameSpace + ':';
    }
    text += className;
    char separator = '.';
    for (const NamedValue& key : keys) {
        text += separator + key.name + '=' + toText(key.value);
        separator = ',';
    }
    return text;
}

ObjectPath ObjectPath::parse(std::string_view text) {
    return PathReader(text).read();
}

} // namespace marlo
