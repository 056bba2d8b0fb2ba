/**
 * @file
 * Tokens of filters: WQL and CQL (DSP0202) cut a text alike.
 */
#pragma once

#include "host/filter/Error.h"
#include "host/model/Value.h"

#include <string>
#include <string_view>

namespace marlo::filter {

enum class TokenKind { End, Name, Number, Text, Symbol };

struct Token {
    TokenKind kind = TokenKind::End;
    std::string_view text; ///< as written
    Value value;           ///< of a number: uint64, sint64 where negative, or real64; of a text: without its quotes
    std::size_t offset = 0;

    [[nodiscard]] bool is(std::string_view symbol) const { return kind == TokenKind::Symbol && text == symbol; }

    /** True for this word; keywords are compared without case. */
    [[nodiscard]] bool isWord(std::string_view word) const;
    /** The token as an error message names it. */
    [[nodiscard]] std::string describe() const;
};

/**
 * Cuts a text, which must outlive it, into tokens. Texts stand in single or double quotes, with MOF's escapes (`\\`,
 * `\"`, `\'`, `\n`, `\t`, `\r`, `\b`, `\f`, `\xHHHH`); any other character behind a backslash keeps the backslash,
 * which is LIKE's to understand.
 */
class Lexer {
  public:
    explicit Lexer(std::string_view text) : _text(text) {}

    /** The next token, End for ever after the last. Throws Error. */
    Token next();

    [[noreturn]] void fail(std::size_t offset, const std::string& reason,
                           CMPIrc code = CMPI_RC_ERR_INVALID_QUERY) const {
        throw Error(code, _text, offset, reason);
    }

  private:
    [[nodiscard]] char peek(std::size_t ahead = 0) const {
        return _position + ahead < _text.size() ? _text[_position + ahead] : '\0';
    }

    [[nodiscard]] bool startsNumber() const;
    void readName();
    void readSymbol();
    Value readNumber();
    void skipDigits();
    bool skipDecimal();
    Value readReal(std::string_view digits, bool negative) const;
    Value readInteger(std::string_view digits, bool negative, int base) const;
    Value readText();
    void readEscape(std::string& value);

    std::string_view _text;
    std::size_t _position = 0;
    std::size_t _start = 0; ///< of the token that is being read
};

} // namespace marlo::filter
