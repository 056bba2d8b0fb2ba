/** @file Filters that parse and do not fit the schema. */
#include "tests/filter/Filters.h"

#include <gtest/gtest.h>

namespace marlo::test {
namespace {

using filter::Filter;
using filter::Language;

struct Misfit {
    const char* text;
    const char* reason;
};

void PrintTo(const Misfit& entry, std::ostream* out) {
    *out << entry.text;
}

std::string check(const std::string& text, Language language = Language::wql) {
    const Filter filter = Filter::parse(text, language);
    return refusal([&filter] { filter.check(exampleSchema(), "root/test"); });
}

class Misfits : public testing::TestWithParam<Misfit> {};

TEST_P(Misfits, AreRefusedWithTheirPlace) {
    EXPECT_EQ(check(std::string("SELECT * FROM Event WHERE ") + GetParam().text), GetParam().reason);
}

INSTANTIATE_TEST_SUITE_P(
    Names, Misfits,
    testing::Values(Misfit{"Nowhere = 1", "line 1, column 27: Event has no property 'Nowhere'"},
                    Misfit{"1 = Nowhere", "line 1, column 31: Event has no property 'Nowhere'"},
                    Misfit{"Extra = 'x'", "line 1, column 27: Event has no property 'Extra'"},
                    Misfit{"Nowhere IS NULL", "line 1, column 27: Event has no property 'Nowhere'"},
                    Misfit{"Nowhere LIKE 'x'", "line 1, column 27: Event has no property 'Nowhere'"},
                    Misfit{"Nowhere ISA Part", "line 1, column 27: Event has no property 'Nowhere'"},
                    Misfit{"Severity = 3 AND NOT (1 = 2 OR Nowhere = 1)",
                           "line 1, column 58: Event has no property 'Nowhere'"},
                    Misfit{"Source.Nowhere = 1", "line 1, column 27: Part has no property 'Nowhere'"},
                    Misfit{"Text.Inner = 1", "line 1, column 27: Event.Text holds no instance"},
                    Misfit{"Other.Severity = 1", "line 1, column 27: Event.Other holds no instance"},
                    Misfit{"__this ISA Nowhere", "line 1, column 38: there is no class 'Nowhere' in root/test"},
                    Misfit{"Source ISA 'Nowhere'", "line 1, column 38: there is no class 'Nowhere' in root/test"},
                    Misfit{"Text ISA Part", "line 1, column 27: 'Text' holds no instance"}));

INSTANTIATE_TEST_SUITE_P(
    Types, Misfits,
    testing::Values(
        Misfit{"Text = 3", "line 1, column 27: string and uint64 cannot be compared"},
        Misfit{"3 = Text", "line 1, column 27: uint64 and string cannot be compared"},
        Misfit{"Severity = 'x'", "line 1, column 27: uint16 and string cannot be compared"},
        Misfit{"Severity = TRUE", "line 1, column 27: uint16 and boolean cannot be compared"},
        Misfit{"Urgent = 1", "line 1, column 27: boolean and uint64 cannot be compared"},
        Misfit{"Urgent = 'true'", "line 1, column 27: boolean and string cannot be compared"},
        Misfit{"Urgent > FALSE", "line 1, column 27: of booleans none is the greater"},
        Misfit{"Letter = 3", "line 1, column 27: char16 and uint64 cannot be compared"},
        Misfit{"When = 3", "line 1, column 27: datetime and uint64 cannot be compared"},
        Misfit{"When = Text", "line 1, column 27: datetime and string cannot be compared"},
        Misfit{"Text = When", "line 1, column 27: string and datetime cannot be compared"},
        Misfit{"When = 'yesterday'", "line 1, column 34: 'yesterday' is no date-time"},
        Misfit{"'20261301000000.000000+000' < When",
               "line 1, column 27: '20261301000000.000000+000' is no date-time"},
        Misfit{"Text = Severity", "line 1, column 27: string and uint16 cannot be compared"},
        Misfit{"1 = 'x'", "line 1, column 27: uint64 and string cannot be compared"},
        Misfit{"-1 = TRUE", "line 1, column 27: sint64 and boolean cannot be compared"},
        Misfit{"Words = 'x'", "line 1, column 27: 'Words' is of type string[], which compares with nothing but NULL"},
        Misfit{"Place = 'x'",
               "line 1, column 27: 'Place' is of type reference, which compares with nothing but NULL"},
        Misfit{"__this = 'x'", "line 1, column 27: an instance compares with nothing"},
        Misfit{"'x' = Event", "line 1, column 33: an instance compares with nothing"},
        Misfit{"__this LIKE 'x'", "line 1, column 27: an instance compares with nothing"},
        Misfit{"Severity LIKE '3'", "line 1, column 27: only texts are LIKE a pattern, which uint16 is not"},
        Misfit{"Source.Weight = 'x'", "line 1, column 27: uint32 and string cannot be compared"}));

TEST(Misfits, OfSelectionAndClassAreRefused) {
    EXPECT_EQ(check("SELECT Text, Nowhere FROM Event"), "line 1, column 14: Event has no property 'Nowhere'");
    EXPECT_EQ(check("SELECT * FROM Nowhere WHERE X = 1"),
              "line 1, column 15: there is no class 'Nowhere' in root/test");
    EXPECT_EQ(check("SELECT * FROM Event WHERE Text = DATETIME('20260307040409.000250+000')", Language::cql),
              "line 1, column 27: string and datetime cannot be compared");
    EXPECT_EQ(check("SELECT text FROM event"), "accepted");
    const Filter filter = Filter::parse("SELECT * FROM Event", Language::wql);
    try {
        filter.check(exampleSchema(), "root/elsewhere");
        FAIL() << "accepted";
    } catch (const filter::Error& error) {
        EXPECT_EQ(error.code(), CMPI_RC_ERR_INVALID_CLASS);
    }
}

} // namespace
} // namespace marlo::test
