#include "host/schema/Utf8.h"

#include <string>
#include <string_view>

#include <gtest/gtest.h>

namespace marlo::test {
namespace {

TEST(Utf8, TakesBackWhatItAppends) {
    for (const char32_t c :
         {U'\x01', U'\x7F', U'\x80', U'\x7FF', U'\x800', U'\xD7FF', U'\xE000', U'\xFFFF', U'\x10000', U'\x10FFFF'}) {
        std::string text;
        appendUtf8(text, c);
        text += '.';
        std::string_view rest = text;
        EXPECT_EQ(takeUtf8(rest), c) << static_cast<unsigned>(c);
        EXPECT_EQ(rest, ".");
    }
}

TEST(Utf8, AppendsTheReplacementForWhatIsNoCharacter) {
    for (const char32_t c :
         {static_cast<char32_t>(0xD800), static_cast<char32_t>(0xDFFF), static_cast<char32_t>(0x110000)}) {
        std::string text;
        appendUtf8(text, c);
        EXPECT_EQ(text, "\xEF\xBF\xBD");
    }
}

TEST(Utf8, TakesNothingFromWrongBytes) {
    for (const std::string wrong :
         {"", "\x80", "\xC0\x80", "\xC1\xBF", "\xE0\x9F\xBF", "\xF0\x8F\xBF\xBF", "\xC3", "\xE2\x82", "\xC3\x28",
          "\xED\xA0\x80", "\xF4\x90\x80\x80", "\xF5\x80\x80\x80", "\xFF"}) {
        std::string_view rest = wrong;
        EXPECT_EQ(takeUtf8(rest), std::nullopt) << testing::PrintToString(wrong);
        EXPECT_EQ(rest, wrong);
    }
}

} // namespace
} // namespace marlo::test
