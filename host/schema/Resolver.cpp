#include "host/schema/Resolver.h"

#include "host/schema/ClassBuilder.h"
#include "host/schema/Literals.h"

#include <map>
#include <set>
#include <string_view>
#include <utility>

namespace marlo::mof {

namespace {

std::string showPlace(const Location& at) {
    return *at.file + ":" + std::to_string(at.line);
}

/** Fills one namespace with the declarations that are made for it. */
class NameSpaceResolver {
  public:
    NameSpaceResolver(const Declarations& declarations, Model& model, NameSpace& nameSpace)
        : _declarations(declarations), _model(model), _nameSpace(nameSpace) {}

    void resolve() {
        for (const QualifierDeclaration& declaration : _declarations.qualifiers) {
            if (equalNames(declaration.nameSpace, _nameSpace.name)) {
                addQualifierType(declaration);
            }
        }
        collectClasses();
        for (const ClassDeclaration* declaration : _inOrder) {
            addWithSuperClasses(*declaration);
        }
        for (const ClassDeclaration* declaration : _inOrder) {
            checkReferences(*declaration);
        }
    }

  private:
    void addQualifierType(const QualifierDeclaration& declaration);
    void collectClasses();
    void addWithSuperClasses(const ClassDeclaration& declaration);
    [[nodiscard]] const ClassDeclaration* pendingSuperClass(const ClassDeclaration& declaration) const;
    void addClass(const ClassDeclaration& declaration);
    void checkReferences(const ClassDeclaration& declaration) const;
    void checkReference(const ClassDeclaration& declaration, const TypeUse& type) const;

    const Declarations& _declarations;
    Model& _model;
    NameSpace& _nameSpace;
    std::vector<const ClassDeclaration*> _inOrder;
    std::map<std::string_view, const ClassDeclaration*, NameLess> _declared;
};

void NameSpaceResolver::addQualifierType(const QualifierDeclaration& declaration) {
    if (const QualifierType* const earlier = _nameSpace.findQualifierType(declaration.name)) {
        // MOF of other makers declares the qualifiers that it uses: the first declaration holds for all.
        if (earlier->file == *declaration.at.file || earlier->defaultValue.type != declaration.type) {
            throw Error(declaration.at, "qualifier " + declaration.name + " is declared already");
        }
        return;
    }
    QualifierType type;
    type.name = declaration.name;
    type.file = *declaration.at.file;
    type.defaultValue = declaration.defaultValue ? makeValue(declaration.type, *declaration.defaultValue,
                                                             "the default of qualifier " + declaration.name)
                                                 : Value::null(declaration.type);
    type.scopes = declaration.scopes;
    type.overridable = declaration.flavors.overridable.value_or(true);
    type.toSubclass = declaration.flavors.toSubclass.value_or(true);
    type.translatable = declaration.flavors.translatable.value_or(false);
    const QualifierType& stored = _model.qualifierTypes.emplace_back(std::move(type));
    _nameSpace.qualifierTypes.push_back(&stored);
    _nameSpace.qualifierTypesByName.emplace(stored.name, &stored);
}

void NameSpaceResolver::collectClasses() {
    for (const ClassDeclaration& declaration : _declarations.classes) {
        if (!equalNames(declaration.nameSpace, _nameSpace.name)) {
            continue;
        }
        const Class* const common = _nameSpace.findClass(declaration.name);
        if (common != nullptr) {
            throw Error(declaration.at, "class " + declaration.name + " is declared already, at " + common->file +
                                            ":" + std::to_string(common->line));
        }
        const auto [entry, isNew] = _declared.emplace(declaration.name, &declaration);
        if (!isNew) {
            throw Error(declaration.at,
                        "class " + declaration.name + " is declared already, at " + showPlace(entry->second->at));
        }
        _inOrder.push_back(&declaration);
    }
}

/** Adds the superclasses that are still missing, then the class: without recursion, however long the line is. */
void NameSpaceResolver::addWithSuperClasses(const ClassDeclaration& declaration) {
    std::vector<const ClassDeclaration*> line;
    std::set<const ClassDeclaration*> inLine;
    const ClassDeclaration* next = _nameSpace.findClass(declaration.name) == nullptr ? &declaration : nullptr;
    while (next != nullptr) {
        if (!inLine.insert(next).second) {
            throw Error(next->superAt, "class " + next->name + " derives from itself");
        }
        line.push_back(next);
        next = pendingSuperClass(*next);
    }
    for (; !line.empty(); line.pop_back()) {
        addClass(*line.back());
    }
}

/** The declaration of the superclass where it is not resolved yet; null where there is nothing to be done before. */
const ClassDeclaration* NameSpaceResolver::pendingSuperClass(const ClassDeclaration& declaration) const {
    if (declaration.superClass.empty() || _nameSpace.findClass(declaration.superClass) != nullptr) {
        return nullptr;
    }
    const auto found = _declared.find(declaration.superClass);
    if (found == _declared.end()) {
        throw Error(declaration.superAt,
                    "superclass " + declaration.superClass + " of " + declaration.name + " is not declared");
    }
    return found->second;
}

void NameSpaceResolver::addClass(const ClassDeclaration& declaration) {
    const Class* const superClass = _nameSpace.findClass(declaration.superClass);
    const Class& stored = _model.classes.emplace_back(ClassBuilder(declaration, superClass, _nameSpace).build());
    _nameSpace.classes.push_back(&stored);
    _nameSpace.classesByName.emplace(stored.name, &stored);
}

void NameSpaceResolver::checkReferences(const ClassDeclaration& declaration) const {
    const Class* const superClass = _nameSpace.findClass(declaration.superClass);
    for (const FeatureDeclaration& feature : declaration.features) {
        checkReference(declaration, feature.type);
        for (const ParameterDeclaration& parameter : feature.parameters) {
            checkReference(declaration, parameter.type);
        }
        const Property* const inherited = superClass == nullptr ? nullptr : superClass->findProperty(feature.name);
        if (inherited != nullptr && !feature.isMethod && feature.type.type == CMPI_ref &&
            !_nameSpace.isA(feature.type.referenceClass, inherited->referenceClass)) {
            throw Error(feature.type.at, "property " + declaration.name + "." + feature.name +
                                             " overrides a reference to " + inherited->referenceClass + ", which " +
                                             feature.type.referenceClass + " does not derive from");
        }
    }
}

void NameSpaceResolver::checkReference(const ClassDeclaration& declaration, const TypeUse& type) const {
    if ((type.type & ~CMPI_ARRAY) == CMPI_ref && _nameSpace.findClass(type.referenceClass) == nullptr) {
        throw Error(type.at, "class " + declaration.name + " refers to class " + type.referenceClass +
                                 ", which is not declared");
    }
}

} // namespace

Model resolve(const Declarations& declarations) {
    Model model;
    NameSpace common;
    NameSpaceResolver(declarations, model, common).resolve();
    for (const std::string& name : declarations.nameSpaces) {
        NameSpace& nameSpace = model.nameSpaces.emplace_back(common);
        nameSpace.name = name;
        NameSpaceResolver(declarations, model, nameSpace).resolve();
    }
    return model;
}

} // namespace marlo::mof
