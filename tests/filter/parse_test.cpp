/** @file What filters say, and where those that say nothing go wrong. */
#include "tests/filter/Filters.h"

#include <gmock/gmock.h>
#include <gtest/gtest.h>

namespace marlo::test {
namespace {

using filter::Filter;
using filter::Language;
using testing::ElementsAre;
using testing::IsEmpty;

TEST(Parsing, TakesClassPropertiesAndTextOver) {
    const std::string text = "SELECT Text, Event.Severity FROM Event WHERE Severity = 3";
    const Filter filter = Filter::parse(text, Language::cql);
    EXPECT_EQ(filter.text(), text);
    EXPECT_EQ(filter.language(), Language::cql);
    EXPECT_EQ(filter.className(), "Event");
    EXPECT_THAT(filter.properties(), ElementsAre("Text", "Severity"));
    EXPECT_THAT(Filter::parse("SELECT * FROM Event", Language::wql).properties(), IsEmpty());
    EXPECT_THAT(Filter::parse("SELECT Event.* FROM Event", Language::wql).properties(), IsEmpty());
    EXPECT_THAT(Filter::parse("SELECT e.Text FROM Event AS e", Language::cql).properties(), ElementsAre("Text"));
}

TEST(Parsing, KnowsTheLanguagesByName) {
    EXPECT_EQ(filter::readLanguage("wql"), Language::wql);
    EXPECT_EQ(filter::readLanguage("CQL"), Language::cql);
    EXPECT_EQ(filter::readLanguage("CIM:CQL"), Language::cql);
    EXPECT_EQ(filter::readLanguage("dmtf:cql"), Language::cql);
    for (const char* name : {"", "SQL", "WQL2", "DMTF:FQL"}) {
        EXPECT_FALSE(filter::readLanguage(name)) << name;
    }
}

struct Refused {
    const char* text;
    const char* reason;
    CMPIrc code = CMPI_RC_ERR_INVALID_QUERY;
};

void PrintTo(const Refused& entry, std::ostream* out) {
    *out << entry.text;
}

class WrongFilters : public testing::TestWithParam<Refused> {};

TEST_P(WrongFilters, AreRefusedWithTheirPlace) {
    try {
        Filter::parse(GetParam().text, Language::wql);
        FAIL() << "accepted";
    } catch (const filter::Error& error) {
        EXPECT_STREQ(error.what(), GetParam().reason);
        EXPECT_EQ(error.code(), GetParam().code);
    }
}

INSTANTIATE_TEST_SUITE_P(
    Frame, WrongFilters,
    testing::Values(
        Refused{"", "line 1, column 1: expected SELECT, found the end of the filter"},
        Refused{"  \n ", "line 2, column 2: expected SELECT, found the end of the filter"},
        Refused{"DELETE FROM Event", "line 1, column 1: expected SELECT, found 'DELETE'"},
        Refused{"SELECT", "line 1, column 7: expected * or a property, found the end of the filter"},
        Refused{"SELECT FROM Event", "line 1, column 8: expected * or a property, found 'FROM'"},
        Refused{"SELECT * Event", "line 1, column 10: expected FROM, found 'Event'"},
        Refused{"SELECT *, Text FROM Event", "line 1, column 9: expected FROM, found ','"},
        Refused{"SELECT Text, FROM Event", "line 1, column 14: expected * or a property, found 'FROM'"},
        Refused{"SELECT Text Other FROM Event", "line 1, column 13: expected FROM, found 'Other'"},
        Refused{"SELECT Other.* FROM Event", "line 1, column 8: 'Other' is not the class behind FROM"},
        Refused{"SELECT Text. FROM Event", "line 1, column 14: expected a property, found 'FROM'"},
        Refused{"SELECT * FROM", "line 1, column 14: expected a class, found the end of the filter"},
        Refused{"SELECT * FROM 'Event'", "line 1, column 15: expected a class, found ''Event''"},
        Refused{"SELECT * FROM WHERE", "line 1, column 15: expected a class, found 'WHERE'"},
        Refused{"SELECT * FROM 3Event", "line 1, column 15: a number that goes on as a name"},
        Refused{"SELECT * FROM Event WHERE",
                "line 1, column 26: expected a property or a value, found the end of the "
                "filter"},
        Refused{"SELECT * FROM Event e", "line 1, column 21: expected WHERE or the end (an alias is CQL), found 'e'"},
        Refused{"SELECT * FROM Event;", "line 1, column 20: a character of no meaning: ';'"},
        Refused{"SELECT * FROM Event AND 1 = 1", "line 1, column 21: expected WHERE or the end, found 'AND'"}));

INSTANTIATE_TEST_SUITE_P(
    Conditions, WrongFilters,
    testing::Values(
        Refused{"SELECT * FROM Event WHERE Text", "line 1, column 31: expected a comparison, found the end of the "
                                                  "filter"},
        Refused{"SELECT * FROM Event WHERE Text =",
                "line 1, column 33: expected a property or a value, found the end "
                "of the filter"},
        Refused{"SELECT * FROM Event WHERE = 3", "line 1, column 27: expected a property or a value, found '='"},
        Refused{"SELECT * FROM Event WHERE Text == 'x'",
                "line 1, column 33: expected a property or a value, found '='"},
        Refused{"SELECT * FROM Event WHERE Text => 'x'",
                "line 1, column 33: expected a property or a value, found '>'"},
        Refused{"SELECT * FROM Event WHERE Text = 'x' 'y'", "line 1, column 38: expected AND, OR or the end, found "
                                                            "''y''"},
        Refused{"SELECT * FROM Event WHERE Text = 'x' AND",
                "line 1, column 41: expected a property or a value, found "
                "the end of the filter"},
        Refused{"SELECT * FROM Event WHERE AND Text = 'x'",
                "line 1, column 27: expected a property or a value, found "
                "'AND'"},
        Refused{"SELECT * FROM Event WHERE Text = AND", "line 1, column 34: expected a property or a value, found "
                                                        "'AND'"},
        Refused{"SELECT * FROM Event WHERE (Text = 'x'", "line 1, column 38: expected AND, OR or ), found the end of "
                                                         "the filter"},
        Refused{"SELECT * FROM Event WHERE Text = 'x')", "line 1, column 37: expected AND, OR or the end, found ')'"},
        Refused{"SELECT * FROM Event WHERE ()", "line 1, column 28: expected a property or a value, found ')'"},
        Refused{"SELECT * FROM Event WHERE NOT",
                "line 1, column 30: expected a property or a value, found the end of "
                "the filter"},
        Refused{"SELECT * FROM Event WHERE Text NOT = 'x'", "line 1, column 36: expected LIKE or ISA, found '='"},
        Refused{"SELECT * FROM Event WHERE Text IS 'x'", "line 1, column 35: expected NULL, found ''x''"},
        Refused{"SELECT * FROM Event WHERE Text IS NOT 3", "line 1, column 39: expected NULL, found '3'"},
        Refused{"SELECT * FROM Event WHERE Text = NULL", "line 1, column 34: nothing compares with NULL: use IS NULL "
                                                         "or IS NOT NULL"},
        Refused{"SELECT * FROM Event WHERE NULL = Text", "line 1, column 27: nothing compares with NULL: use IS NULL "
                                                         "or IS NOT NULL"},
        Refused{"SELECT * FROM Event WHERE Text LIKE Other", "line 1, column 37: expected a pattern in quotes, found "
                                                             "'Other'"},
        Refused{"SELECT * FROM Event WHERE Text LIKE 3",
                "line 1, column 37: expected a pattern in quotes, found '3'"},
        Refused{"SELECT * FROM Event WHERE Text ISA", "line 1, column 35: expected a class, found the end of the "
                                                      "filter"},
        Refused{"SELECT * FROM Event WHERE 'x' ISA Event", "line 1, column 27: a value is of no class"},
        Refused{"SELECT * FROM Event WHERE Text. = 3", "line 1, column 33: expected a property, found '='"},
        Refused{"SELECT * FROM Event WHERE .Text = 3",
                "line 1, column 27: expected a property or a value, found '.'"},
        Refused{"SELECT * FROM Event\nWHERE Text = 'x'\n  AND Other ? 3", "line 3, column 13: a character of no "
                                                                          "meaning: '?'"},
        Refused{"SELECT * FROM Event WHERE Text = '\xC3\xA4\xC3\xB6' ,", "line 1, column 39: expected AND, OR or the "
                                                                         "end, found ','"}));

INSTANTIATE_TEST_SUITE_P(
    Values, WrongFilters,
    testing::Values(
        Refused{"SELECT * FROM Event WHERE Text = 'x", "line 1, column 34: a text without its closing quote"},
        Refused{"SELECT * FROM Event WHERE Text = 'x\"", "line 1, column 34: a text without its closing quote"},
        Refused{"SELECT * FROM Event WHERE Text = 'x\\'", "line 1, column 34: a text without its closing quote"},
        Refused{"SELECT * FROM Event WHERE Text = '\\", "line 1, column 34: a text without its closing quote"},
        Refused{"SELECT * FROM Event WHERE Text = '\\x'", "line 1, column 35: an escape of no character"},
        Refused{"SELECT * FROM Event WHERE Text = '\\xD800'", "line 1, column 35: an escape of no character"},
        Refused{"SELECT * FROM Event WHERE Text = '\\x0'", "line 1, column 35: an escape of no character"},
        Refused{"SELECT * FROM Event WHERE Text = '\\x", "line 1, column 35: an escape of no character"},
        Refused{"SELECT * FROM Event WHERE Text = 'a\xFFz'", "line 1, column 36: these bytes are no UTF-8"},
        Refused{"SELECT * FROM Event WHERE Te\xC0xt = 'a'", "line 1, column 29: these bytes are no UTF-8"},
        Refused{"SELECT * FROM Event WHERE Text = 'a' \x01", "line 1, column 38: a control character, code 1"},
        Refused{"SELECT * FROM Event WHERE Severity = 18446744073709551616",
                "line 1, column 38: the number is out of "
                "range"},
        Refused{"SELECT * FROM Event WHERE Severity = -9223372036854775809",
                "line 1, column 38: the number is out of "
                "range"},
        Refused{"SELECT * FROM Event WHERE Severity = 0x10000000000000000", "line 1, column 38: the number is out of "
                                                                            "range"},
        Refused{"SELECT * FROM Event WHERE Severity = 1e999", "line 1, column 38: the number is out of range"},
        Refused{"SELECT * FROM Event WHERE Severity = 0x", "line 1, column 38: a number without its digits"},
        Refused{"SELECT * FROM Event WHERE Severity = 12b", "line 1, column 38: a number without its digits"},
        Refused{"SELECT * FROM Event WHERE Severity = 12x", "line 1, column 38: a number that goes on as a name"},
        Refused{"SELECT * FROM Event WHERE Severity = 1e", "line 1, column 38: a number that goes on as a name"},
        Refused{"SELECT * FROM Event WHERE Severity = 0xZ", "line 1, column 38: a number without its digits"}));

constexpr CMPIrc unsupported = CMPI_RC_ERR_QUERY_FEATURE_NOT_SUPPORTED;

INSTANTIATE_TEST_SUITE_P(
    Unsupported, WrongFilters,
    testing::Values(
        Refused{"SELECT DISTINCT Text FROM Event", "line 1, column 8: DISTINCT is not supported in filters",
                unsupported},
        Refused{"SELECT FIRST 3 Text FROM Event", "line 1, column 8: FIRST is not supported in filters", unsupported},
        Refused{"SELECT COUNT(*) FROM Event", "line 1, column 13: '(' is not supported in filters", unsupported},
        Refused{"SELECT Words[1] FROM Event", "line 1, column 13: '[' is not supported in filters", unsupported},
        Refused{"SELECT * FROM Event, Part",
                "line 1, column 20: more than one class behind FROM is not supported in "
                "filters",
                unsupported},
        Refused{"SELECT * FROM Event WITHIN 60", "line 1, column 21: WITHIN is not supported in filters",
                unsupported},
        Refused{"SELECT * FROM Event ORDER BY Text", "line 1, column 21: ORDER is not supported in filters",
                unsupported},
        Refused{"SELECT * FROM Event WHERE 1 = 1 ORDER BY Text",
                "line 1, column 33: ORDER is not supported in filters", unsupported},
        Refused{"SELECT * FROM Event WHERE ANY Words = 'x'", "line 1, column 31: ANY is not supported in filters",
                unsupported},
        Refused{"SELECT * FROM Event WHERE Words[0] = 'x'", "line 1, column 32: '[' is not supported in filters",
                unsupported},
        Refused{"SELECT * FROM Event WHERE Part::Serial = 'x'", "line 1, column 31: '::' is not supported in filters",
                unsupported},
        Refused{"SELECT * FROM Event WHERE UPPERCASE(Text) = 'X'",
                "line 1, column 36: a function is not supported in "
                "filters",
                unsupported},
        Refused{"SELECT * FROM Event WHERE Severity + 1 = 4", "line 1, column 36: '+' is not supported in filters",
                unsupported},
        Refused{"SELECT * FROM Event WHERE Text || 'x' = 'y'", "line 1, column 32: '||' is not supported in filters",
                unsupported},
        Refused{"SELECT * FROM Event WHERE Severity = 4 * 2", "line 1, column 40: '*' is not supported in filters",
                unsupported},
        Refused{"SELECT * FROM Event WHERE When = DATETIME('x')",
                "line 1, column 42: a function is not supported in "
                "filters",
                unsupported}));

TEST(WrongFilters, OfCqlAreRefusedToo) {
    const auto parse = [](const char* text) { return refusal([text] { Filter::parse(text, Language::cql); }); };
    EXPECT_EQ(parse("SELECT * FROM Event AS"), "line 1, column 23: expected an alias, found the end of the filter");
    EXPECT_EQ(parse("SELECT * FROM Event e f"), "line 1, column 23: expected WHERE or the end, found 'f'");
    EXPECT_EQ(parse("SELECT * FROM Event WHERE When = DATETIME(3)"),
              "line 1, column 43: expected a date-time in quotes, found '3'");
    EXPECT_EQ(parse("SELECT * FROM Event WHERE When = DATETIME('3')"), "line 1, column 43: ''3'' is no date-time");
    EXPECT_EQ(parse("SELECT * FROM Event WHERE When = DATETIME('20260307040409.000250+000'"),
              "line 1, column 70: expected ), found the end of the filter");
}

} // namespace
} // namespace marlo::test
