/** @file Texts and arguments as values of types. */
#include "tests/cimxml/Documents.h"

#include <cmath>

#include <gtest/gtest.h>

namespace marlo::test {
namespace {

using cimxml::readArgument;
using cimxml::readValue;
using cimxml::Untyped;
using cimxml::UntypedArray;

struct Reading {
    CMPIType type;
    const char* text;
    std::optional<Value> value;
};

void PrintTo(const Reading& reading, std::ostream* out) {
    *out << typeName(reading.type) << " \"" << reading.text << '"';
}

class Readings : public testing::TestWithParam<Reading> {};

TEST_P(Readings, GiveTheValueOrNothing) {
    EXPECT_EQ(readValue(GetParam().text, GetParam().type), GetParam().value);
}

Reading good(CMPIType type, const char* text, Value::Variant data) {
    return {type, text, Value{type, std::move(data)}};
}

Reading bad(CMPIType type, const char* text) {
    return {type, text, std::nullopt};
}

INSTANTIATE_TEST_SUITE_P(
    Unsigned, Readings,
    testing::Values(good(CMPI_uint8, "255", std::uint64_t{255}), bad(CMPI_uint8, "256"), bad(CMPI_uint8, "-1"),
                    good(CMPI_uint8, "-0", std::uint64_t{0}), good(CMPI_uint8, "+7", std::uint64_t{7}),
                    good(CMPI_uint8, "0xfF", std::uint64_t{255}), bad(CMPI_uint8, "0x100"), bad(CMPI_uint8, "0x"),
                    bad(CMPI_uint8, ""), bad(CMPI_uint8, "7a"), bad(CMPI_uint8, "7 7"), bad(CMPI_uint8, "+-7"),
                    good(CMPI_uint8, " \t\r\n7 \n", std::uint64_t{7}), bad(CMPI_uint8, " "), bad(CMPI_uint8, "7.0"),
                    good(CMPI_uint16, "65535", std::uint64_t{65535}), bad(CMPI_uint16, "65536"),
                    good(CMPI_uint32, "4294967295", std::uint64_t{4294967295}), bad(CMPI_uint32, "4294967296"),
                    good(CMPI_uint64, "18446744073709551615", std::uint64_t{18446744073709551615U}),
                    bad(CMPI_uint64, "18446744073709551616")));

INSTANTIATE_TEST_SUITE_P(
    Signed, Readings,
    testing::Values(good(CMPI_sint8, "127", std::int64_t{127}), bad(CMPI_sint8, "128"),
                    good(CMPI_sint8, "-128", std::int64_t{-128}), bad(CMPI_sint8, "-129"),
                    good(CMPI_sint16, "-0x8000", std::int64_t{-32768}), bad(CMPI_sint16, "32768"),
                    good(CMPI_sint32, "-2147483648", std::int64_t{-2147483648}), bad(CMPI_sint32, "2147483648"),
                    good(CMPI_sint64, "9223372036854775807", std::int64_t{9223372036854775807}),
                    bad(CMPI_sint64, "9223372036854775808"),
                    good(CMPI_sint64, "-9223372036854775808", std::numeric_limits<std::int64_t>::min()),
                    bad(CMPI_sint64, "-9223372036854775809")));

INSTANTIATE_TEST_SUITE_P(Reals, Readings,
                         testing::Values(good(CMPI_real64, "1.5", 1.5), good(CMPI_real64, "-1.5E+2", -150.0),
                                         good(CMPI_real64, "2", 2.0), good(CMPI_real64, "+2.5e-1", 0.25),
                                         good(CMPI_real64, "INF", HUGE_VAL), good(CMPI_real64, "-INF", -HUGE_VAL),
                                         bad(CMPI_real64, "inf"), bad(CMPI_real64, "nan(1)"),
                                         bad(CMPI_real64, "1e999"), bad(CMPI_real64, "0x1p3"),
                                         bad(CMPI_real64, "1.5x"), bad(CMPI_real64, "+-1.5"), bad(CMPI_real64, ""),
                                         good(CMPI_real32, " 1.5 ", 1.5), bad(CMPI_real32, "1e39"),
                                         good(CMPI_real64, "1e39", 1e39)));

TEST(Reading, KnowsWhatIsNotANumber) {
    const auto value = readValue("NaN", CMPI_real64);
    ASSERT_TRUE(value);
    EXPECT_TRUE(std::isnan(std::get<double>(value->data)));
}

INSTANTIATE_TEST_SUITE_P(
    Others, Readings,
    testing::Values(good(CMPI_boolean, "TRUE", true), good(CMPI_boolean, " false\n", false),
                    good(CMPI_boolean, "True", true), bad(CMPI_boolean, "1"), bad(CMPI_boolean, ""),
                    good(CMPI_string, " a \n", " a \n"), good(CMPI_string, "", ""), good(CMPI_char16, "a", u'a'),
                    good(CMPI_char16, " ", u' '), good(CMPI_char16, "\xE2\x82\xAC", u'\u20AC'), bad(CMPI_char16, ""),
                    bad(CMPI_char16, "ab"), bad(CMPI_char16, "\xF0\x9F\x98\x80"),
                    good(CMPI_dateTime, "20240229235959.000000+060", DateTime{"20240229235959.000000+060"}),
                    good(CMPI_dateTime, " 00000001000000.000000:000\n", DateTime{"00000001000000.000000:000"}),
                    bad(CMPI_dateTime, "20230229235959.000000+060"), bad(CMPI_dateTime, "2024-02-29"),
                    bad(CMPI_ref, "A.K=1"), bad(CMPI_instance, "<INSTANCE CLASSNAME=\"A\"/>"), bad(CMPI_stringA, "a"),
                    bad(CMPI_uint8A, "1"), bad(CMPI_null, "")));

TEST(Argument, IsNullOfAnyTypeWhereNothingIsGiven) {
    EXPECT_EQ(readArgument({}, CMPI_uint8), Value::null(CMPI_uint8));
    EXPECT_EQ(readArgument({}, CMPI_refA), Value::null(CMPI_refA));
}

TEST(Argument, OfATextIsAValueOfTheTypeThatIsWanted) {
    EXPECT_EQ(readArgument(Untyped{"7"}, CMPI_uint8), Value::uint(CMPI_uint8, 7));
    EXPECT_EQ(readArgument(Untyped{"7"}, CMPI_string), Value::string("7"));
    EXPECT_EQ(readArgument(Untyped{"x"}, CMPI_uint8), std::nullopt);
    EXPECT_EQ(readArgument(Untyped{"7"}, CMPI_uint8A), std::nullopt);
}

TEST(Argument, OfTextsIsAnArrayInWhichElementsMayBeNull) {
    const UntypedArray array{Untyped{"7"}, std::nullopt};
    EXPECT_EQ(readArgument(array, CMPI_uint8A),
              (Value{CMPI_uint8A, Value::Array{Value::uint(CMPI_uint8, 7), Value::null(CMPI_uint8)}}));
    EXPECT_EQ(readArgument(array, CMPI_booleanA), std::nullopt);
    EXPECT_EQ(readArgument(array, CMPI_uint8), std::nullopt);
    EXPECT_EQ(readArgument(UntypedArray{}, CMPI_stringA), (Value{CMPI_stringA, Value::Array{}}));
}

TEST(Argument, OfATextCanBeAnEmbeddedInstance) {
    const auto value = readArgument(Untyped{"<INSTANCE CLASSNAME=\"A\"/>"}, CMPI_instance);
    ASSERT_TRUE(value);
    EXPECT_EQ(*std::get<std::shared_ptr<const Instance>>(value->data), (Instance{{"", "", "A", {}}, {}}));
    EXPECT_EQ(readArgument(Untyped{"<INSTANCE/>"}, CMPI_instance), std::nullopt);
    EXPECT_EQ(readArgument(Untyped{"A"}, CMPI_instance), std::nullopt);
}

TEST(Argument, OfAnEmbeddedInstanceIsATextToTheSchema) {
    const Value embedded{CMPI_instance, std::make_shared<const Instance>()};
    EXPECT_EQ(readArgument(embedded, CMPI_instance), embedded);
    EXPECT_EQ(readArgument(embedded, CMPI_string), embedded);
    EXPECT_EQ(readArgument(embedded, CMPI_stringA), std::nullopt);
    EXPECT_EQ(readArgument(embedded, CMPI_uint8), std::nullopt);
    const Value array{CMPI_instanceA, Value::Array{embedded}};
    EXPECT_EQ(readArgument(array, CMPI_stringA), array);
    EXPECT_EQ(readArgument(array, CMPI_string), std::nullopt);
    EXPECT_EQ(readArgument(Instance{}, CMPI_string), embedded);
}

TEST(Argument, OfANameIsAReference) {
    const ObjectPath path{"", "", "A", {{"K", Value::string("x")}}};
    const Value reference{CMPI_ref, std::make_shared<const ObjectPath>(path)};
    EXPECT_EQ(readArgument(path, CMPI_ref), reference);
    EXPECT_EQ(readArgument(path, CMPI_string), std::nullopt);
    EXPECT_EQ(readArgument(cimxml::ClassName{"A"}, CMPI_ref),
              (Value{CMPI_ref, std::make_shared<const ObjectPath>(ObjectPath{"", "", "A", {}})}));
    const Value array{CMPI_refA, Value::Array{reference}};
    EXPECT_EQ(readArgument(array, CMPI_refA), array);
    EXPECT_EQ(readArgument(array, CMPI_ref), std::nullopt);
}

TEST(Argument, OfAClassOrAQualifierIsNoValue) {
    EXPECT_EQ(readArgument(Class{}, CMPI_string), std::nullopt);
    EXPECT_EQ(readArgument(QualifierType{}, CMPI_string), std::nullopt);
}

} // namespace
} // namespace marlo::test
