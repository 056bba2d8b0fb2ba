/**
 * @file
 * Reads filters by recursive descent.
 */
#pragma once

#include "host/filter/Filter.h"
#include "host/filter/Tokens.h"

namespace marlo::filter {

class Parser {
  public:
    Parser(std::string_view text, Language language);

    Filter read();

  private:
    class Nesting;

    void advance() { _token = _lexer.next(); }

    bool takeWord(std::string_view word);
    bool takeSymbol(std::string_view symbol);
    void requireWord(std::string_view word);
    /** Whether a name is next that is no word of the language. */
    [[nodiscard]] bool atName() const;
    std::string requireName(const std::string& what);
    [[noreturn]] void failExpected(const std::string& what) const;
    [[noreturn]] void failUnsupported(const std::string& what) const;

    void readSelection();
    Operand readSelected();
    void readClass();
    Condition readAny();
    Condition readAll();
    Condition readNot();
    Condition readPredicate();
    void readComparison(Condition& condition);
    void readLike(Condition& condition);
    void readIsA(Condition& condition);
    Operand readOperand();
    Operand readValue();
    Operand readDateTimeCall(Operand operand);
    void readPath(Operand& operand);
    void resolve(Operand& operand) const;
    [[nodiscard]] bool isClassName(const std::string& name) const;

    Filter _filter;
    Lexer _lexer;
    Token _token;
    std::string _alias;
    int _depth = 0;
};

} // namespace marlo::filter
