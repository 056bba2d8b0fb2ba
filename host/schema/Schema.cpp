#include "host/schema/Schema.h"

#include "host/schema/Model.h"
#include "host/schema/Reader.h"
#include "host/schema/Resolver.h"

#include <algorithm>
#include <utility>

namespace marlo {

namespace {

char foldCase(char c) {
    return c >= 'A' && c <= 'Z' ? static_cast<char>(c + ('a' - 'A')) : c;
}

template <class Element>
const Element* findElement(const std::vector<Element>& elements, std::string_view name) {
    const auto found = std::find_if(elements.begin(), elements.end(),
                                    [name](const Element& element) { return equalNames(element.name, name); });
    return found == elements.end() ? nullptr : &*found;
}

} // namespace

namespace mof {

bool NameLess::operator()(std::string_view left, std::string_view right) const {
    return std::lexicographical_compare(left.begin(), left.end(), right.begin(), right.end(),
                                        [](char one, char other) { return foldCase(one) < foldCase(other); });
}

const Class* NameSpace::findClass(std::string_view className) const {
    const auto found = classesByName.find(className);
    return found == classesByName.end() ? nullptr : found->second;
}

const QualifierType* NameSpace::findQualifierType(std::string_view qualifierName) const {
    const auto found = qualifierTypesByName.find(qualifierName);
    return found == qualifierTypesByName.end() ? nullptr : found->second;
}

bool NameSpace::isA(std::string_view className, std::string_view ancestor) const {
    for (const Class* next = findClass(className); next != nullptr; next = findClass(next->superClass)) {
        if (equalNames(next->name, ancestor)) {
            return true;
        }
    }
    return false;
}

} // namespace mof

struct Schema::State {
    mof::Model model;

    [[nodiscard]] const mof::NameSpace* find(std::string_view nameSpace) const {
        return findElement(model.nameSpaces, nameSpace);
    }
};

const Qualifier* findQualifier(const Qualifiers& qualifiers, std::string_view name) {
    return findElement(qualifiers, name);
}

const Property* Class::findProperty(std::string_view propertyName) const {
    return findElement(properties, propertyName);
}

const Method* Class::findMethod(std::string_view methodName) const {
    return findElement(methods, methodName);
}

std::vector<const Property*> Class::keys() const {
    std::vector<const Property*> found;
    for (const Property& property : properties) {
        if (property.key) {
            found.push_back(&property);
        }
    }
    return found;
}

Schema::Schema() : _state(std::make_unique<State>()) {}

Schema::~Schema() = default;
Schema::Schema(Schema&&) noexcept = default;
Schema& Schema::operator=(Schema&&) noexcept = default;

Schema Schema::readDirectory(const std::string& directory) {
    return readDirectories({directory});
}

Schema Schema::readDirectories(const std::vector<std::string>& directories) {
    Schema schema;
    schema._state->model = mof::resolve(mof::readDirectories(directories));
    return schema;
}

Schema Schema::readText(std::string_view text, const std::string& name) {
    Schema schema;
    schema._state->model = mof::resolve(mof::readText(text, name));
    return schema;
}

std::vector<std::string> Schema::nameSpaces() const {
    std::vector<std::string> names;
    for (const mof::NameSpace& nameSpace : _state->model.nameSpaces) {
        names.push_back(nameSpace.name);
    }
    return names;
}

bool Schema::hasNameSpace(std::string_view nameSpace) const {
    return _state->find(nameSpace) != nullptr;
}

const std::string* Schema::findNameSpace(std::string_view nameSpace) const {
    const mof::NameSpace* const found = _state->find(nameSpace);
    return found == nullptr ? nullptr : &found->name;
}

const Class* Schema::findClass(std::string_view nameSpace, std::string_view className) const {
    const mof::NameSpace* const found = _state->find(nameSpace);
    return found == nullptr ? nullptr : found->findClass(className);
}

std::vector<const Class*> Schema::classes(std::string_view nameSpace) const {
    const mof::NameSpace* const found = _state->find(nameSpace);
    return found == nullptr ? std::vector<const Class*>{} : found->classes;
}

bool Schema::isA(std::string_view nameSpace, std::string_view className, std::string_view ancestor) const {
    const mof::NameSpace* const found = _state->find(nameSpace);
    return found != nullptr && found->isA(className, ancestor);
}

std::vector<const Class*> Schema::withSubclasses(std::string_view nameSpace, std::string_view className) const {
    std::vector<const Class*> result;
    const mof::NameSpace* const found = _state->find(nameSpace);
    if (found == nullptr) {
        return result;
    }
    std::copy_if(found->classes.begin(), found->classes.end(), std::back_inserter(result),
                 [&](const Class* candidate) { return found->isA(candidate->name, className); });
    return result;
}

std::vector<const QualifierType*> Schema::qualifierTypes(std::string_view nameSpace) const {
    const mof::NameSpace* const found = _state->find(nameSpace);
    return found == nullptr ? std::vector<const QualifierType*>{} : found->qualifierTypes;
}

} // namespace marlo
