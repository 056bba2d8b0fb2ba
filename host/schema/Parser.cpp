#include "host/schema/Parser.h"

#include "host/model/Instance.h"
#include "host/schema/Literals.h"

#include <algorithm>
#include <array>
#include <utility>

namespace marlo::mof {

namespace {

constexpr std::array<std::string_view, 10> Scopes = {"schema",    "class",    "association", "indication",
                                                     "qualifier", "property", "reference",   "method",
                                                     "parameter", "any"};

std::string lowerCase(std::string text) {
    std::transform(text.begin(), text.end(), text.begin(),
                   [](char c) { return c >= 'A' && c <= 'Z' ? static_cast<char>(c + ('a' - 'A')) : c; });
    return text;
}

} // namespace

Parser::Parser(std::string_view text, const std::string& file, std::string nameSpace, Declarations& declarations,
               Include include)
    : _lexer(text, file),
      _nameSpace(std::move(nameSpace)),
      _declarations(declarations),
      _include(std::move(include)) {}

void Parser::advance() {
    _token = _lexer.next();
}

void Parser::failExpecting(const std::string& what) const {
    throw Error(_token.at, "expected " + what + ", found " + _token.describe());
}

void Parser::expect(char symbol, const std::string& where) {
    if (!accept(symbol)) {
        failExpecting(std::string("'") + symbol + "' " + where);
    }
}

bool Parser::accept(char symbol) {
    const bool found = _token.is(symbol);
    if (found) {
        advance();
    }
    return found;
}

bool Parser::acceptWord(std::string_view word) {
    const bool found = _token.isWord(word);
    if (found) {
        advance();
    }
    return found;
}

std::string Parser::takeName(const std::string& what) {
    if (_token.kind != TokenKind::Identifier) {
        failExpecting(what);
    }
    std::string name(_token.text);
    advance();
    return name;
}

/** One string of all the string literals that follow each other. */
std::string Parser::takeString(const std::string& what) {
    if (_token.kind != TokenKind::String) {
        failExpecting(what);
    }
    std::string text;
    while (_token.kind == TokenKind::String) {
        text += _token.value;
        advance();
    }
    return text;
}

void Parser::parse() {
    advance();
    while (_token.kind != TokenKind::End) {
        if (accept('#')) {
            parsePragma();
        } else if (acceptWord("qualifier")) {
            parseQualifierDeclaration();
        } else if (_token.is('[') || _token.isWord("class")) {
            parseClass(parseQualifierList());
        } else if (_token.isWord("instance")) {
            throw Error(_token.at, "instances are not read here: a schema holds classes and qualifiers");
        } else {
            failExpecting("a class, a qualifier declaration or a #pragma");
        }
    }
}

void Parser::parsePragma() {
    if (!acceptWord("pragma")) {
        failExpecting("'pragma' behind '#'");
    }
    const std::string name = takeName("the name of a pragma");
    expect('(', "behind #pragma " + name);
    const Location at = _token.at;
    std::string argument = takeString("a quoted argument of #pragma " + name);
    while (accept(',')) {
        takeString("a quoted argument of #pragma " + name);
    }
    expect(')', "behind the argument of #pragma " + name);
    if (equalNames(name, "namespace")) {
        enterNameSpace(argument, at);
    } else if (equalNames(name, "include")) {
        _include(argument, at, _nameSpace);
    }
    // Any other pragma (locale, instancelocale, source...) says nothing about classes; DSP0221 has it ignored.
}

void Parser::enterNameSpace(const std::string& name, const Location& at) {
    const std::size_t first = name.find_first_not_of('/');
    if (first == std::string::npos) {
        throw Error(at, "expected the name of a namespace, found \"" + name + "\"");
    }
    if (name.starts_with("//")) {
        throw Error(at, "a namespace of another host cannot be declared here: \"" + name + "\"");
    }
    _nameSpace = name.substr(first, name.find_last_not_of('/') - first + 1);
    auto& known = _declarations.nameSpaces;
    const bool isKnown =
        std::any_of(known.begin(), known.end(), [this](const auto& other) { return equalNames(other, _nameSpace); });
    if (!isKnown) {
        known.push_back(_nameSpace);
    }
}

void Parser::parseQualifierDeclaration() {
    QualifierDeclaration declaration;
    declaration.nameSpace = _nameSpace;
    declaration.at = _token.at;
    declaration.name = takeName("the name of the qualifier");
    expect(':', "behind qualifier " + declaration.name);
    declaration.type = findType(_token.text);
    if (declaration.type == CMPI_null) {
        failExpecting("the type of qualifier " + declaration.name);
    }
    advance();
    declaration.type = parseArrayBrackets(declaration.type);
    if (accept('=')) {
        declaration.defaultValue = parseInitializer();
    }
    expect(',', "and the scope of qualifier " + declaration.name);
    parseScopes(declaration);
    parseDeclaredFlavors(declaration);
    expect(';', "behind qualifier " + declaration.name);
    _declarations.qualifiers.push_back(std::move(declaration));
}

void Parser::parseScopes(QualifierDeclaration& declaration) {
    if (!acceptWord("scope")) {
        failExpecting("Scope(...) of qualifier " + declaration.name);
    }
    expect('(', "behind Scope");
    do {
        const Location at = _token.at;
        std::string scope = lowerCase(takeName("a scope"));
        if (std::find(Scopes.begin(), Scopes.end(), scope) == Scopes.end()) {
            throw Error(at, "'" + scope + "' is no scope of a qualifier");
        }
        declaration.scopes.push_back(std::move(scope));
    } while (accept(','));
    expect(')', "behind the scopes");
}

void Parser::parseDeclaredFlavors(QualifierDeclaration& declaration) {
    if (!accept(',')) {
        return;
    }
    if (!acceptWord("flavor")) {
        failExpecting("Flavor(...) of qualifier " + declaration.name);
    }
    expect('(', "behind Flavor");
    do {
        parseFlavor(declaration.flavors);
    } while (accept(','));
    expect(')', "behind the flavors");
}

void Parser::parseFlavor(Flavors& flavors) {
    const Location at = _token.at;
    const std::string name = takeName("a flavor");
    const auto set = [&](std::optional<bool>& flavor, bool value) {
        if (flavor.has_value() && *flavor != value) {
            throw Error(at, "flavor " + name + " contradicts the one before it");
        }
        flavor = value;
    };
    if (equalNames(name, "EnableOverride")) {
        set(flavors.overridable, true);
    } else if (equalNames(name, "DisableOverride")) {
        set(flavors.overridable, false);
    } else if (equalNames(name, "ToSubclass")) {
        set(flavors.toSubclass, true);
    } else if (equalNames(name, "Restricted")) {
        set(flavors.toSubclass, false);
    } else if (equalNames(name, "Translatable")) {
        set(flavors.translatable, true);
    } else {
        throw Error(at, "'" + name + "' is no flavor of a qualifier");
    }
}

QualifierUses Parser::parseQualifierList() {
    QualifierUses uses;
    if (!accept('[')) {
        return uses;
    }
    do {
        uses.push_back(parseQualifierUse());
    } while (accept(','));
    expect(']', "behind the qualifiers");
    return uses;
}

QualifierUse Parser::parseQualifierUse() {
    QualifierUse use;
    use.at = _token.at;
    use.name = takeName("a qualifier");
    if (_token.is('{')) {
        use.value = parseInitializer();
    } else if (accept('(')) {
        use.value = parseInitializer();
        expect(')', "behind the value of qualifier " + use.name);
    }
    if (accept(':')) {
        do {
            parseFlavor(use.flavors);
        } while (_token.kind == TokenKind::Identifier);
    }
    return use;
}

void Parser::parseClass(QualifierUses qualifiers) {
    ClassDeclaration declaration;
    declaration.nameSpace = _nameSpace;
    declaration.qualifiers = std::move(qualifiers);
    if (!acceptWord("class")) {
        failExpecting("'class' behind its qualifiers");
    }
    declaration.at = _token.at;
    declaration.name = takeName("the name of the class");
    if (accept(':')) {
        declaration.superAt = _token.at;
        declaration.superClass = takeName("the superclass of " + declaration.name);
    }
    expect('{', "and the properties of class " + declaration.name);
    while (!accept('}')) {
        declaration.features.push_back(parseFeature());
    }
    expect(';', "behind class " + declaration.name);
    _declarations.classes.push_back(std::move(declaration));
}

FeatureDeclaration Parser::parseFeature() {
    FeatureDeclaration feature;
    feature.qualifiers = parseQualifierList();
    feature.type = parseType();
    feature.at = _token.at;
    feature.name = takeName("the name of a property or method");
    if (accept('(')) {
        feature.isMethod = true;
        while (!_token.is(')')) {
            feature.parameters.push_back(parseParameter());
            if (!accept(',')) {
                break;
            }
        }
        expect(')', "behind the parameters of " + feature.name);
    } else {
        feature.type.type = parseArrayBrackets(feature.type.type);
        if (accept('=')) {
            feature.defaultValue = parseInitializer();
        }
    }
    expect(';', "behind " + feature.name);
    return feature;
}

ParameterDeclaration Parser::parseParameter() {
    ParameterDeclaration parameter;
    parameter.qualifiers = parseQualifierList();
    parameter.type = parseType();
    parameter.at = _token.at;
    parameter.name = takeName("the name of a parameter");
    parameter.type.type = parseArrayBrackets(parameter.type.type);
    return parameter;
}

TypeUse Parser::parseType() {
    TypeUse use;
    use.at = _token.at;
    const Token name = _token;
    if (name.kind != TokenKind::Identifier) {
        failExpecting("a type, or '}' at the end of the class");
    }
    advance();
    if (acceptWord("ref")) {
        use.type = CMPI_ref;
        use.referenceClass = std::string(name.text);
        return use;
    }
    use.type = findType(name.text);
    if (use.type == CMPI_null) {
        throw Error(name.at,
                    name.describe() + " is no CIM type; a reference is written " + std::string(name.text) + " REF");
    }
    return use;
}

/** `[]` or `[4]`: CMPI has no place for the length of an array, DSP0004 makes it a hint. */
CMPIType Parser::parseArrayBrackets(CMPIType type) {
    if (!accept('[')) {
        return type;
    }
    if (_token.kind == TokenKind::Integer) {
        advance();
    }
    expect(']', "of the array");
    return static_cast<CMPIType>(type | CMPI_ARRAY);
}

Initializer Parser::parseInitializer() {
    if (_token.is('{')) {
        return parseBracedInitializer();
    }
    Initializer initializer;
    initializer.at = _token.at;
    initializer.elements.push_back(parseLiteral());
    return initializer;
}

Initializer Parser::parseBracedInitializer() {
    Initializer initializer;
    initializer.at = _token.at;
    initializer.isArray = true;
    expect('{', "");
    if (!_token.is('}')) {
        do {
            initializer.elements.push_back(parseLiteral());
        } while (accept(','));
    }
    expect('}', "behind the values");
    return initializer;
}

Literal Parser::parseLiteral() {
    Literal literal;
    literal.at = _token.at;
    literal.magnitude = _token.magnitude;
    literal.negative = _token.negative;
    literal.real = _token.real;
    if (_token.kind == TokenKind::String) {
        literal.kind = Literal::Kind::String;
        literal.text = takeString("a string");
        return literal;
    }
    if (_token.kind == TokenKind::Integer) {
        literal.kind = Literal::Kind::Integer;
    } else if (_token.kind == TokenKind::Real) {
        literal.kind = Literal::Kind::Real;
    } else if (_token.kind == TokenKind::Character) {
        literal.kind = Literal::Kind::Character;
    } else if (_token.isWord("true") || _token.isWord("false")) {
        literal.kind = Literal::Kind::Boolean;
        literal.truth = _token.isWord("true");
    } else if (!_token.isWord("null")) {
        failExpecting("a value");
    }
    advance();
    return literal;
}

} // namespace marlo::mof
