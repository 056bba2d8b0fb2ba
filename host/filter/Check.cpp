#include "host/filter/Compare.h"
#include "host/filter/Filter.h"
#include "host/model/DateTimeText.h"
#include "host/schema/Schema.h"

#include <optional>

namespace marlo::filter {

namespace {

std::string typeText(CMPIType type) {
    return typeName(type) + ((type & CMPI_ARRAY) != 0 ? "[]" : "");
}

/** The class that an embedded instance of a property is of; empty where any may be in it. */
std::optional<std::string> embeddedClassOf(const Property& property) {
    if (const Qualifier* found = findQualifier(property.qualifiers, "EmbeddedInstance")) {
        const auto* name = std::get_if<std::string>(&found->value.data);
        return name == nullptr ? std::string() : *name;
    }
    const bool any =
        findQualifier(property.qualifiers, "EmbeddedObject") != nullptr || property.type == CMPI_instance;
    return any ? std::optional<std::string>("") : std::nullopt;
}

class Checker {
  public:
    Checker(const Schema& schema, const std::string& nameSpace, const std::string& text)
        : _schema(schema), _nameSpace(nameSpace), _text(text) {}

    void setClass(const std::string& name, std::size_t offset) {
        _class = _schema.findClass(_nameSpace, name);
        if (_class == nullptr) {
            fail(offset, "there is no class '" + name + "' in " + _nameSpace, CMPI_RC_ERR_INVALID_CLASS);
        }
    }

    void check(const Condition& condition) const {
        switch (condition.kind) {
        case Condition::Kind::all:
        case Condition::Kind::any:
        case Condition::Kind::negation:
            for (const Condition& child : condition.children) {
                check(child);
            }
            break;
        case Condition::Kind::comparison:
            checkComparison(condition);
            break;
        case Condition::Kind::nullTest:
            requireProperty(condition.left);
            break;
        case Condition::Kind::like:
            checkLike(condition);
            break;
        case Condition::Kind::isA:
            checkIsA(condition);
            break;
        }
    }

    /** The property of a name, or null when it lies in an embedded instance of which the class is not known. */
    const Property* requireProperty(const Operand& operand) const {
        const Class* within = _class;
        const Property* property = nullptr;
        for (const std::string& name : operand.path) {
            if (property != nullptr) {
                const auto embedded = embeddedClassOf(*property);
                if (!embedded) {
                    fail(operand.offset, _class->name + "." + property->name + " holds no instance");
                }
                within = _schema.findClass(_nameSpace, *embedded);
                if (within == nullptr) {
                    return nullptr;
                }
            }
            property = within->findProperty(name);
            if (property == nullptr) {
                fail(operand.offset, within->name + " has no property '" + name + "'");
            }
        }
        return property;
    }

  private:
    [[noreturn]] void fail(std::size_t offset, const std::string& reason,
                           CMPIrc code = CMPI_RC_ERR_INVALID_QUERY) const {
        throw Error(code, _text, offset, reason);
    }

    /** The type of one side; none when it cannot be told. */
    [[nodiscard]] std::optional<CMPIType> typeOf(const Operand& operand) const {
        if (operand.kind == Operand::Kind::self) {
            fail(operand.offset, "an instance compares with nothing");
        }
        if (operand.kind == Operand::Kind::value) {
            return operand.value.type;
        }
        const Property* property = requireProperty(operand);
        if (property == nullptr) {
            return std::nullopt;
        }
        if (familyOf(property->type) == Family::none) {
            fail(operand.offset, "'" + property->name + "' is of type " + typeText(property->type) +
                                     ", which compares with nothing but NULL");
        }
        return property->type;
    }

    void checkComparison(const Condition& condition) const {
        const auto left = typeOf(condition.left);
        const auto right = typeOf(condition.right);
        if (!left || !right) {
            return;
        }
        if (!areComparable(condition.left, *left, condition.right, *right)) {
            fail(condition.offset, typeText(*left) + " and " + typeText(*right) + " cannot be compared");
        }
        const bool ordered = condition.relation != Relation::equal && condition.relation != Relation::notEqual;
        if (ordered && familyOf(*left) == Family::truth) {
            fail(condition.offset, "of booleans none is the greater");
        }
        checkDateTime(condition.left, *right);
        checkDateTime(condition.right, *left);
    }

    static bool areComparable(const Operand& left, CMPIType leftType, const Operand& right, CMPIType rightType) {
        const Family one = familyOf(leftType);
        const Family other = familyOf(rightType);
        const auto isText = [](Family family) { return family == Family::text || family == Family::character; };
        // A text stands for a date-time where it is written so; a property that holds texts does not.
        const bool dateTime =
            (one == Family::dateTime && other == Family::text && right.kind == Operand::Kind::value) ||
            (other == Family::dateTime && one == Family::text && left.kind == Operand::Kind::value);
        return one == other || dateTime || (isText(one) && isText(other));
    }

    void checkDateTime(const Operand& operand, CMPIType comparedWith) const {
        const auto* text = std::get_if<std::string>(&operand.value.data);
        if (comparedWith == CMPI_dateTime && text != nullptr && !readDateTime(*text)) {
            fail(operand.offset, "'" + *text + "' is no date-time");
        }
    }

    void checkLike(const Condition& condition) const {
        const auto type = typeOf(condition.left);
        if (type && *type != CMPI_string) {
            fail(condition.left.offset, "only texts are LIKE a pattern, which " + typeText(*type) + " is not");
        }
    }

    void checkIsA(const Condition& condition) const {
        const Property* property =
            condition.left.kind == Operand::Kind::property ? requireProperty(condition.left) : nullptr;
        if (property != nullptr && !embeddedClassOf(*property)) {
            fail(condition.left.offset, "'" + property->name + "' holds no instance");
        }
        if (_schema.findClass(_nameSpace, condition.className) == nullptr) {
            fail(condition.right.offset, "there is no class '" + condition.className + "' in " + _nameSpace);
        }
    }

    const Schema& _schema;
    const std::string& _nameSpace;
    const std::string& _text;
    const Class* _class = nullptr;
};

} // namespace

void Filter::check(const Schema& schema, const std::string& nameSpace) const {
    Checker checker(schema, nameSpace, _text);
    checker.setClass(_className, _classOffset);
    for (const Operand& selected : _selected) {
        if (selected.kind == Operand::Kind::property) {
            static_cast<void>(checker.requireProperty(selected));
        }
    }
    checker.check(_condition);
}

} // namespace marlo::filter
