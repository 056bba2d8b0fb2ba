#include "host/filter/Parser.h"

#include <algorithm>
#include <array>

namespace marlo::filter {

namespace {

constexpr std::array<std::string_view, 10> keywords = {"SELECT", "FROM", "WHERE", "AND", "OR",
                                                       "NOT",    "ISA",  "LIKE",  "IS",  "NULL"};

} // namespace

std::optional<Language> readLanguage(std::string_view name) {
    if (equalNames(name, "WQL")) {
        return Language::wql;
    }
    if (equalNames(name, "CQL") || equalNames(name, "CIM:CQL") || equalNames(name, "DMTF:CQL")) {
        return Language::cql;
    }
    return std::nullopt;
}

Filter Filter::parse(std::string_view text, Language language) {
    if (text.size() > longest) {
        throw Error(CMPI_RC_ERR_INVALID_QUERY, text, longest,
                    "the filter is longer than " + std::to_string(longest) + " bytes");
    }
    return Parser(text, language).read();
}

Parser::Parser(std::string_view text, Language language) : _lexer(text) {
    _filter._text = std::string(text);
    _filter._language = language;
    advance();
}

Filter Parser::read() {
    readSelection();
    readClass();
    if (takeWord("WHERE")) {
        _filter._condition = readAny();
    }
    if (_token.kind != TokenKind::End) {
        for (const std::string_view word : {"ORDER", "GROUP", "HAVING", "WITHIN"}) {
            if (_token.isWord(word)) {
                failUnsupported(std::string(word));
            }
        }
        if (_token.kind == TokenKind::Symbol &&
            std::string_view("+-*/||[::").find(_token.text) != std::string::npos) {
            failUnsupported(_token.describe());
        }
        failExpected("AND, OR or the end");
    }
    for (Operand& selected : _filter._selected) {
        resolve(selected);
        if (selected.kind == Operand::Kind::property) {
            _filter._properties.push_back(selected.path.front());
        }
    }
    return std::move(_filter);
}

bool Parser::takeWord(std::string_view word) {
    const bool found = _token.isWord(word);
    if (found) {
        advance();
    }
    return found;
}

bool Parser::takeSymbol(std::string_view symbol) {
    const bool found = _token.is(symbol);
    if (found) {
        advance();
    }
    return found;
}

void Parser::requireWord(std::string_view word) {
    if (!takeWord(word)) {
        failExpected(std::string(word));
    }
}

bool Parser::atName() const {
    return _token.kind == TokenKind::Name &&
           std::none_of(keywords.begin(), keywords.end(), [this](auto word) { return _token.isWord(word); });
}

std::string Parser::requireName(const std::string& what) {
    if (!atName()) {
        failExpected(what);
    }
    std::string name(_token.text);
    advance();
    return name;
}

void Parser::failExpected(const std::string& what) const {
    _lexer.fail(_token.offset, "expected " + what + ", found " + _token.describe());
}

void Parser::failUnsupported(const std::string& what) const {
    _lexer.fail(_token.offset, what + " is not supported in filters", CMPI_RC_ERR_QUERY_FEATURE_NOT_SUPPORTED);
}

void Parser::readSelection() {
    requireWord("SELECT");
    if (takeSymbol("*")) {
        return;
    }
    for (const std::string_view word : {"DISTINCT", "FIRST"}) {
        if (_token.isWord(word)) {
            failUnsupported(std::string(word));
        }
    }
    do {
        _filter._selected.push_back(readSelected());
    } while (takeSymbol(","));
}

/** A property, or `class.*`, which is left as the class alone. */
Operand Parser::readSelected() {
    Operand operand;
    operand.kind = Operand::Kind::property;
    operand.offset = _token.offset;
    operand.path.push_back(requireName("* or a property"));
    while (takeSymbol(".")) {
        if (takeSymbol("*")) {
            operand.kind = Operand::Kind::self;
            break;
        }
        operand.path.push_back(requireName("a property"));
    }
    if (_token.is("(") || _token.is("[") || _token.is("::")) {
        failUnsupported(_token.describe());
    }
    return operand;
}

void Parser::readClass() {
    requireWord("FROM");
    _filter._classOffset = _token.offset;
    _filter._className = requireName("a class");
    const bool named = takeWord("AS");
    const bool other = _token.isWord("ORDER") || _token.isWord("GROUP") || _token.isWord("WITHIN");
    if (named || (atName() && !other)) {
        if (_filter._language == Language::wql) {
            failExpected("WHERE or the end (an alias is CQL)");
        }
        _alias = requireName("an alias");
    }
    if (_token.is(",")) {
        failUnsupported("more than one class behind FROM");
    }
    if (_token.kind != TokenKind::End && !_token.isWord("WHERE") && !other) {
        failExpected("WHERE or the end");
    }
}

bool Parser::isClassName(const std::string& name) const {
    return equalNames(name, _filter._className) || (!_alias.empty() && equalNames(name, _alias));
}

/** Takes the class or its alias off the front of a name; what is nothing else is the instance itself. */
void Parser::resolve(Operand& operand) const {
    const bool whole = operand.kind == Operand::Kind::self;
    const bool self = equalNames(operand.path.front(), "__this");
    if (self || isClassName(operand.path.front())) {
        operand.path.erase(operand.path.begin());
    }
    if (operand.path.empty()) {
        operand.kind = Operand::Kind::self;
    } else if (whole) {
        _lexer.fail(operand.offset, "'" + operand.path.front() + "' is not the class behind FROM");
    }
}

} // namespace marlo::filter
