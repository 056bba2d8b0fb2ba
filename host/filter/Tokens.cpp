#include "host/filter/Tokens.h"

#include "host/model/Instance.h"
#include "host/schema/Utf8.h"

#include <algorithm>
#include <array>
#include <charconv>
#include <limits>
#include <utility>

namespace marlo::filter {

namespace {

bool isDigit(char c) {
    return c >= '0' && c <= '9';
}

bool isBlank(char c) {
    return c == ' ' || c == '\t' || c == '\n' || c == '\r';
}

/** Names of DSP0004: letters, digits and underscores, and every character beyond ASCII. */
bool isNameStart(char c) {
    return (c >= 'a' && c <= 'z') || (c >= 'A' && c <= 'Z') || c == '_' || (static_cast<unsigned char>(c) & 0x80U);
}

bool isNamePart(char c) {
    return isNameStart(c) || isDigit(c);
}

bool isHexDigit(char c) {
    return isDigit(c) || (c >= 'a' && c <= 'f') || (c >= 'A' && c <= 'F');
}

constexpr std::array<std::pair<char, char>, 8> escapes{{
    {'\\', '\\'},
    {'"', '"'},
    {'\'', '\''},
    {'n', '\n'},
    {'t', '\t'},
    {'r', '\r'},
    {'b', '\b'},
    {'f', '\f'},
}};

} // namespace

bool Token::isWord(std::string_view word) const {
    return kind == TokenKind::Name && equalNames(text, word);
}

std::string Token::describe() const {
    return kind == TokenKind::End ? "the end of the filter" : "'" + std::string(text) + "'";
}

Token Lexer::next() {
    while (isBlank(peek()) && _position < _text.size()) {
        ++_position;
    }
    _start = _position;
    Token token;
    token.offset = _start;
    if (_position == _text.size()) {
        return token;
    }
    if (startsNumber()) {
        token.kind = TokenKind::Number;
        token.value = readNumber();
    } else if (isNameStart(peek())) {
        token.kind = TokenKind::Name;
        readName();
    } else if (peek() == '\'' || peek() == '"') {
        token.kind = TokenKind::Text;
        token.value = readText();
    } else {
        token.kind = TokenKind::Symbol;
        readSymbol();
    }
    token.text = _text.substr(_start, _position - _start);
    return token;
}

bool Lexer::startsNumber() const {
    const std::size_t sign = peek() == '-' || peek() == '+' ? 1 : 0;
    return isDigit(peek(sign)) || (peek(sign) == '.' && isDigit(peek(sign + 1)));
}

void Lexer::readName() {
    while (isNamePart(peek())) {
        std::string_view rest = _text.substr(_position);
        const std::size_t size = rest.size();
        if (!takeUtf8(rest)) {
            fail(_position, "these bytes are no UTF-8");
        }
        _position += size - rest.size();
    }
}

void Lexer::readSymbol() {
    for (const std::string_view symbol : {"<>", "<=", ">=", "!=", "::", "||"}) {
        if (_text.substr(_position).starts_with(symbol)) {
            _position += symbol.size();
            return;
        }
    }
    if (std::string_view("=<>(),.*[]+-/").find(peek()) == std::string_view::npos) {
        const auto code = static_cast<unsigned char>(peek());
        fail(_position, code < 0x20 || code == 0x7F ? "a control character, code " + std::to_string(code)
                                                    : "a character of no meaning: '" + std::string(1, peek()) + "'");
    }
    ++_position;
}

void Lexer::skipDigits() {
    while (isDigit(peek())) {
        ++_position;
    }
}

/** Decimal, `0x` hexadecimal and `b` binary integers, and reals, each with a sign where wanted. */
Value Lexer::readNumber() {
    const bool negative = peek() == '-';
    if (negative || peek() == '+') {
        ++_position;
    }
    const std::size_t begin = _position;
    Value value;
    if (peek() == '0' && (peek(1) == 'x' || peek(1) == 'X')) {
        _position += 2;
        while (isHexDigit(peek())) {
            ++_position;
        }
        value = readInteger(_text.substr(begin + 2, _position - begin - 2), negative, 16);
    } else if (skipDecimal()) {
        value = readReal(_text.substr(begin, _position - begin), negative);
    } else {
        const std::string_view digits = _text.substr(begin, _position - begin);
        const bool binary = peek() == 'b' || peek() == 'B';
        _position += binary ? 1 : 0;
        value = readInteger(digits, negative, binary ? 2 : 10);
    }
    if (isNamePart(peek())) {
        fail(_start, "a number that goes on as a name");
    }
    return value;
}

/** Goes to the end of a decimal number; true when it has a fraction or an exponent. */
bool Lexer::skipDecimal() {
    skipDigits();
    const bool fraction = peek() == '.' && isDigit(peek(1));
    if (fraction) {
        ++_position;
        skipDigits();
    }
    const std::size_t sign = peek(1) == '-' || peek(1) == '+' ? 2 : 1;
    const bool exponent = (peek() == 'e' || peek() == 'E') && isDigit(peek(sign));
    if (exponent) {
        _position += sign;
        skipDigits();
    }
    return fraction || exponent;
}

Value Lexer::readReal(std::string_view digits, bool negative) const {
    double real = 0;
    if (std::from_chars(digits.data(), digits.data() + digits.size(), real).ec != std::errc()) {
        fail(_start, "the number is out of range");
    }
    return {CMPI_real64, negative ? -real : real};
}

Value Lexer::readInteger(std::string_view digits, bool negative, int base) const {
    std::uint64_t magnitude = 0;
    const auto result = std::from_chars(digits.data(), digits.data() + digits.size(), magnitude, base);
    if (result.ec == std::errc::result_out_of_range) {
        fail(_start, "the number is out of range");
    }
    if (result.ec != std::errc() || result.ptr != digits.data() + digits.size()) {
        fail(_start, "a number without its digits");
    }
    if (!negative) {
        return Value::uint(CMPI_uint64, magnitude);
    }
    constexpr std::uint64_t lowest = std::uint64_t{1} << 63U;
    if (magnitude > lowest) {
        fail(_start, "the number is out of range");
    }
    // Two's complement: the lowest number has no positive counterpart.
    return Value::sint(CMPI_sint64, static_cast<std::int64_t>(~magnitude + 1));
}

Value Lexer::readText() {
    const char quote = peek();
    ++_position;
    std::string value;
    while (peek() != quote) {
        if (_position == _text.size()) {
            fail(_start, "a text without its closing quote");
        }
        if (peek() == '\\') {
            readEscape(value);
            continue;
        }
        std::string_view rest = _text.substr(_position);
        const std::size_t size = rest.size();
        if (!takeUtf8(rest)) {
            fail(_position, "these bytes are no UTF-8");
        }
        value += _text.substr(_position, size - rest.size());
        _position += size - rest.size();
    }
    ++_position;
    return Value::string(std::move(value));
}

void Lexer::readEscape(std::string& value) {
    const char escaped = peek(1);
    const auto* found =
        std::find_if(escapes.begin(), escapes.end(), [escaped](const auto& entry) { return entry.first == escaped; });
    if (found != escapes.end()) {
        value += found->second;
        _position += 2;
        return;
    }
    if (escaped != 'x' && escaped != 'X') {
        value += '\\';
        ++_position;
        return;
    }
    constexpr std::size_t most = 4;
    std::size_t count = 0;
    while (count < most && isHexDigit(peek(2 + count))) {
        ++count;
    }
    const std::string_view digits = _text.substr(_position + 2, count);
    std::uint32_t codePoint = 0;
    std::from_chars(digits.data(), digits.data() + digits.size(), codePoint, 16);
    if (codePoint == 0 || (codePoint >= 0xD800 && codePoint <= 0xDFFF)) {
        fail(_position, "an escape of no character");
    }
    appendUtf8(value, codePoint);
    _position += 2 + count;
}

} // namespace marlo::filter
