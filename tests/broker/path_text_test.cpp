/** @file Object paths as text, and the values in them. */
#include "host/model/Instance.h"

#include <stdexcept>

#include <gtest/gtest.h>

namespace marlo {
namespace {

ObjectPath full() {
    return {"host.example",
            "root/tavis",
            "Some_Class",
            {{"A", Value::string(R"(a "quoted" \ text)")},
             {"B", Value::uint(CMPI_uint64, 42)},
             {"C", Value::sint(CMPI_sint64, -42)},
             {"D", Value::boolean(true)},
             {"E", {CMPI_real64, 1.5}},
             {"F", {CMPI_char16, u'x'}}}};
}

TEST(PathText, PrintsEachPartThatIsSet) {
    EXPECT_EQ(full().toString(), R"(//host.example/root/tavis:Some_Class.A="a \"quoted\" \\ text",B=42,C=-42,)"
                                 R"(D=TRUE,E=1.5,F='x')");
    EXPECT_EQ((ObjectPath{"", "root/tavis", "C", {}}).toString(), "root/tavis:C");
    EXPECT_EQ((ObjectPath{"", "", "C", {{"K", Value::string("v")}}}).toString(), "C.K=\"v\"");
}

TEST(PathText, PrintsReferencesAsQuotedPathsAndDateTimesAsTexts) {
    const auto target = std::make_shared<const ObjectPath>(ObjectPath{"", "", "T", {{"K", Value::string("v")}}});
    const ObjectPath path{
        "", "", "C", {{"R", {CMPI_ref, target}}, {"W", {CMPI_dateTime, DateTime{"20200101000000.000000+000"}}}}};
    EXPECT_EQ(path.toString(), R"(C.R="T.K=\"v\"",W="20200101000000.000000+000")");
}

TEST(PathText, ReadsWhatItPrints) {
    EXPECT_EQ(ObjectPath::parse(full().toString()), full());
}

struct Reading {
    const char* text;
    ObjectPath path;
};

class PathReading : public testing::TestWithParam<Reading> {};

TEST_P(PathReading, GivesThePath) {
    EXPECT_EQ(ObjectPath::parse(GetParam().text), GetParam().path);
}

INSTANTIATE_TEST_SUITE_P(
    Forms, PathReading,
    testing::Values(Reading{"C", {"", "", "C", {}}}, Reading{"root/tavis:C", {"", "root/tavis", "C", {}}},
                    Reading{"//h/root:C", {"h", "root", "C", {}}},
                    Reading{"//h:5988/root/a-b:C", {"h:5988", "root/a-b", "C", {}}},
                    Reading{"127.0.0.1/root/interop:C", {"127.0.0.1", "root/interop", "C", {}}},
                    Reading{"h:5988/root:C", {"h:5988", "root", "C", {}}},
                    Reading{"[::1]:5989/root:C.K=1",
                            {"[::1]:5989", "root", "C", {{"K", Value::uint(CMPI_uint64, 1)}}}},
                    Reading{"localhost/root:C", {"", "localhost/root", "C", {}}},
                    Reading{"C.K=\"a.b/c:d\"", {"", "", "C", {{"K", Value::string("a.b/c:d")}}}},
                    Reading{"C.K=\"root:x.y=z,w\"", {"", "", "C", {{"K", Value::string("root:x.y=z,w")}}}},
                    Reading{"C.K=\"\"", {"", "", "C", {{"K", Value::string("")}}}},
                    Reading{"C.K=0x1F", {"", "", "C", {{"K", Value::uint(CMPI_uint64, 31)}}}},
                    Reading{"C.K=+7", {"", "", "C", {{"K", Value::uint(CMPI_uint64, 7)}}}},
                    Reading{"C.K=18446744073709551615", {"", "", "C", {{"K", Value::uint(CMPI_uint64, ~0ULL)}}}},
                    Reading{"C.K=-0", {"", "", "C", {{"K", Value::uint(CMPI_uint64, 0)}}}},
                    Reading{"C.K=-9223372036854775808", {"", "", "C", {{"K", Value::sint(CMPI_sint64, INT64_MIN)}}}},
                    Reading{"C.K=false", {"", "", "C", {{"K", Value::boolean(false)}}}},
                    Reading{"C.K='\\x20AC'", {"", "", "C", {{"K", {CMPI_char16, u'\u20ac'}}}}},
                    Reading{"C.K=2.5e3", {"", "", "C", {{"K", {CMPI_real64, 2500.0}}}}}));

struct Refusal {
    const char* text;
    const char* message; ///< begins with the position
};

class PathRefusal : public testing::TestWithParam<Refusal> {};

TEST_P(PathRefusal, NamesThePositionAndWhatWasExpected) {
    try {
        const ObjectPath path = ObjectPath::parse(GetParam().text);
        FAIL() << "read as " << path.toString();
    } catch (const std::invalid_argument& error) {
        EXPECT_EQ(std::string(error.what()).rfind(GetParam().message, 0), 0U) << error.what();
    }
}

INSTANTIATE_TEST_SUITE_P(
    Errors, PathRefusal,
    testing::Values(
        Refusal{"", "position 1: expected a class name"}, Refusal{"9C", "position 1: expected a class name"},
        Refusal{"C D", "position 2: expected '.' and a key"}, Refusal{"C.", "position 3: expected a key name"},
        Refusal{"C.K", "position 4: expected '='"}, Refusal{"C.K=", "position 5: expected a value"},
        Refusal{"C.K=word", "position 5: expected a value"},
        Refusal{"C.K=\"x", "position 7: expected the \" that ends the value begun at position 5"},
        Refusal{"C.K=\"x\\", "position 8: expected a character after the backslash"},
        Refusal{"C.K=\"x\"y", "position 8: expected ',' and another key"},
        Refusal{"C.K=1,", "position 7: expected a key name"},
        Refusal{"C.K=1,k=2", "position 7: expected a key that was not given yet, found 'k' again"},
        Refusal{"C.K=12x", "position 5: expected a number, found '12x'"},
        Refusal{"C.K=1.x", "position 5: expected a number, found '1.x'"},
        Refusal{"C.K=1e309", "position 5: expected a real number of at most 64 bits, found '1e309'"},
        Refusal{"C.K=-", "position 5: expected a number, found '-'"},
        Refusal{"C.K=18446744073709551616", "position 5: expected an integer of at most 64 bits"},
        Refusal{"C.K=-9223372036854775809", "position 5: expected an integer of at most 64 bits"},
        Refusal{"C.K='xy'", "position 5: expected one character"},
        Refusal{"//h", "position 4: expected '/' after the host"}, Refusal{"///r:C", "position 3: expected a host"},
        Refusal{"//h/:C", "position 5: expected a namespace"}, Refusal{"root/:C", "position 6: expected a namespace"},
        Refusal{"root/a b:C", "position 7: expected ':' after the namespace"},
        Refusal{":C", "position 1: expected a namespace"}));

TEST(Value, ComparesObjectsByWhatTheyHold) {
    const auto one = std::make_shared<const ObjectPath>(ObjectPath{"", "", "C", {}});
    const auto same = std::make_shared<const ObjectPath>(*one);
    const auto other = std::make_shared<const ObjectPath>(ObjectPath{"", "", "D", {}});
    EXPECT_EQ((Value{CMPI_ref, one}), (Value{CMPI_ref, same}));
    EXPECT_FALSE((Value{CMPI_ref, one}) == (Value{CMPI_ref, other}));
    EXPECT_FALSE(Value::uint(CMPI_uint8, 1) == Value::uint(CMPI_uint16, 1));
    EXPECT_FALSE(Value::null(CMPI_string) == Value::string(""));
    EXPECT_EQ((Value{CMPI_refA, Value::Array{{CMPI_ref, one}}}), (Value{CMPI_refA, Value::Array{{CMPI_ref, same}}}));
}

TEST(Names, AreEqualWithoutRegardToAsciiCaseOnly) {
    EXPECT_TRUE(equalNames("SettingID", "settingid"));
    EXPECT_FALSE(equalNames("SettingID", "SettingI"));
    EXPECT_FALSE(equalNames("@a", "`a")); // neighbours of letters, 0x20 apart
    EXPECT_FALSE(equalNames("\xC3\x84", "\xC3\xA4"));
}

TEST(TypeName, IsThatOfCimWithoutArrayBrackets) {
    EXPECT_EQ(typeName(CMPI_uint16A), "uint16");
    EXPECT_EQ(typeName(CMPI_dateTime), "datetime");
    EXPECT_EQ(typeName(CMPI_ref), "reference");
    EXPECT_EQ(typeName(CMPI_ptr), "");
}

} // namespace
} // namespace marlo
