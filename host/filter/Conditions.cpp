/**
 * @file
 * The conditions behind WHERE, and what they compare.
 */
#include "host/filter/Parser.h"
#include "host/model/DateTimeText.h"

#include <algorithm>
#include <array>

namespace marlo::filter {

namespace {

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
    if (each && atName()) {
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

} // namespace marlo::filter
