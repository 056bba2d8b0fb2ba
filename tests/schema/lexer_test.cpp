#include "host/schema/Lexer.h"
#include "tests/schema/Mof.h"

#include <cstdint>
#include <limits>
#include <string>

#include <gtest/gtest.h>

namespace marlo::test {
namespace {

const Value& defaultOf(const Schema& schema, const std::string& property) {
    return schema.findClass("root/test", "A")->findProperty(property)->defaultValue;
}

Value readDefault(const std::string& type, const std::string& literal) {
    const bool isArray = type.ends_with("[]");
    const std::string plain = isArray ? type.substr(0, type.size() - 2) : type;
    return defaultOf(read("class A { " + plain + " P" + (isArray ? "[]" : "") + " = " + literal + "; };"), "P");
}

TEST(MofLexer, HasNoEndBehindTheEnd) {
    const std::string file = "t.mof";
    mof::Lexer lexer(" // nothing", file);
    EXPECT_EQ(lexer.next().kind, mof::TokenKind::End);
    EXPECT_EQ(lexer.next().kind, mof::TokenKind::End);
}

TEST(MofLexer, SkipsAByteOrderMark) {
    EXPECT_EQ(readError("\xEF\xBB\xBF class A {};"), "");
    EXPECT_EQ(readError("\xEF\xBB\xBFklass").substr(0, 10), "t.mof:1:1:");
}

TEST(MofLexer, ReadsIntegersInAllFourBases) {
    EXPECT_EQ(readDefault("uint32", "1207"), Value::uint(CMPI_uint32, 1207));
    EXPECT_EQ(readDefault("uint32", "+1207"), Value::uint(CMPI_uint32, 1207));
    EXPECT_EQ(readDefault("uint32", "0"), Value::uint(CMPI_uint32, 0));
    EXPECT_EQ(readDefault("uint32", "0x7F"), Value::uint(CMPI_uint32, 127));
    EXPECT_EQ(readDefault("uint32", "0XaB"), Value::uint(CMPI_uint32, 171));
    EXPECT_EQ(readDefault("uint32", "0x1b"), Value::uint(CMPI_uint32, 27));
    EXPECT_EQ(readDefault("uint32", "0x1E"), Value::uint(CMPI_uint32, 30));
    EXPECT_EQ(readDefault("uint32", "0177"), Value::uint(CMPI_uint32, 127));
    EXPECT_EQ(readDefault("uint32", "101b"), Value::uint(CMPI_uint32, 5));
    EXPECT_EQ(readDefault("sint16", "-12"), Value::sint(CMPI_sint16, -12));
    EXPECT_EQ(readDefault("sint16", "-0x10"), Value::sint(CMPI_sint16, -16));
}

TEST(MofLexer, ReadsIntegersUpToTheEdgesOfTheirTypes) {
    EXPECT_EQ(readDefault("uint8", "255"), Value::uint(CMPI_uint8, 255));
    EXPECT_EQ(readDefault("uint16", "65535"), Value::uint(CMPI_uint16, 65535));
    EXPECT_EQ(readDefault("uint64", "18446744073709551615"),
              Value::uint(CMPI_uint64, std::numeric_limits<std::uint64_t>::max()));
    EXPECT_EQ(readDefault("sint8", "-128"), Value::sint(CMPI_sint8, -128));
    EXPECT_EQ(readDefault("sint32", "-2147483648"),
              Value::sint(CMPI_sint32, std::numeric_limits<std::int32_t>::min()));
    EXPECT_EQ(readDefault("sint64", "-9223372036854775808"),
              Value::sint(CMPI_sint64, std::numeric_limits<std::int64_t>::min()));
    EXPECT_EQ(readDefault("sint64", "9223372036854775807"),
              Value::sint(CMPI_sint64, std::numeric_limits<std::int64_t>::max()));
}

TEST(MofLexer, ReadsReals) {
    EXPECT_EQ(readDefault("real64", "1.5"), (Value{CMPI_real64, 1.5}));
    EXPECT_EQ(readDefault("real64", "-.5"), (Value{CMPI_real64, -0.5}));
    EXPECT_EQ(readDefault("real32", "1.5e+2"), (Value{CMPI_real32, 150.0}));
    EXPECT_EQ(readDefault("real32", "2.5E-1"), (Value{CMPI_real32, 0.25}));
    EXPECT_EQ(readDefault("real64", "-3"), (Value{CMPI_real64, -3.0}));
}

TEST(MofLexer, ReadsStringsWithEscapesAndInPieces) {
    EXPECT_EQ(readDefault("string", R"("a\"b\\c\td\n\r\f\b\'")"), Value::string("a\"b\\c\td\n\r\f\b'"));
    EXPECT_EQ(readDefault("string", R"("\x41\xE4\x20AC.")"), Value::string("A\xC3\xA4\xE2\x82\xAC."));
    EXPECT_EQ(readDefault("string", "\"\xC3\xA4 // no comment\""), Value::string("\xC3\xA4 // no comment"));
    EXPECT_EQ(readDefault("string", "\"one \" // between\n \"two\"\"\""), Value::string("one two"));
}

TEST(MofLexer, ReadsCharactersBooleansAndNull) {
    EXPECT_EQ(readDefault("char16", "'a'"), (Value{CMPI_char16, u'a'}));
    EXPECT_EQ(readDefault("char16", R"('\'')"), (Value{CMPI_char16, u'\''}));
    EXPECT_EQ(readDefault("char16", "'\xE2\x82\xAC'"), (Value{CMPI_char16, u'\u20AC'}));
    EXPECT_EQ(readDefault("boolean", "TRUE"), Value::boolean(true));
    EXPECT_EQ(readDefault("boolean", "false"), Value::boolean(false));
    EXPECT_EQ(readDefault("boolean", "Null"), Value::null(CMPI_boolean));
}

TEST(MofLexer, ReadsDateTimesIntervalsAndReferences) {
    const std::string time = "20250102030405.000000+060";
    EXPECT_EQ(readDefault("datetime", '"' + time + '"'), (Value{CMPI_dateTime, DateTime{time}}));
    const std::string interval = "00000001******.******:000";
    EXPECT_EQ(readDefault("datetime", '"' + interval + '"'), (Value{CMPI_dateTime, DateTime{interval}}));
    const Schema schema = read("[Association] class A { A REF P = \"A.K=1\"; };");
    ObjectPath path;
    path.className = "A";
    path.keys.push_back({"K", Value::uint(CMPI_uint64, 1)});
    EXPECT_EQ(defaultOf(schema, "P"), (Value{CMPI_ref, std::make_shared<const ObjectPath>(path)}));
}

TEST(MofLexer, ReadsArraysWithNullsAndEmptyOnes) {
    const Value array = readDefault("uint8[]", "{1, NULL, 3}");
    EXPECT_EQ(array, (Value{CMPI_uint8A, Value::Array{Value::uint(CMPI_uint8, 1), Value::null(CMPI_uint8),
                                                      Value::uint(CMPI_uint8, 3)}}));
    EXPECT_EQ(readDefault("uint8[]", "{}"), (Value{CMPI_uint8A, Value::Array{}}));
    EXPECT_EQ(readDefault("uint8[]", "NULL"), Value::null(CMPI_uint8A));
}

TEST(MofLexer, TakesKeywordsInAnyCase) {
    const Schema schema = read("CLASS a { UINT8 P = 3; A ref Q; };");
    const Class* const found = schema.findClass("ROOT/TEST", "A");
    ASSERT_NE(found, nullptr);
    EXPECT_EQ(found->findProperty("p")->type, CMPI_uint8);
    EXPECT_EQ(found->findProperty("q")->type, CMPI_ref);
}

} // namespace
} // namespace marlo::test
