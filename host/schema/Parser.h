/**
 * @file
 * The grammar of MOF, as far as qualifier and class declarations go (DSP0004 annex A, DSP0221).
 */
#pragma once

#include "host/schema/Declarations.h"
#include "host/schema/Lexer.h"

#include <functional>
#include <string>
#include <string_view>

namespace marlo::mof {

/** Reads the text of one file into declarations; throws Error. */
class Parser {
  public:
    /** Called for each `#pragma include` with the name as written and the namespace then in force. */
    using Include = std::function<void(const std::string& name, const Location& at, const std::string& nameSpace)>;

    /** `file` is an element of `declarations.files`; `nameSpace` is in force until the text names another. */
    Parser(std::string_view text, const std::string& file, std::string nameSpace, Declarations& declarations,
           Include include);

    void parse();

  private:
    void advance();
    [[noreturn]] void failExpecting(const std::string& what) const;
    void expect(char symbol, const std::string& where);
    bool accept(char symbol);
    bool acceptWord(std::string_view word);
    std::string takeName(const std::string& what);
    std::string takeString(const std::string& what);

    void parsePragma();
    void enterNameSpace(const std::string& name, const Location& at);
    void parseQualifierDeclaration();
    void parseScopes(QualifierDeclaration& declaration);
    void parseDeclaredFlavors(QualifierDeclaration& declaration);
    void parseFlavor(Flavors& flavors);
    QualifierUses parseQualifierList();
    QualifierUse parseQualifierUse();
    void parseClass(QualifierUses qualifiers);
    FeatureDeclaration parseFeature();
    ParameterDeclaration parseParameter();
    TypeUse parseType();
    CMPIType parseArrayBrackets(CMPIType type);
    Initializer parseInitializer();
    Initializer parseBracedInitializer();
    Literal parseLiteral();

    Lexer _lexer;
    std::string _nameSpace;
    Declarations& _declarations;
    Include _include;
    Token _token; ///< the one that is looked at
};

} // namespace marlo::mof
