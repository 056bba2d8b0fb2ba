#include "host/filter/Compare.h"
#include "host/filter/Filter.h"

#include <algorithm>

namespace marlo::filter {

namespace {

Truth truthOf(bool value) {
    return value ? Truth::yes : Truth::no;
}

Truth negate(Truth truth) {
    return truth == Truth::unknown ? truth : truthOf(truth == Truth::no);
}

/** The instance that a value holds; null where it holds none. */
const Instance* embeddedIn(const Value& value) {
    const auto* instance = std::get_if<std::shared_ptr<const Instance>>(&value.data);
    return instance == nullptr ? nullptr : instance->get();
}

class Evaluation {
  public:
    explicit Evaluation(const Subject& subject) : _subject(subject) {}

    [[nodiscard]] Truth evaluate(const Condition& condition) const {
        switch (condition.kind) {
        case Condition::Kind::all:
        case Condition::Kind::any:
            return join(condition);
        case Condition::Kind::negation:
            return negate(evaluate(condition.children.front()));
        case Condition::Kind::comparison:
            return compareSides(condition);
        case Condition::Kind::nullTest:
            return truthOf(valueOf(condition.left).isNull() && condition.left.kind != Operand::Kind::self);
        case Condition::Kind::like:
            return evaluateLike(condition);
        case Condition::Kind::isA:
            return evaluateIsA(condition);
        }
        return Truth::unknown;
    }

  private:
    /** The least of all for AND, the greatest for OR; the first that decides ends it. */
    [[nodiscard]] Truth join(const Condition& condition) const {
        const bool all = condition.kind == Condition::Kind::all;
        Truth joined = all ? Truth::yes : Truth::no;
        const Truth decided = negate(joined);
        for (const Condition& child : condition.children) {
            const Truth truth = evaluate(child);
            joined = all ? std::min(joined, truth) : std::max(joined, truth);
            if (joined == decided) {
                break;
            }
        }
        return joined;
    }

    [[nodiscard]] const Value& valueOf(const Operand& operand) const {
        if (operand.kind != Operand::Kind::property) {
            return operand.value;
        }
        const Value* value = _subject.property(operand.path.front());
        for (std::size_t i = 1; i < operand.path.size() && value != nullptr; ++i) {
            const Instance* embedded = embeddedIn(*value);
            const NamedValue* found = embedded == nullptr ? nullptr : findName(embedded->properties, operand.path[i]);
            value = found == nullptr ? nullptr : &found->value;
        }
        return value == nullptr ? _null : *value;
    }

    [[nodiscard]] Truth compareSides(const Condition& condition) const {
        const Value left = valueOf(condition.left); // asking for the other side may end it
        return compare(left, condition.relation, valueOf(condition.right));
    }

    [[nodiscard]] Truth evaluateLike(const Condition& condition) const {
        const auto* text = std::get_if<std::string>(&valueOf(condition.left).data);
        return text == nullptr ? Truth::unknown : truthOf(condition.pattern.matches(*text));
    }

    [[nodiscard]] Truth evaluateIsA(const Condition& condition) const {
        std::string_view name = _subject.className();
        if (condition.left.kind == Operand::Kind::property) {
            const Instance* embedded = embeddedIn(valueOf(condition.left));
            name = embedded == nullptr ? std::string_view() : embedded->path.className;
        }
        return name.empty() ? Truth::unknown : truthOf(_subject.isA(name, condition.className));
    }

    const Subject& _subject;
    const Value _null;
};

} // namespace

Truth Filter::evaluate(const Subject& subject) const {
    return Evaluation(subject).evaluate(_condition);
}

bool Filter::matches(const Subject& subject) const {
    return subject.isA(subject.className(), _className) && evaluate(subject) == Truth::yes;
}

} // namespace marlo::filter
