/**
 * @file
 * CIM classes and qualifiers as read from MOF (DSP0004, DSP0221).
 */
#pragma once

#include "host/model/Instance.h"

#include <map>
#include <memory>
#include <string>
#include <string_view>
#include <vector>

namespace marlo {

/** A qualifier of a class, property, method or parameter, with the flavors that are in force there (DSP0004 5.6.3).
 */
struct Qualifier {
    std::string name;
    Value value; ///< NULL of the qualifier's type where none is given
    bool overridable = true;
    bool toSubclass = true;
    bool translatable = false;
    bool propagated = false; ///< inherited, not given in the class itself
};

using Qualifiers = std::vector<Qualifier>;

/** The qualifier of a name, or null. */
const Qualifier* findQualifier(const Qualifiers& qualifiers, std::string_view name);

/** A qualifier declaration. */
struct QualifierType {
    std::string name;
    Value defaultValue; ///< its type is the qualifier's type
    std::vector<std::string> scopes;
    bool overridable = true;
    bool toSubclass = true;
    bool translatable = false;
    std::string file; ///< that declares it first
};

/** A property of a class, declared there or inherited. */
struct Property {
    std::string name;
    CMPIType type = CMPI_null;  ///< CMPI_ARRAY set for arrays
    std::string referenceClass; ///< for CMPI_ref
    Value defaultValue;         ///< NULL of the type where none is declared
    Qualifiers qualifiers;
    std::string origin; ///< the class that introduced it
    bool key = false;
    bool propagated = false; ///< inherited, not declared again in the class itself
};

struct Parameter {
    std::string name;
    CMPIType type = CMPI_null;
    std::string referenceClass;
    Qualifiers qualifiers;
    bool in = true;
    bool out = false;
};

struct Method {
    std::string name;
    CMPIType returnType = CMPI_null;
    std::vector<Parameter> parameters;
    Qualifiers qualifiers;
    std::string origin;
    bool propagated = false;
};

/** A class with everything it inherits: properties and methods of the superclasses first, overrides in their place.
 */
struct Class {
    std::string name;
    std::string superClass; ///< empty for a root
    std::vector<Property> properties;
    std::vector<Method> methods;
    Qualifiers qualifiers;
    bool isAbstract = false;
    bool isAssociation = false;
    bool isIndication = false;
    std::string file; ///< where it was declared
    int line = 0;

    [[nodiscard]] const Property* findProperty(std::string_view propertyName) const;
    [[nodiscard]] const Method* findMethod(std::string_view methodName) const;
    [[nodiscard]] std::vector<const Property*> keys() const;
};

/** All classes and qualifier types, by namespace. Immutable after reading; names are compared without case. */
class Schema {
  public:
    Schema();
    ~Schema();
    Schema(Schema&&) noexcept;
    Schema& operator=(Schema&&) noexcept;

    /**
     * Reads the MOF files (*.mof) of a directory, in the order of their names. Declarations that precede any
     * `#pragma namespace ("...")` of a file belong to every namespace that some file names; a class may come before
     * its superclass, a qualifier before its declaration. `#pragma include ("...")` reads a file beside the one that
     * includes it, in the namespace then in force; a file is read once however often it is named.
     * Throws std::runtime_error with file, line, column and reason for the first error; nothing of a wrong schema is
     * served.
     */
    static Schema readDirectory(const std::string& directory);

    /** The same of several directories, one after the other. One may be without files, but not all. */
    static Schema readDirectories(const std::vector<std::string>& directories);

    /** The same from one text, for tests; `name` stands for the file in messages. */
    static Schema readText(std::string_view text, const std::string& name);

    [[nodiscard]] std::vector<std::string> nameSpaces() const;
    [[nodiscard]] bool hasNameSpace(std::string_view nameSpace) const;
    /** A namespace as the schema spells it, or null. */
    [[nodiscard]] const std::string* findNameSpace(std::string_view nameSpace) const;
    [[nodiscard]] const Class* findClass(std::string_view nameSpace, std::string_view className) const;
    /** All classes of a namespace, each after its superclass. */
    [[nodiscard]] std::vector<const Class*> classes(std::string_view nameSpace) const;
    /** True when `className` is `ancestor` or derives from it; false for unknown classes. */
    [[nodiscard]] bool isA(std::string_view nameSpace, std::string_view className, std::string_view ancestor) const;
    /** The class itself and everything that derives from it, each after its superclass. */
    [[nodiscard]] std::vector<const Class*> withSubclasses(std::string_view nameSpace,
                                                           std::string_view className) const;
    [[nodiscard]] std::vector<const QualifierType*> qualifierTypes(std::string_view nameSpace) const;

  private:
    struct State;
    std::unique_ptr<State> _state;
};

} // namespace marlo
