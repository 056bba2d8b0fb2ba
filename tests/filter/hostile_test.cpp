/** @file Filters that were made to do harm. */
#include "tests/filter/Filters.h"

#include <random>

#include <gmock/gmock.h>
#include <gtest/gtest.h>

namespace marlo::test {
namespace {

using filter::Filter;
using filter::Language;
using testing::HasSubstr;

std::string repeat(const std::string& text, int count) {
    std::string repeated;
    for (int i = 0; i < count; ++i) {
        repeated += text;
    }
    return repeated;
}

std::string parse(const std::string& condition) {
    return refusal([&] { Filter::parse("SELECT * FROM Event WHERE " + condition, Language::wql); });
}

TEST(Hostile, ParenthesesNestAsDeepAsTheyMayAndNoDeeper) {
    const auto nested = [](int depth) { return repeat("(", depth) + "1 = 1" + repeat(")", depth); };
    EXPECT_EQ(parse(nested(Filter::deepest)), "accepted");
    EXPECT_THAT(parse(nested(Filter::deepest + 1)), HasSubstr("nested more than 64 deep"));
    EXPECT_THAT(parse(nested(30000)), HasSubstr("line 1, column 91: conditions are nested"));
}

TEST(Hostile, NotsNestAsDeepAsTheyMayAndNoDeeper) {
    EXPECT_EQ(parse(repeat("NOT ", Filter::deepest) + "1 = 1"), "accepted");
    EXPECT_THAT(parse(repeat("NOT ", Filter::deepest + 1) + "1 = 1"), HasSubstr("nested more than 64 deep"));
    EXPECT_THAT(parse(repeat("NOT(", 40) + "1 = 1"), HasSubstr("nested more than 64 deep"));
}

TEST(Hostile, TextsAreAsLongAsTheyMayAndNoLonger) {
    const std::string frame = "SELECT * FROM Event WHERE Text = ''";
    const auto filter = [&](std::size_t size) {
        return refusal([&] {
            Filter::parse("SELECT * FROM Event WHERE Text = '" + std::string(size - frame.size(), 'x') + "'",
                          Language::wql);
        });
    };
    EXPECT_EQ(filter(Filter::longest), "accepted");
    EXPECT_THAT(filter(Filter::longest + 1), HasSubstr("longer than 65536 bytes"));
}

TEST(Hostile, ChainsAreNoNesting) {
    std::string condition = "1 = 1";
    while (condition.size() < 60000) {
        condition += " AND 1 = 1 OR 1 = 2";
    }
    const Filter filter = Filter::parse("SELECT * FROM Event WHERE " + condition, Language::wql);
    EXPECT_EQ(filter.evaluate(InstanceSubject(exampleEvent())), filter::Truth::yes);
    const Filter copied = filter;
    EXPECT_EQ(copied.evaluate(InstanceSubject(exampleEvent())), filter::Truth::yes);
}

TEST(Hostile, ZeroBytesAreRefusedOutsideTextsAndTakenWithin) {
    using namespace std::string_literals;
    EXPECT_THAT(parse("Text = \0'x'"s), HasSubstr("control character, code 0"));
    EXPECT_THAT(parse("Text = 'x'\0"s), HasSubstr("control character, code 0"));
    EXPECT_EQ(parse("Text = 'x\0y'"s), "accepted");
}

/** Every cut of a filter and every filter with one byte changed is read, or refused with a place. */
TEST(Hostile, CutAndChangedFiltersAreReadOrRefused) {
    const std::string whole =
        "SELECT Text, e.Severity FROM Event AS e WHERE (Text LIKE 'a%' OR NOT e.Severity >= -0x1F) "
        "AND e ISA SpecialEvent AND When < DATETIME('20260307040409.000250+000') OR Ratio = 1.5e3";
    EXPECT_EQ(refusal([&] { Filter::parse(whole, Language::cql); }), "accepted");
    std::mt19937 random(7);
    std::uniform_int_distribution<int> byte(0, 255);
    for (std::size_t i = 0; i < whole.size(); ++i) {
        const std::string cut = refusal([&] { Filter::parse(whole.substr(0, i), Language::cql); });
        EXPECT_TRUE(cut == "accepted" || cut.starts_with("line 1, column ")) << cut;
        for (int round = 0; round < 20; ++round) {
            std::string changed = whole;
            changed[i] = static_cast<char>(byte(random));
            const std::string answer = refusal([&] {
                const Filter filter = Filter::parse(changed, Language::cql);
                filter.check(exampleSchema(), "root/test");
                static_cast<void>(filter.evaluate(InstanceSubject(exampleEvent())));
            });
            EXPECT_TRUE(answer == "accepted" || answer.starts_with("line ")) << answer;
        }
    }
}

} // namespace
} // namespace marlo::test
