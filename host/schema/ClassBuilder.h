/**
 * @file
 * One class with everything that it inherits.
 */
#pragma once

#include "host/schema/Declarations.h"
#include "host/schema/Model.h"

#include <set>
#include <string>
#include <string_view>
#include <vector>

namespace marlo::mof {

/**
 * Puts what a class declares on top of what its superclass has, by the rules of DSP0004: overriding (5.6.3.34),
 * propagation of qualifiers (5.6.3), keys (5.6.3.22). Throws Error where the declaration breaks one.
 */
class ClassBuilder {
  public:
    /** `superClass` is null for a root; the namespace has the qualifier types. All outlive the builder. */
    ClassBuilder(const ClassDeclaration& declaration, const Class* superClass, const NameSpace& nameSpace);

    Class build();

  private:
    void inherit();
    void addProperty(const FeatureDeclaration& feature);
    void addMethod(const FeatureDeclaration& feature);
    std::vector<Parameter> buildParameters(const FeatureDeclaration& feature, const Method* inherited) const;
    Parameter buildParameter(const ParameterDeclaration& declaration, const std::string& method,
                             const Method* inherited) const;
    void checkOverride(const FeatureDeclaration& feature, const Qualifiers& qualifiers, bool isInherited,
                       const std::string& origin) const;
    void checkKeys(const Property& property, const FeatureDeclaration& feature) const;
    [[nodiscard]] std::vector<std::string_view> classScopes() const;
    [[nodiscard]] Qualifiers mergeQualifiers(const QualifierUses& uses, const Qualifiers& inherited,
                                             const std::vector<std::string_view>& scopes,
                                             const std::string& element) const;
    [[nodiscard]] Qualifier makeQualifier(const QualifierUse& use, const std::vector<std::string_view>& scopes,
                                          const std::string& element) const;

    const ClassDeclaration& _declaration;
    const Class* _superClass;
    const NameSpace& _nameSpace;
    Class _class;
    std::set<std::string_view, NameLess> _seen; ///< names of the features declared so far
};

} // namespace marlo::mof
