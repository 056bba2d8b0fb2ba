/** @file The patterns of LIKE. */
#include "host/filter/Pattern.h"

#include <chrono>

#include <gtest/gtest.h>

namespace marlo::test {
namespace {

using filter::Pattern;

struct Match {
    const char* pattern;
    const char* text;
    bool matches;
};

void PrintTo(const Match& entry, std::ostream* out) {
    *out << entry.pattern << " on " << entry.text;
}

class WqlPatterns : public testing::TestWithParam<Match> {};

class CqlPatterns : public testing::TestWithParam<Match> {};

TEST_P(WqlPatterns, MatchWholeTexts) {
    EXPECT_EQ(Pattern::readWql(GetParam().pattern).matches(GetParam().text), GetParam().matches);
}

TEST_P(CqlPatterns, MatchWholeTexts) {
    EXPECT_EQ(Pattern::readCql(GetParam().pattern).matches(GetParam().text), GetParam().matches);
}

INSTANTIATE_TEST_SUITE_P(
    All, WqlPatterns,
    testing::Values(Match{"", "", true}, Match{"", "a", false}, Match{"a", "a", true}, Match{"a", "A", false},
                    Match{"a", "ab", false}, Match{"%", "", true}, Match{"%", "anything", true},
                    Match{"eth%", "eth0", true}, Match{"eth%", "eth", true}, Match{"eth%", "xeth0", false},
                    Match{"%down", "link down", true}, Match{"%down", "down there", false},
                    Match{"%k d%", "link down", true}, Match{"l%k%n", "link down", true}, Match{"_", "", false},
                    Match{"_", "a", true}, Match{"_", "\xC3\xA4", true}, Match{"_", "ab", false},
                    Match{"eth_", "eth0", true}, Match{"eth_", "eth10", false}, Match{"%%", "x", true},
                    Match{"eth[0-3]", "eth3", true}, Match{"eth[0-3]", "eth4", false}, Match{"[^0-3]", "4", true},
                    Match{"[^0-3]", "2", false}, Match{"[abc-]", "-", true}, Match{"[]]", "]", true},
                    Match{"[^]]", "]", false}, Match{"[ab", "[ab", true}, Match{"\\%", "%", true},
                    Match{"\\%", "a", false}, Match{"a.c", "abc", false}, Match{"a*", "a*", true},
                    Match{"a\\", "a\\", true}, Match{"%a%b%c%", "xxaxxbxxcxx", true},
                    Match{"%a%b%c%", "xxbxxaxxcxx", false}));

INSTANTIATE_TEST_SUITE_P(
    All, CqlPatterns,
    testing::Values(Match{"", "", true}, Match{".", "a", true}, Match{".", "", false}, Match{".*", "", true},
                    Match{".*", "anything", true}, Match{"link.*", "link down", true}, Match{"eth.", "eth0", true},
                    Match{"eth[0-9]*", "eth", true}, Match{"eth[0-9]*", "eth123", true},
                    Match{"eth[0-9]*", "eth12a", false}, Match{"ab*c", "ac", true}, Match{"ab*c", "abbbc", true},
                    Match{"ab*c", "adc", false}, Match{"*", "*", true}, Match{"a**", "aa*", true},
                    Match{"a\\.b", "a.b", true}, Match{"a\\.b", "axb", false}, Match{"a\\*", "a*", true},
                    Match{"%", "%", true}, Match{"%", "x", false}, Match{"_", "x", false}));

TEST(Patterns, OfManyRepetitionsTakeNoLongTime) {
    const auto before = std::chrono::steady_clock::now();
    std::string pattern;
    for (int i = 0; i < 500; ++i) {
        pattern += "a*";
    }
    EXPECT_FALSE(Pattern::readCql(pattern + "b").matches(std::string(2000, 'a')));
    EXPECT_LT(std::chrono::steady_clock::now() - before, std::chrono::seconds(10));
}

TEST(Patterns, MatchNoBytesThatAreNoUtf8) {
    EXPECT_FALSE(Pattern::readWql("%").matches("a\xFF"));
    EXPECT_FALSE(Pattern::readWql("_").matches("\xC3"));
}

} // namespace
} // namespace marlo::test
