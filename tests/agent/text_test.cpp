#include "agent/text/Text.h"

#include <string>

#include <gtest/gtest.h>

namespace {

using Orv::Agent::cleanText;
using namespace std::string_literals;

const std::string bad = "\xEF\xBF\xBD";

struct Case {
    const char* what;
    std::string bytes;
    std::string clean;
};

class CleanText : public testing::TestWithParam<Case> {};

TEST_P(CleanText, IsValidUtf8WithoutControls) {
    EXPECT_EQ(cleanText(GetParam().bytes), GetParam().clean);
}

TEST_P(CleanText, LeavesItsOwnResultAlone) {
    const std::string once = cleanText(GetParam().bytes);
    EXPECT_EQ(cleanText(once), once);
}

INSTANTIATE_TEST_SUITE_P(
    Bytes, CleanText,
    testing::Values(Case{"Empty", "", ""}, Case{"Ascii", "Four-port Ethernet ~ card", "Four-port Ethernet ~ card"},
                    Case{"TwoByteLetter", "M\xC3\xBCnchen", "M\xC3\xBCnchen"},
                    Case{"ThreeByteSign", "\xE2\x82\xAC", "\xE2\x82\xAC"},
                    Case{"FourByteSign", "\xF0\x9F\x98\x80", "\xF0\x9F\x98\x80"},
                    Case{"FirstAndLastTwoByte", "\xC2\xA0\xDF\xBF", "\xC2\xA0\xDF\xBF"},
                    Case{"FirstThreeByte", "\xE0\xA0\x80", "\xE0\xA0\x80"},
                    Case{"LastBeforeSurrogates", "\xED\x9F\xBF", "\xED\x9F\xBF"},
                    Case{"FirstAfterSurrogates", "\xEE\x80\x80", "\xEE\x80\x80"},
                    Case{"LastCodePoint", "\xF4\x8F\xBF\xBF", "\xF4\x8F\xBF\xBF"},
                    Case{"ReplacementCharacterItself", "\xEF\xBF\xBD", "\xEF\xBF\xBD"},
                    Case{"Newline", "a\nb", "a b"}, Case{"Tab", "a\tb", "a b"}, Case{"NullByte", "a\0b"s, "a b"},
                    Case{"UnitSeparator", "\x1F", " "}, Case{"Delete", "\x7F", " "}, Case{"FirstC1", "\xC2\x80", " "},
                    Case{"NextLine", "a\xC2\x85z", "a z"}, Case{"LastC1", "\xC2\x9F", " "},
                    Case{"LoneContinuation", "\x80", bad}, Case{"TwoLoneContinuations", "\xBF\x80", bad + bad},
                    Case{"Latin1Letter", "M\xFCnchen", "M" + bad + "nchen"},
                    Case{"LeadAtTheEnd", "ab\xC3", "ab" + bad}, Case{"LeadBeforeAscii", "\xC3(", bad + "("},
                    Case{"ThreeByteCutAfterTwo", "\xE2\x82", bad + bad},
                    Case{"ThreeByteCutBeforeAscii", "\xE2\x82.", bad + bad + "."},
                    Case{"FourByteCutAfterThree", "\xF0\x9F\x98", bad + bad + bad},
                    Case{"OverlongSlashOfTwo", "\xC0\xAF", bad + bad},
                    Case{"OverlongSlashOfThree", "\xE0\x80\xAF", bad + bad + bad},
                    Case{"OverlongOfFour", "\xF0\x8F\xBF\xBF", bad + bad + bad + bad},
                    Case{"Surrogate", "\xED\xA0\x80", bad + bad + bad},
                    Case{"BeyondUnicode", "\xF4\x90\x80\x80", bad + bad + bad + bad},
                    Case{"NeverALead", "\xF5\xFE\xFF", bad + bad + bad},
                    Case{"GoodAfterBad", "\xFF\xC3\xBC!", bad + "\xC3\xBC!"},
                    Case{"ControlAfterBad", "\xC3\n", bad + " "}),
    [](const auto& testCase) { return testCase.param.what; });

TEST(CleanTextOfLongTexts, ChangesTheOneBadByteOnly) {
    std::string bytes(100000, 'x');
    bytes[50000] = '\xFF';
    std::string expected(100000, 'x');
    expected.replace(50000, 1, bad);
    EXPECT_EQ(cleanText(bytes), expected);
}

/** Whether the text is what any reader of UTF-8 accepts, told by a decoder that shares nothing with the cleaner. */
bool decodes(const std::string& text) {
    for (std::size_t at = 0; at < text.size();) {
        const auto lead = static_cast<unsigned char>(text[at]);
        const int more = lead < 0x80 ? 0 : lead >> 5 == 6 ? 1 : lead >> 4 == 14 ? 2 : lead >> 3 == 30 ? 3 : -1;
        if (more < 0 || at + static_cast<std::size_t>(more) >= text.size()) {
            return false;
        }
        unsigned long code = more == 0 ? lead : lead & (0x3FU >> more);
        for (int i = 1; i <= more; ++i) {
            const auto next = static_cast<unsigned char>(text[at + static_cast<std::size_t>(i)]);
            if (next >> 6 != 2) {
                return false;
            }
            code = code << 6 | (next & 0x3F);
        }
        const unsigned long least[] = {0, 0x80, 0x800, 0x10000};
        const bool isControl = code < 0x20 || (code >= 0x7F && code < 0xA0);
        if (code < least[more] || code > 0x10FFFF || (code >= 0xD800 && code < 0xE000) || isControl) {
            return false;
        }
        at += static_cast<std::size_t>(more) + 1;
    }
    return true;
}

TEST(CleanTextOfAnyBytes, DecodesWhateverThreeBytesCome) {
    const unsigned char interesting[] = {0x00, 0x1F, 0x20, 0x7E, 0x7F, 0x80, 0x8F, 0x90, 0x9F,
                                         0xA0, 0xBF, 0xC0, 0xC1, 0xC2, 0xDF, 0xE0, 0xE1, 0xEC,
                                         0xED, 0xEE, 0xEF, 0xF0, 0xF1, 0xF3, 0xF4, 0xF5, 0xFF};
    for (const unsigned char first : interesting) {
        for (const unsigned char second : interesting) {
            for (const unsigned char third : interesting) {
                const std::string bytes{static_cast<char>(first), static_cast<char>(second),
                                        static_cast<char>(third)};
                ASSERT_TRUE(decodes(cleanText(bytes))) << int{first} << ' ' << int{second} << ' ' << int{third};
            }
        }
    }
}

} // namespace
