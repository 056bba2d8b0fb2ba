/** @file What conditions give, compared with their truth. */
#include "tests/filter/Filters.h"

#include <gtest/gtest.h>

namespace marlo::test {
namespace {

using filter::Filter;
using filter::Language;
using filter::Truth;

constexpr Truth yes = Truth::yes;
constexpr Truth no = Truth::no;
constexpr Truth unknown = Truth::unknown;

struct Case {
    const char* condition;
    Truth truth;
};

void PrintTo(const Case& entry, std::ostream* out) {
    *out << entry.condition;
}

Truth evaluate(const std::string& condition, Language language) {
    const Filter filter = Filter::parse("SELECT * FROM Event WHERE " + condition, language);
    filter.check(exampleSchema(), "root/test");
    return filter.evaluate(InstanceSubject(exampleEvent()));
}

class Conditions : public testing::TestWithParam<Case> {};

TEST_P(Conditions, GiveTheirTruthInBothLanguages) {
    EXPECT_EQ(evaluate(GetParam().condition, Language::wql), GetParam().truth);
    EXPECT_EQ(evaluate(GetParam().condition, Language::cql), GetParam().truth);
}

TEST_P(Conditions, GiveTheOppositeWhenNegated) {
    const auto opposite = [](Truth truth) { return truth == yes ? no : truth == no ? yes : unknown; };
    const std::string condition = "NOT (" + std::string(GetParam().condition) + ")";
    EXPECT_EQ(evaluate(condition, Language::wql), opposite(GetParam().truth));
}

TEST_P(Conditions, ObeyTheLawsOfThreeValuedLogic) {
    const std::string condition = GetParam().condition;
    const Truth truth = GetParam().truth;
    const auto joined = [&](const char* how, const char* with) {
        return evaluate("(" + condition + ") " + how + " " + with, Language::wql);
    };
    EXPECT_EQ(joined("AND", "1 = 1"), truth);
    EXPECT_EQ(joined("AND", "1 = 2"), no);
    EXPECT_EQ(joined("AND", "Nothing = 'x'"), truth == no ? no : unknown);
    EXPECT_EQ(joined("OR", "1 = 1"), yes);
    EXPECT_EQ(joined("OR", "1 = 2"), truth);
    EXPECT_EQ(joined("OR", "Nothing = 'x'"), truth == yes ? yes : unknown);
}

INSTANTIATE_TEST_SUITE_P(
    Numbers, Conditions,
    testing::Values(Case{"Severity = 3", yes}, Case{"Severity = 4", no}, Case{"Severity <> 3", no},
                    Case{"Severity != 4", yes}, Case{"Severity < 4", yes}, Case{"Severity < 3", no},
                    Case{"Severity <= 3", yes}, Case{"Severity <= 2", no}, Case{"Severity > 2", yes},
                    Case{"Severity > 3", no}, Case{"Severity >= 3", yes}, Case{"Severity >= 4", no},
                    Case{"3 = Severity", yes}, Case{"4 > Severity", yes}, Case{"3 > Severity", no},
                    Case{"Severity=3", yes}, Case{"Severity>=-1", yes}, Case{"Severity = +3", yes},
                    Case{"Severity = 0x3", yes}, Case{"Severity = 0X03", yes}, Case{"Severity = 11b", yes},
                    Case{"Severity = 3.0", yes}, Case{"Severity < 3.5", yes}, Case{"Severity = 30e-1", yes},
                    Case{"Severity < 1e308", yes}, Case{"Severity = 65539", no}, Case{"Delta = -5", yes},
                    Case{"Delta < 0", yes}, Case{"Delta > -5.5", yes}, Case{"Delta < Severity", yes},
                    Case{"Delta = -0x5", yes}, Case{"Delta < 18446744073709551615", yes}, Case{"Ratio = 0.5", yes},
                    Case{"Ratio = .5", yes}, Case{"Ratio < Severity", yes}, Case{"Ratio <= 0.49", no},
                    Case{"Huge = 18446744073709551615", yes}, Case{"Huge = 18446744073709551614", no},
                    Case{"Huge > 9223372036854775807", yes}, Case{"Huge > -9223372036854775808", yes},
                    Case{"Huge = 18446744073709551616.0", no}, Case{"Huge < 18446744073709551616.0", yes},
                    Case{"1 = 1", yes}, Case{"1 < 1", no}));

INSTANTIATE_TEST_SUITE_P(
    Texts, Conditions,
    testing::Values(Case{"Text = 'link down'", yes}, Case{"Text = \"link down\"", yes},
                    Case{"Text = 'Link Down'", no}, Case{"Text = 'link down '", no}, Case{"Text <> 'link up'", yes},
                    Case{"Text < Other", yes}, Case{"Text > Other", no}, Case{"Text >= 'link'", yes},
                    Case{"Text < 'm'", yes}, Case{"Text = ''", no}, Case{"'a' < 'b'", yes},
                    Case{"'\\x41' = 'A'", yes}, Case{"'it\\'s' = \"it's\"", yes}, Case{"'a\\\\b' = 'a\\\\b'", yes},
                    Case{"'\\n' <> 'n'", yes}, Case{"'\xC3\xA4' > 'z'", yes}, Case{"'\\xe4' = '\xC3\xA4'", yes},
                    Case{"Letter = 'x'", yes}, Case{"Letter = 'y'", no}, Case{"Letter <> 'xx'", yes},
                    Case{"'x' = Letter", yes}, Case{"Letter < 'y'", yes}, Case{"Text > Letter", no}));

INSTANTIATE_TEST_SUITE_P(Booleans, Conditions,
                         testing::Values(Case{"Urgent = TRUE", yes}, Case{"Urgent = true", yes},
                                         Case{"Urgent = FALSE", no}, Case{"Urgent <> False", yes},
                                         Case{"TRUE = Urgent", yes}, Case{"TRUE = FALSE", no}));

INSTANTIATE_TEST_SUITE_P(
    DateTimes, Conditions,
    testing::Values(Case{"When = '20260307050409.000250+060'", yes}, Case{"When = '20260307040409.000250+000'", yes},
                    Case{"When > '20260307040409.000249+000'", yes}, Case{"When < '20260307040409.000249+000'", no},
                    Case{"When <= '20270101000000.000000+000'", yes},
                    Case{"When <> '20270101000000.000000+000'", yes}, Case{"'20250101000000.000000+000' < When", yes},
                    Case{"Until = '00000001000000.000000:000'", yes},
                    Case{"Until < '00000001000000.000001:000'", yes}, Case{"Until = When", unknown},
                    Case{"When > '00000001000000.000000:000'", unknown}));

INSTANTIATE_TEST_SUITE_P(Null, Conditions,
                         testing::Values(Case{"Nothing IS NULL", yes}, Case{"Nothing IS NOT NULL", no},
                                         Case{"Text IS NULL", no}, Case{"Text IS NOT NULL", yes},
                                         Case{"Words IS NULL", yes}, Case{"Place IS NULL", yes},
                                         Case{"Source IS NOT NULL", yes}, Case{"Anything IS NULL", yes},
                                         Case{"3 IS NULL", no}, Case{"__this IS NULL", no},
                                         Case{"Nothing = 'x'", unknown}, Case{"Nothing <> 'x'", unknown},
                                         Case{"Nothing < 'x'", unknown}, Case{"Nothing = Nothing", unknown},
                                         Case{"Nothing LIKE 'x'", unknown}, Case{"Nothing NOT LIKE 'x'", unknown},
                                         Case{"Anything ISA Part", unknown}));

INSTANTIATE_TEST_SUITE_P(
    Joined, Conditions,
    testing::Values(Case{"Severity = 3 AND Urgent = TRUE", yes}, Case{"Severity = 3 AND Urgent = FALSE", no},
                    Case{"Severity = 4 OR Urgent = TRUE", yes}, Case{"Severity = 4 OR Urgent = FALSE", no},
                    Case{"Severity = 4 OR Severity = 3 AND Urgent = TRUE", yes},
                    Case{"1 = 1 OR 1 = 2 AND 1 = 2", yes}, Case{"(1 = 1 OR 1 = 2) AND 1 = 2", no},
                    Case{"NOT 1 = 2 AND 1 = 2", no}, Case{"NOT (1 = 2 AND 1 = 2)", yes}, Case{"NOT NOT 1 = 1", yes},
                    Case{"not 1 = 2 and not (1 = 2 or 1 = 3)", yes}, Case{"((((1 = 1))))", yes},
                    Case{"(1=1)AND(2=2)", yes}, Case{"Severity=3\n\tAND\r\nUrgent=TRUE", yes}));

INSTANTIATE_TEST_SUITE_P(Classes, Conditions,
                         testing::Values(Case{"__this ISA SpecialEvent", yes}, Case{"__THIS isa specialevent", yes},
                                         Case{"__this ISA \"Event\"", yes}, Case{"Event ISA SpecialEvent", yes},
                                         Case{"__this ISA Part", no}, Case{"__this NOT ISA Part", yes},
                                         Case{"Source ISA Part", yes}, Case{"Source ISA SpecialPart", yes},
                                         Case{"Source ISA 'Event'", no}, Case{"Event.Source ISA Part", yes},
                                         Case{"NOT Source ISA Part", no}));

INSTANTIATE_TEST_SUITE_P(Names, Conditions,
                         testing::Values(Case{"SEVERITY = 3", yes}, Case{"event.severity = 3", yes},
                                         Case{"__this.Severity = 3", yes}, Case{"Source.Serial = 'S-1'", yes},
                                         Case{"source.weight > 11", yes}, Case{"Event.Source.Weight = 12", yes},
                                         Case{"Anything.Whatever = 1", unknown},
                                         Case{"Anything.Whatever.Deeper IS NULL", yes}));

TEST(Conditions, KnowWhatOnlyCqlHas) {
    const auto cql = [](const std::string& text) {
        return Filter::parse(text, Language::cql).matches(InstanceSubject(exampleEvent()));
    };
    EXPECT_TRUE(cql("SELECT * FROM Event AS e WHERE e.Severity = 3 AND e ISA SpecialEvent"));
    EXPECT_TRUE(cql("SELECT e.* FROM Event e WHERE E.Severity = 3"));
    EXPECT_TRUE(cql("SELECT * FROM Event WHERE When = DATETIME('20260307040409.000250+000')"));
    EXPECT_FALSE(cql("SELECT * FROM Event WHERE datetime( '20260307040409.000250+000' ) < When"));
    EXPECT_TRUE(cql("SELECT * FROM Event WHERE Text LIKE 'link.*'"));
    EXPECT_FALSE(cql("SELECT * FROM Event WHERE Text LIKE 'link%'"));
}

TEST(Conditions, KnowThePatternsOfWql) {
    EXPECT_EQ(evaluate("Text LIKE 'link%'", Language::wql), yes);
    EXPECT_EQ(evaluate("Text LIKE 'link.*'", Language::wql), no);
    EXPECT_EQ(evaluate("Text NOT LIKE '%up'", Language::wql), yes);
}

TEST(Matches, OnlyInstancesOfTheFiltersClass) {
    const InstanceSubject subject(exampleEvent());
    EXPECT_TRUE(Filter::parse("SELECT * FROM Event", Language::wql).matches(subject));
    EXPECT_TRUE(Filter::parse("select * from specialevent", Language::wql).matches(subject));
    EXPECT_FALSE(Filter::parse("SELECT * FROM Part", Language::wql).matches(subject));
    EXPECT_FALSE(Filter::parse("SELECT * FROM Event WHERE Severity = 4", Language::wql).matches(subject));
    EXPECT_FALSE(Filter::parse("SELECT * FROM Event WHERE Nothing = 'x'", Language::wql).matches(subject));
    EXPECT_FALSE(Filter::parse("SELECT * FROM Event WHERE NOT Nothing = 'x'", Language::wql).matches(subject));
}

TEST(Evaluation, OfUncheckedFiltersTakesUnlikeTypesForUnknown) {
    const InstanceSubject subject(exampleEvent());
    for (const char* condition : {"Text = 3", "Severity = 'x'", "Urgent = 1", "Source = 'x'", "When = 'no date'",
                                  "Nowhere = 1", "Severity LIKE '3'", "Severity ISA Part", "Text.Inner = 1"}) {
        const Filter filter = Filter::parse(std::string("SELECT * FROM Event WHERE ") + condition, Language::wql);
        EXPECT_EQ(filter.evaluate(subject), unknown) << condition;
    }
}

TEST(Evaluation, TakesNotANumberForUnknown) {
    Instance event{{"", "root/test", "Event", {}},
                   {{"Ratio", {CMPI_real64, std::numeric_limits<double>::quiet_NaN()}}}};
    for (const char* relation : {"=", "<>", "<", ">="}) {
        const Filter filter =
            Filter::parse(std::string("SELECT * FROM Event WHERE Ratio ") + relation + " 1", Language::wql);
        EXPECT_EQ(filter.evaluate(InstanceSubject(event)), unknown) << relation;
    }
}

} // namespace
} // namespace marlo::test
