#include "host/cli/Table.h"
#include "host/cli/Text.h"

#include <string>

#include <gmock/gmock.h>
#include <gtest/gtest.h>

namespace marlo::cli {
namespace {

TEST(CliText, CountsColumnsOfWideAndOfCombiningCharacters) {
    EXPECT_EQ(displayWidth(""), 0U);
    EXPECT_EQ(displayWidth("eth0"), 4U);
    EXPECT_EQ(displayWidth("\xC3\xA4"), 1U);
    EXPECT_EQ(displayWidth("a\xCC\x88"), 1U);
    EXPECT_EQ(displayWidth("網卡"), 4U);
    EXPECT_EQ(displayWidth("\xFF"), 1U);
}

TEST(CliText, FitsWholeCharacters) {
    EXPECT_EQ(fittingLength("abc", 2), 2U);
    EXPECT_EQ(fittingLength("abc", 5), 3U);
    EXPECT_EQ(fittingLength("網卡", 3), 3U);
    EXPECT_EQ(fittingLength("網卡", 1), 3U);
    EXPECT_EQ(fittingLength("", 3), 0U);
}

TEST(CliText, ReplacesWhatCouldSteerATerminal) {
    EXPECT_EQ(makePrintable("a\x1b[2J\n\xC2\x9B\xFFz"), "a\xEF\xBF\xBD[2J\xEF\xBF\xBD\xEF\xBF\xBD\xEF\xBF\xBDz");
    EXPECT_EQ(makePrintable("plain \xC3\xA4"), "plain \xC3\xA4");
}

TEST(CliText, ShowsValuesInTheNotationOfMof) {
    EXPECT_EQ(showValue(Value::string("a\"b\\c\td\x01")), R"("a\"b\\c\td\x0001")");
    EXPECT_EQ(showValue(Value::null(CMPI_string)), "NULL");
    EXPECT_EQ(showValue(Value::boolean(false)), "FALSE");
    EXPECT_EQ(showValue(Value::sint(CMPI_sint8, -5)), "-5");
    EXPECT_EQ(showValue({CMPI_real64, 0.1}), "0.1");
    EXPECT_EQ(showValue({CMPI_stringA, Value::Array{Value::string("a"), Value::null(CMPI_string)}}),
              R"({"a", NULL})");
    EXPECT_EQ(showValue({CMPI_stringA, Value::Array{}}), "{}");
}

TEST(CliTable, AlignsColumnsAndPutsSeveralValuesBelowEachOther) {
    Table table({"A", "LONG", "C"});
    table.add({{{"1"}, {}}, {{"x", "yyyyyy"}, {}}, {{"3"}, {}}});
    table.add({{{"網"}, {}}, {{}, {}}, {{"z"}, {}}});
    EXPECT_EQ(table.render(0, false), "A   LONG    C\n"
                                      "1   x       3\n"
                                      "    yyyyyy\n"
                                      "網          z\n");
}

TEST(CliTable, WrapsTheWidestColumnBehindASeparator) {
    Table table({"NAME", "ADDRESS"});
    table.add({{{"eth0"}, {}}, {{"2001:db8:1:2:3:4:5:6"}, {}}});
    EXPECT_EQ(table.render(18, false), "NAME  ADDRESS\n"
                                       "eth0  2001:db8:1:\n"
                                       "      2:3:4:5:6\n");
}

TEST(CliTable, BreaksWhatHasNoSeparator) {
    Table table({"NAME"});
    table.add({{{"abcdefghijklmnop"}, {}}});
    EXPECT_EQ(table.render(10, false), "NAME\nabcdefghij\nklmnop\n");
}

TEST(CliTable, StaysReadableInATerminalThatIsTooNarrow) {
    Table table({"A", "B"});
    table.add({{{"aaaaaaaaaa"}, {}}, {{"bbbbbbbbbb"}, {}}});
    EXPECT_EQ(table.render(3, false), "A         B\naaaaaaaa  bbbbbbbb\naa        bb\n");
}

TEST(CliTable, ColoursTextsButNotBlanks) {
    Table table({"A", "B"});
    table.add({{{"ok"}, Style::Good}, {{"x"}, Style::Plain}});
    EXPECT_EQ(table.render(0, true), "\x1b[2mA\x1b[0m   \x1b[2mB\x1b[0m\n\x1b[32mok\x1b[0m  x\n");
}

} // namespace
} // namespace marlo::cli
