#include "host/filter/Parser.h"

#include "host/model/DateTimeText.h"

#include <algorithm>
#include <array>

namespace marlo::filter {

namespace {

constexpr std::array<std::string_view, 10> keywords = {"SELECT", "FROM", "WHERE", "AND", "OR",
                                                       "NOT",    "ISA",  "LIKE",  "IS",  "NULL"};

bool isKeyword(const Token& token) {
    return std::any_of(keywords.begin(), keywords.end(), [&token](auto word) { return token.isWord(word); });
}

struct Comparison {
    std::string_view symbol;
    Relation relation;
};

constexpr std::array<Comparison, 7> comparisons = {{
    {"=", Relation::equal},
    {"<>", Relation::notEqual},
    {"!=", Relation::notEqual},
    {"<", Relation::less},
    {"<=", Relation::lessOrEqual},
    {">", Relation::greater},
    {">=", Relation::greaterOrEqual},
}};

Condition negate(Condition&& condition, bool negated) {
    if (!negated) {
        return std::move(condition);
    }
    Condition negation;
    negation.kind = Condition::Kind::negation;
    negation.offset = condition.offset;
    negation.children.push_back(std::move(condition));
    return negation;
}

/** One condition alone stands for itself. */
Condition join(Condition::Kind kind, std::vector<Condition>&& children) {
    if (children.size() == 1) {
        return std::move(children.front());
    }
    Condition joined;
    joined.kind = kind;
    joined.offset = children.front().offset;
    joined.children = std::move(children);
    return joined;
}

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

/** Counts the conditions that are open around the present one. */
class Parser::Nesting {
  public:
    explicit Nesting(Parser& parser) : _parser(parser) {
        if (_parser._depth == Filter::deepest) {
            _parser._lexer.fail(_parser._token.offset,
                                "conditions are nested more than " + std::to_string(Filter::deepest) + " deep");
        }
        ++_parser._depth;
    }

    ~Nesting() { --_parser._depth; }

    Nesting(const Nesting&) = delete;
    Nesting& operator=(const Nesting&) = delete;

  private:
    Parser& _parser;
};

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

std::string Parser::requireName(const std::string& what) {
    if (_token.kind != TokenKind::Name || isKeyword(_token)) {
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
    if (named || (_token.kind == TokenKind::Name && !isKeyword(_token) && !other)) {
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

Condition Parser::readAny() {
    std::vector<Condition> conditions;
    do {
        conditions.push_back(readAll());
    } while (takeWord("OR"));
    return join(Condition::Kind::any, std::move(conditions));
}

Condition Parser::readAll() {
    std::vector<Condition> conditions;
    do {
        conditions.push_back(readNot());
    } while (takeWord("AND"));
    return join(Condition::Kind::all, std::move(conditions));
}

Condition Parser::readNot() {
    if (_token.isWord("NOT")) {
        const Nesting nesting(*this);
        advance();
        return negate(readNot(), true);
    }
    if (_token.is("(")) {
        const Nesting nesting(*this);
        advance();
        Condition condition = readAny();
        if (!takeSymbol(")")) {
            failExpected("AND, OR or )");
        }
        return condition;
    }
    return readPredicate();
}

Condition Parser::readPredicate() {
    Condition condition;
    condition.offset = _token.offset;
    condition.left = readOperand();
    bool negated = false;
    if (takeWord("IS")) {
        negated = takeWord("NOT");
        requireWord("NULL");
        condition.kind = Condition::Kind::nullTest;
        return negate(std::move(condition), negated);
    }
    negated = takeWord("NOT");
    if (takeWord("LIKE")) {
        readLike(condition);
    } else if (takeWord("ISA")) {
        readIsA(condition);
    } else if (negated) {
        failExpected("LIKE or ISA");
    } else {
        readComparison(condition);
    }
    return negate(std::move(condition), negated);
}

void Parser::readComparison(Condition& condition) {
    const auto* found = std::find_if(comparisons.begin(), comparisons.end(),
                                     [this](const Comparison& entry) { return _token.is(entry.symbol); });
    if (found == comparisons.end()) {
        if (_token.kind == TokenKind::Symbol && !_token.is(")") && !_token.is(",")) {
            failUnsupported(_token.describe());
        }
        failExpected("a comparison");
    }
    advance();
    condition.kind = Condition::Kind::comparison;
    condition.relation = found->relation;
    condition.right = readOperand();
}

void Parser::readLike(Condition& condition) {
    if (_token.kind != TokenKind::Text) {
        failExpected("a pattern in quotes");
    }
    const auto& text = std::get<std::string>(_token.value.data);
    condition.kind = Condition::Kind::like;
    condition.pattern = _filter._language == Language::wql ? Pattern::readWql(text) : Pattern::readCql(text);
    advance();
}

void Parser::readIsA(Condition& condition) {
    condition.kind = Condition::Kind::isA;
    condition.right.offset = _token.offset;
    if (_token.kind == TokenKind::Text) {
        condition.className = std::get<std::string>(_token.value.data);
        advance();
    } else {
        condition.className = requireName("a class");
    }
    if (condition.left.kind == Operand::Kind::value) {
        _lexer.fail(condition.left.offset, "a value is of no class");
    }
}

Operand Parser::readOperand() {
    if (_token.isWord("NULL")) {
        _lexer.fail(_token.offset, "nothing compares with NULL: use IS NULL or IS NOT NULL");
    }
    if (_token.kind == TokenKind::Number || _token.kind == TokenKind::Text || _token.isWord("TRUE") ||
        _token.isWord("FALSE")) {
        return readValue();
    }
    Operand operand;
    operand.kind = Operand::Kind::property;
    operand.offset = _token.offset;
    const bool dateTime = _token.isWord("DATETIME") && _filter._language == Language::cql;
    const bool each = _token.isWord("ANY") || _token.isWord("EVERY");
    operand.path.push_back(requireName("a property or a value"));
    if (_token.is("(")) {
        if (!dateTime) {
            failUnsupported("a function");
        }
        return readDateTimeCall(std::move(operand));
    }
    if (each && _token.kind == TokenKind::Name && !isKeyword(_token)) {
        failUnsupported(operand.path.front());
    }
    readPath(operand);
    resolve(operand);
    return operand;
}

Operand Parser::readValue() {
    Operand operand;
    operand.offset = _token.offset;
    operand.value = _token.kind == TokenKind::Name ? Value::boolean(_token.isWord("TRUE")) : _token.value;
    advance();
    return operand;
}

/** `DATETIME('...')`, of which the name has been read. */
Operand Parser::readDateTimeCall(Operand operand) {
    advance();
    if (_token.kind != TokenKind::Text) {
        failExpected("a date-time in quotes");
    }
    const auto& text = std::get<std::string>(_token.value.data);
    if (!readDateTime(text)) {
        _lexer.fail(_token.offset, _token.describe() + " is no date-time");
    }
    operand.kind = Operand::Kind::value;
    operand.path.clear();
    operand.value = {CMPI_dateTime, DateTime{text}};
    advance();
    if (!takeSymbol(")")) {
        failExpected(")");
    }
    return operand;
}

void Parser::readPath(Operand& operand) {
    while (takeSymbol(".")) {
        operand.path.push_back(requireName("a property"));
    }
    if (_token.is("[") || _token.is("::")) {
        failUnsupported(_token.describe());
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
