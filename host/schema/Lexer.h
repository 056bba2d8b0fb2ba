/**
 * @file
 * Tokens of MOF (DSP0004 annex A, DSP0221).
 */
#pragma once

#include <cstdint>
#include <stdexcept>
#include <string>
#include <string_view>

namespace marlo::mof {

/** A place in a MOF file; lines and columns count from 1, columns in characters. */
struct Location {
    const std::string* file = nullptr; ///< outlives the reading
    int line = 0;
    int column = 0;
};

/** What is wrong with a MOF text; `what()` is "file:line:column: reason". */
class Error : public std::runtime_error {
  public:
    Error(const Location& at, const std::string& reason);
};

enum class TokenKind { End, Identifier, Integer, Real, String, Character, Symbol };

struct Token {
    TokenKind kind = TokenKind::End;
    std::string_view text;       ///< as written
    std::string value;           ///< of a string: without quotes and escapes, as UTF-8
    std::uint64_t magnitude = 0; ///< of an integer; of a character its UTF-16 code unit
    bool negative = false;       ///< of an integer
    double real = 0;
    Location at;

    [[nodiscard]] bool is(char symbol) const { return kind == TokenKind::Symbol && text.front() == symbol; }

    /** True for this identifier; keywords of MOF are compared without case. */
    [[nodiscard]] bool isWord(std::string_view word) const;
    /** The token as an error message names it. */
    [[nodiscard]] std::string describe() const;
};

/** Cuts a text into tokens. The text and the file's name must outlive it. */
class Lexer {
  public:
    Lexer(std::string_view text, const std::string& file);

    /** The next token, End for ever after the last. Throws Error. */
    Token next();

  private:
    [[nodiscard]] Location locate(std::size_t offset) const;
    [[noreturn]] void fail(std::size_t offset, const std::string& reason) const;
    void skipBlanksAndComments();
    void skipBlockComment();
    void endLine();
    void readWord();
    void readNumber(Token& token);
    void readInteger(Token& token, std::string_view digits);
    void readString(Token& token);
    void readCharacter(Token& token);
    char32_t readCodePoint();
    char32_t readEscape();

    std::string_view _text;
    const std::string* _file;
    std::size_t _position = 0;
    std::size_t _lineStart = 0;
    int _line = 1;
};

} // namespace marlo::mof
