/**
 * @file
 * Filters: SELECT statements over one class, in WQL and in the part of CQL (DSP0202) that says the same.
 *
 *     SELECT * | name [, name ...]  FROM class [[AS] alias]  [WHERE condition]
 *
 * Conditions compare properties, and values, by `=`, `<>` (or `!=`), `<`, `<=`, `>`, `>=`, `[NOT] LIKE 'pattern'`,
 * `IS [NOT] NULL` and `[NOT] ISA class`, joined by AND, OR, NOT and parentheses. Values are texts, numbers, TRUE and
 * FALSE; date-times are texts of 25 characters (DSP0004), in CQL also `DATETIME('...')`. Keywords and names are
 * compared without case. A name may be preceded by the class or its alias (`class.name`) and leads into embedded
 * instances by points. The instance itself is `__this`, the class or its alias. A class behind ISA may be quoted.
 */
#pragma once

#include "host/filter/Error.h"
#include "host/filter/Pattern.h"
#include "host/model/Instance.h"

#include <optional>
#include <string>
#include <string_view>
#include <vector>

namespace marlo {
class Schema;
}

namespace marlo::filter {

/** What a condition gives: unknown where it rests on NULL. */
enum class Truth { no, unknown, yes };

enum class Language { wql, cql };

/** "WQL", or "CQL", "CIM:CQL", "DMTF:CQL", without regard to case; nothing for any other. */
std::optional<Language> readLanguage(std::string_view name);

/** One side of a comparison. */
struct Operand {
    enum class Kind { value, property, self };

    Kind kind = Kind::value;
    Value value;
    std::vector<std::string> path; ///< of a property: its name, then names within embedded instances
    std::size_t offset = 0;        ///< in the filter's text
};

enum class Relation { equal, notEqual, less, lessOrEqual, greater, greaterOrEqual };

/** A tree of conditions, at most `Filter::deepest` levels deep. */
struct Condition {
    enum class Kind { all, any, negation, comparison, nullTest, like, isA };

    Kind kind = Kind::all;
    std::vector<Condition> children; ///< of all, any and negation
    Operand left;
    Operand right; ///< of a comparison
    Relation relation = Relation::equal;
    Pattern pattern;       ///< of like
    std::string className; ///< of isA
    std::size_t offset = 0;
};

/** What a filter is applied to. */
class Subject {
  public:
    virtual ~Subject() = default;

    /** A property; null where there is none, which counts as NULL. Lives until the subject is asked again. */
    [[nodiscard]] virtual const Value* property(std::string_view name) const = 0;
    /** The class of the subject; empty where it cannot be told. */
    [[nodiscard]] virtual std::string_view className() const = 0;
    /** True when `className` is `ancestor` or derives from it. */
    [[nodiscard]] virtual bool isA(std::string_view className, std::string_view ancestor) const = 0;

  protected:
    Subject() = default;
    Subject(const Subject&) = default;
    Subject& operator=(const Subject&) = default;
};

/** A filter that has been read. Immutable; any thread. */
class Filter {
  public:
    static constexpr std::size_t longest = 65536; ///< bytes of a text
    static constexpr int deepest = 64;            ///< parentheses and NOTs within each other

    /** Throws Error for a text that is none, or too long or too deep. */
    static Filter parse(std::string_view text, Language language);

    [[nodiscard]] const std::string& text() const { return _text; }

    [[nodiscard]] Language language() const { return _language; }

    /** The class behind FROM as it is written there. */
    [[nodiscard]] const std::string& className() const { return _className; }

    /** The names behind SELECT; none for all. */
    [[nodiscard]] const std::vector<std::string>& properties() const { return _properties; }

    /**
     * Compares with a schema: classes and properties exist, and what is compared can be. Throws Error for the first
     * thing that is wrong.
     */
    void check(const Schema& schema, const std::string& nameSpace) const;

    /** Whether the condition holds; the class of the subject is not looked at. Values of unlike types are unknown. */
    [[nodiscard]] Truth evaluate(const Subject& subject) const;

    /** True when the subject is of the filter's class and the condition holds. */
    [[nodiscard]] bool matches(const Subject& subject) const;

  private:
    friend class Parser;

    Filter() = default;

    std::string _text;
    Language _language = Language::wql;
    std::string _className;
    std::size_t _classOffset = 0;
    std::vector<std::string> _properties;
    std::vector<Operand> _selected; ///< the same with their places
    Condition _condition;           ///< all of nothing where there is no WHERE
};

} // namespace marlo::filter
