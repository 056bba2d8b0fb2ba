#include "host/cli/Assignments.h"
#include "host/cli/ChangeReport.h"
#include "host/cli/Changes.h"
#include "host/cli/Options.h"
#include "host/cli/Text.h"

#include <gmock/gmock.h>
#include <gtest/gtest.h>

namespace marlo::cli {
namespace {

using testing::ElementsAre;

CMPIType typeOf(std::string_view name) {
    const std::pair<const char*, CMPIType> types[] = {
        {"Text", CMPI_string},     {"Texts", CMPI_stringA}, {"Small", CMPI_uint8}, {"Signed", CMPI_sint16},
        {"Numbers", CMPI_uint16A}, {"Truth", CMPI_boolean}, {"Real", CMPI_real32}, {"When", CMPI_dateTime},
    };
    for (const auto& [known, type] : types) {
        if (equalNames(known, name)) {
            return type;
        }
    }
    return CMPI_null;
}

Value read(const std::string& word) {
    return readAssignments({word}, typeOf).at(0).value;
}

std::vector<Value> elements(const Value& value) {
    return std::get<Value::Array>(value.data);
}

TEST(Assignments, AreReadAsTheirTypes) {
    EXPECT_EQ(read("Text=a,b=c"), Value::string("a,b=c"));
    EXPECT_EQ(read("text="), Value::string(""));
    EXPECT_EQ(read("Small=7"), Value::uint(CMPI_uint64, 7));
    EXPECT_EQ(read("Signed=-7"), Value::sint(CMPI_sint64, -7));
    EXPECT_EQ(read("Truth=TRUE"), Value::boolean(true));
    EXPECT_EQ(read("Truth=false"), Value::boolean(false));
    EXPECT_EQ(read("Real=0.5"), (Value{CMPI_real32, 0.5}));
    EXPECT_EQ(read("When=20260101000000.000000+000"), Value::string("20260101000000.000000+000"));
}

TEST(Assignments, LeaveWhatIsNotOfItsTypeToTheObjectManagerAsText) {
    for (const char* word : {"Small=x", "Small=", "Small=7x", "Small= 7", "Small=18446744073709551616", "Truth=yes",
                             "Real=half", "Unknown=7"}) {
        const std::string text = std::string(word).substr(std::string(word).find('=') + 1);
        EXPECT_EQ(read(word), Value::string(text)) << word;
    }
}

TEST(Assignments, GatherArraysFromListsAndRepetitions) {
    const auto values = readAssignments({"Texts=a,b", "Small=1", "TEXTS=c", "texts=", "Numbers=1,x"}, typeOf);
    ASSERT_EQ(values.size(), 3U);
    EXPECT_EQ(values[0].name, "Texts");
    EXPECT_EQ(values[0].value.type, CMPI_stringA);
    EXPECT_THAT(elements(values[0].value), ElementsAre(Value::string("a"), Value::string("b"), Value::string("c")));
    EXPECT_THAT(elements(values[2].value), ElementsAre(Value::uint(CMPI_uint64, 1), Value::string("x")));
    EXPECT_TRUE(elements(read("Texts=")).empty());
    EXPECT_THAT(elements(read("Texts=a,,b,")),
                ElementsAre(Value::string("a"), Value::string(""), Value::string("b"), Value::string("")));
}

TEST(Assignments, ThatAreNoneAreRefused) {
    for (const char* word : {"", "Text", "=x", "="}) {
        EXPECT_THROW(readAssignments({word}, typeOf), UsageError) << word;
    }
    EXPECT_THROW(readAssignments({"Text=a", "TEXT=b"}, typeOf), UsageError);
}

TEST(Prefixes, AreMasks) {
    EXPECT_EQ(splitPrefix("192.0.2.1/24"), (std::pair<std::string, std::string>("192.0.2.1", "255.255.255.0")));
    EXPECT_EQ(splitPrefix("a/1").second, "128.0.0.0");
    EXPECT_EQ(splitPrefix("a/9").second, "255.128.0.0");
    EXPECT_EQ(splitPrefix("a/31").second, "255.255.255.254");
    EXPECT_EQ(splitPrefix("a/32").second, "255.255.255.255");
    EXPECT_EQ(splitPrefix("192.0.2.1"), (std::pair<std::string, std::string>("192.0.2.1", "")));
    for (const char* wrong : {"a/", "a/0", "a/33", "a/-1", "a/2 4", "a/24/", "a/0x18", "a/4294967297"}) {
        EXPECT_THROW(splitPrefix(wrong), UsageError) << wrong;
    }
}

TEST(Cells, HaveALineForEachElement) {
    EXPECT_THAT(showInCell(Value::boolean(true)), ElementsAre("yes"));
    EXPECT_THAT(showInCell(Value::null(CMPI_string)), ElementsAre("-"));
    EXPECT_THAT(showInCell(Value::string("")), ElementsAre("-"));
    EXPECT_THAT(
        showInCell({CMPI_stringA, Value::Array{Value::string("a"), Value::null(CMPI_string), Value::string("b")}}),
        ElementsAre("a", "b"));
}

Instance adapter(const std::string& name, std::vector<NamedValue> properties) {
    return {{"", "root/test", "C", {{"Id", Value::string(name)}}}, std::move(properties)};
}

TEST(Differences, AreThoseOfTheValuesWithWhatIsMissingAsNULL) {
    Class definition;
    definition.name = "C";
    for (const char* name : {"Id", "A", "B"}) {
        Property property;
        property.name = name;
        property.type = CMPI_string;
        definition.properties.push_back(property);
    }
    const std::vector<Instance> before{
        adapter("eth0",
                {{"Id", Value::string("eth0")}, {"A", Value::string("old")}, {"B", Value::null(CMPI_string)}}),
        adapter("gone", {{"Id", Value::string("gone")}})};
    const std::vector<Instance> after{adapter("new", {{"Id", Value::string("new")}}),
                                      adapter("eth0", {{"Id", Value::string("eth0")}, {"A", Value::string("new")}})};
    std::vector<std::string> lines;
    for (const Difference& each : compare(definition, before, after)) {
        lines.push_back(each.adapter + " " + each.property + " " + showValue(each.before) + " " +
                        showValue(each.after));
    }
    EXPECT_THAT(lines, ElementsAre("eth0 A \"old\" \"new\"", "gone Id \"gone\" NULL", "new Id NULL \"new\""));
    EXPECT_EQ(showDifferences(compare(definition, {}, {after[0]}), 0, false), "ADAPTER  PROPERTY  BEFORE  AFTER\n"
                                                                              "new      Id        -       new\n");
}

} // namespace
} // namespace marlo::cli
