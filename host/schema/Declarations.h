/**
 * @file
 * MOF declarations as they were written, before anything is inherited or checked against anything else.
 */
#pragma once

#include "host/schema/Lexer.h"

#include <cstdint>
#include <list>
#include <optional>
#include <string>
#include <vector>

#include <cmpidt.h>

namespace marlo::mof {

struct Literal {
    enum class Kind { Null, Boolean, Integer, Real, Character, String };

    Kind kind = Kind::Null;
    bool truth = false;
    bool negative = false;
    std::uint64_t magnitude = 0; ///< of an integer or a character
    double real = 0;
    std::string text; ///< of a string
    Location at;
};

/** One value, or a list of them in braces. */
struct Initializer {
    bool isArray = false;
    std::vector<Literal> elements;
    Location at;
};

/** Flavors, each where it was written. */
struct Flavors {
    std::optional<bool> overridable;
    std::optional<bool> toSubclass;
    std::optional<bool> translatable;
};

struct QualifierUse {
    std::string name;
    std::optional<Initializer> value;
    Flavors flavors;
    Location at;
};

using QualifierUses = std::vector<QualifierUse>;

/** The type of a feature or parameter. */
struct TypeUse {
    CMPIType type = CMPI_null;  ///< CMPI_ARRAY set for arrays
    std::string referenceClass; ///< for CMPI_ref
    Location at;
};

struct ParameterDeclaration {
    std::string name;
    TypeUse type;
    QualifierUses qualifiers;
    Location at;
};

/** A property, or a method with its return type. */
struct FeatureDeclaration {
    std::string name;
    TypeUse type;
    QualifierUses qualifiers;
    std::optional<Initializer> defaultValue;
    bool isMethod = false;
    std::vector<ParameterDeclaration> parameters;
    Location at;
};

struct ClassDeclaration {
    std::string nameSpace; ///< empty: every namespace
    std::string name;
    std::string superClass;
    QualifierUses qualifiers;
    std::vector<FeatureDeclaration> features;
    Location at;
    Location superAt;
};

struct QualifierDeclaration {
    std::string nameSpace; ///< empty: every namespace
    std::string name;
    CMPIType type = CMPI_null;
    std::optional<Initializer> defaultValue;
    std::vector<std::string> scopes; ///< lower case
    Flavors flavors;
    Location at;
};

struct Declarations {
    std::list<std::string> files; ///< locations point here
    std::vector<std::string> nameSpaces;
    std::vector<QualifierDeclaration> qualifiers;
    std::vector<ClassDeclaration> classes;
};

} // namespace marlo::mof
