/**
 * @file
 * How a schema is kept: classes and qualifier types with the namespaces that show them.
 */
#pragma once

#include "host/schema/Schema.h"

#include <deque>
#include <map>
#include <string>
#include <string_view>
#include <vector>

namespace marlo::mof {

/** Orders CIM names without regard to the case of ASCII letters. */
struct NameLess {
    bool operator()(std::string_view left, std::string_view right) const;
};

/** What one namespace shows. Keys and pointers point into the model's storage. */
struct NameSpace {
    std::string name;
    std::vector<const Class*> classes; ///< each after its superclass
    std::map<std::string_view, const Class*, NameLess> classesByName;
    std::vector<const QualifierType*> qualifierTypes;
    std::map<std::string_view, const QualifierType*, NameLess> qualifierTypesByName;

    [[nodiscard]] const Class* findClass(std::string_view className) const;
    [[nodiscard]] const QualifierType* findQualifierType(std::string_view qualifierName) const;
    /** True when the class is `ancestor` or derives from it; false for unknown classes. */
    [[nodiscard]] bool isA(std::string_view className, std::string_view ancestor) const;
};

struct Model {
    std::deque<Class> classes;
    std::deque<QualifierType> qualifierTypes;
    std::vector<NameSpace> nameSpaces;
};

} // namespace marlo::mof
