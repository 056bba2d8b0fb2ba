#include "host/schema/Lexer.h"

#include "host/model/Instance.h"
#include "host/schema/Utf8.h"

#include <algorithm>
#include <charconv>

namespace marlo::mof {

namespace {

constexpr std::string_view Symbols = "#()[]{},;:=$";

bool isDigit(char c) {
    return c >= '0' && c <= '9';
}

bool isLetter(char c) {
    return (c >= 'a' && c <= 'z') || (c >= 'A' && c <= 'Z') || c == '_' || static_cast<unsigned char>(c) >= 0x80;
}

bool isWordCharacter(char c) {
    return isLetter(c) || isDigit(c);
}

bool startsNumber(std::string_view text) {
    const std::string_view digits = text.front() == '+' || text.front() == '-' ? text.substr(1) : text;
    return !digits.empty() && (isDigit(digits[0]) || (digits[0] == '.' && digits.size() > 1 && isDigit(digits[1])));
}

bool isHexadecimal(std::string_view digits) {
    return digits.size() > 1 && digits[0] == '0' && (digits[1] == 'x' || digits[1] == 'X');
}

/** Characters of the number at the front of a text, with whatever is glued to it. */
std::size_t numberLength(std::string_view text) {
    const bool hexadecimal = isHexadecimal(text.substr(text.front() == '+' || text.front() == '-' ? 1 : 0));
    std::size_t length = 1;
    while (length < text.size()) {
        const char c = text[length];
        const char before = text[length - 1];
        const bool exponentSign = (c == '+' || c == '-') && (before == 'e' || before == 'E') && !hexadecimal;
        if (!isWordCharacter(c) && c != '.' && !exponentSign) {
            break;
        }
        ++length;
    }
    return length;
}

std::string showCharacter(char c) {
    if (c > ' ' && c < 0x7F) {
        return std::string("'") + c + "'";
    }
    constexpr std::string_view Hexadecimal = "0123456789ABCDEF";
    const auto byte = static_cast<unsigned char>(c);
    return std::string("byte 0x") + Hexadecimal[byte >> 4] + Hexadecimal[byte & 0xF];
}

} // namespace

Error::Error(const Location& at, const std::string& reason)
    : std::runtime_error((at.file == nullptr ? "" : *at.file) + ":" + std::to_string(at.line) + ":" +
                         std::to_string(at.column) + ": " + reason) {}

bool Token::isWord(std::string_view word) const {
    return kind == TokenKind::Identifier && equalNames(text, word);
}

std::string Token::describe() const {
    if (kind == TokenKind::End) {
        return "the end of the file";
    }
    if (kind == TokenKind::String || kind == TokenKind::Character) {
        return std::string(text);
    }
    return "'" + std::string(text) + "'";
}

Lexer::Lexer(std::string_view text, const std::string& file) : _text(text), _file(&file) {
    if (_text.starts_with("\xEF\xBB\xBF")) {
        _position = _lineStart = 3;
    }
}

Token Lexer::next() {
    skipBlanksAndComments();
    Token token;
    token.at = locate(_position);
    if (_position == _text.size()) {
        return token;
    }
    const std::size_t start = _position;
    const char c = _text[start];
    if (isLetter(c)) {
        token.kind = TokenKind::Identifier;
        readWord();
    } else if (startsNumber(_text.substr(start))) {
        readNumber(token);
    } else if (c == '"') {
        readString(token);
    } else if (c == '\'') {
        readCharacter(token);
    } else if (Symbols.find(c) != std::string_view::npos) {
        token.kind = TokenKind::Symbol;
        ++_position;
    } else {
        fail(start, "a character that MOF has no use for: " + showCharacter(c));
    }
    token.text = _text.substr(start, _position - start);
    return token;
}

Location Lexer::locate(std::size_t offset) const {
    int column = 1;
    for (std::size_t i = _lineStart; i < offset; ++i) {
        column += (static_cast<unsigned char>(_text[i]) & 0xC0) == 0x80 ? 0 : 1;
    }
    return {_file, _line, column};
}

void Lexer::fail(std::size_t offset, const std::string& reason) const {
    throw Error(locate(offset), reason);
}

void Lexer::endLine() {
    ++_line;
    _lineStart = _position + 1;
}

void Lexer::skipBlanksAndComments() {
    for (; _position < _text.size(); ++_position) {
        const char c = _text[_position];
        const std::string_view rest = _text.substr(_position, 2);
        if (c == '\n') {
            endLine();
        } else if (rest == "//") {
            const std::size_t end = _text.find('\n', _position);
            _position = (end == std::string_view::npos ? _text.size() : end) - 1;
        } else if (rest == "/*") {
            skipBlockComment();
        } else if (c != ' ' && c != '\t' && c != '\r' && c != '\f') {
            return;
        }
    }
}

/** From the opening of a comment to its last character. */
void Lexer::skipBlockComment() {
    const Location start = locate(_position);
    for (_position += 2; _position + 1 < _text.size(); ++_position) {
        if (_text[_position] == '\n') {
            endLine();
        } else if (_text[_position] == '*' && _text[_position + 1] == '/') {
            ++_position;
            return;
        }
    }
    throw Error(start, "this comment is not closed");
}

/** Names may have any character from U+0080 on beside letters, digits and underscores (DSP0004). */
void Lexer::readWord() {
    while (_position < _text.size() && isWordCharacter(_text[_position])) {
        readCodePoint();
    }
}

void Lexer::readNumber(Token& token) {
    const std::string_view text = _text.substr(_position, numberLength(_text.substr(_position)));
    token.negative = text.front() == '-';
    const std::string_view digits = text.substr(text.front() == '-' || text.front() == '+' ? 1 : 0);
    if (digits.find('.') == std::string_view::npos) {
        token.kind = TokenKind::Integer;
        readInteger(token, digits);
    } else {
        token.kind = TokenKind::Real;
        const auto [end, error] = std::from_chars(digits.data(), digits.data() + digits.size(), token.real);
        if (error != std::errc{} || end != digits.data() + digits.size()) {
            fail(_position, "not a number: '" + std::string(text) + "'");
        }
        token.real = token.negative ? -token.real : token.real;
    }
    _position += text.size();
}

/** Decimal, octal (0...), hexadecimal (0x...) and binary (...b) forms. */
void Lexer::readInteger(Token& token, std::string_view digits) {
    std::string_view body = digits;
    int base = 10;
    if (isHexadecimal(digits)) {
        base = 16;
        body.remove_prefix(2);
    } else if (body.back() == 'b' || body.back() == 'B') {
        base = 2;
        body.remove_suffix(1);
    } else if (body.size() > 1 && body.front() == '0') {
        base = 8;
    }
    const char* const last = body.data() + body.size();
    const auto [end, error] = std::from_chars(body.data(), last, token.magnitude, base);
    if (error == std::errc::result_out_of_range) {
        fail(_position, "an integer of more than 64 bits: '" + std::string(digits) + "'");
    }
    if (error != std::errc{} || end != last) {
        fail(_position, "not a number: '" + std::string(digits) + "'");
    }
}

void Lexer::readString(Token& token) {
    const std::size_t start = _position;
    token.kind = TokenKind::String;
    for (++_position; _position < _text.size() && _text[_position] != '\n';) {
        if (_text[_position] == '"') {
            ++_position;
            return;
        }
        appendUtf8(token.value, readCodePoint());
    }
    fail(start, "this string is not closed on its line");
}

void Lexer::readCharacter(Token& token) {
    const std::size_t start = _position++;
    token.kind = TokenKind::Character;
    if (_position < _text.size() && _text[_position] != '\n' && _text[_position] != '\'') {
        token.magnitude = readCodePoint();
        if (_position < _text.size() && _text[_position] == '\'' && token.magnitude <= 0xFFFF) {
            ++_position;
            return;
        }
    }
    fail(start, "a character is one UCS-2 character between single quotes");
}

char32_t Lexer::readCodePoint() {
    if (_text[_position] == '\\') {
        return readEscape();
    }
    std::string_view rest = _text.substr(_position);
    const auto codePoint = takeUtf8(rest);
    if (!codePoint) {
        fail(_position, "a byte that is no UTF-8");
    }
    _position = _text.size() - rest.size();
    return *codePoint;
}

char32_t Lexer::readEscape() {
    constexpr std::string_view Letters = "btnfr\"'\\";
    constexpr std::string_view Meanings = "\b\t\n\f\r\"'\\";
    const std::size_t start = _position++;
    const char letter = _position < _text.size() ? _text[_position++] : '\0';
    if (letter == 'x' || letter == 'X') {
        unsigned value = 0;
        const char* const first = _text.data() + _position;
        const std::size_t available = std::min<std::size_t>(4, _text.size() - _position);
        const auto [end, error] = std::from_chars(first, first + available, value, 16);
        if (error != std::errc{} || value == 0) {
            fail(start, "one to four hexadecimal digits, not all zero, belong behind \\x");
        }
        _position += static_cast<std::size_t>(end - first);
        return value;
    }
    const std::size_t index = Letters.find(letter);
    if (letter == '\0' || index == std::string_view::npos) {
        fail(start, std::string("an escape that MOF has not: \\") + (letter == '\0' ? ' ' : letter));
    }
    return static_cast<unsigned char>(Meanings[index]);
}

} // namespace marlo::mof
