#include "tests/provider/Tree.h"
#include "trace/Trace.h"

#include <string>
#include <type_traits>

#include <gmock/gmock.h>
#include <gtest/gtest.h>

namespace {

using namespace Orv;
using provider_test::normalised;
using scripted_agent::record;
using scripted_agent::recorded;
using testing::AllOf;
using testing::ElementsAre;
using testing::HasSubstr;
using testing::StartsWith;

const std::string LOGGER = "Hearth.Test";

class Trace : public testing::Test {
  protected:
    Trace() { scripted_agent::reset(); }
};

TEST_F(Trace, KindsHaveTheirNumbers) {
    EXPECT_EQ(TRACE_ENTERING, 0);
    EXPECT_EQ(TRACE_EXITING, 1);
    EXPECT_EQ(TRACE_METHOD, 2);
    EXPECT_EQ(TRACE_MESSAGE, 3);
}

TEST_F(Trace, FormatsEntering) {
    EXPECT_STREQ(trace("Unit", "doThings", 12, TRACE_ENTERING), "ENTERING: doThings() in Unit [Line: 12]");
}

TEST_F(Trace, FormatsExiting) {
    EXPECT_STREQ(trace("Unit", "doThings", 12, TRACE_EXITING), "EXITING: doThings() in Unit [Line: 12]");
}

TEST_F(Trace, FormatsMethod) {
    EXPECT_STREQ(trace("Unit", "doThings", 12, TRACE_METHOD), "METHOD: doThings() was invoked in Unit [Line: 12]");
}

TEST_F(Trace, FormatsMessageWithFileAndLineBeforeTheText) {
    EXPECT_STREQ(trace("Unit", "what happened", 12, TRACE_MESSAGE), "MESSAGE [File: Unit, Line: 12]: what happened");
}

TEST_F(Trace, KindFourGivesAnEmptyText) {
    EXPECT_STRNE(trace("Unit", "doThings", 12, TRACE_ENTERING), "");
    EXPECT_STREQ(trace("Unit", "doThings", 12, static_cast<MessageType>(4)), "");
    EXPECT_STREQ(trace("Unit", "doThings", 12, static_cast<MessageType>(-1)), "");
}

TEST_F(Trace, FormatsVariableWithText) {
    EXPECT_STREQ(trace("name", "Unit", 7, "value"), "VARIABLE: 'name' has Value 'value' at line 7 in Unit");
}

TEST_F(Trace, FormatsVariableWithNumber) {
    EXPECT_STREQ(trace("name", "Unit", 7, 42U), "VARIABLE: 'name' has Value '42' at line 7 in Unit");
}

TEST_F(Trace, LargeUnsignedVariableReadsNegative) {
    EXPECT_STREQ(trace("n", "Unit", 7, 4294967295U), "VARIABLE: 'n' has Value '-1' at line 7 in Unit");
    EXPECT_STREQ(trace("n", "Unit", 7, 2147483648U), "VARIABLE: 'n' has Value '-2147483648' at line 7 in Unit");
}

TEST_F(Trace, EveryFormatterHasOneBufferOfItsOwn) {
    const char* kind = trace("Unit", "f", 1, TRACE_ENTERING);
    const char* text = trace("n", "Unit", 1, "v");
    const char* number = trace("n", "Unit", 1, 1U);
    EXPECT_EQ(trace("Unit", "g", 2, TRACE_MESSAGE), kind);
    EXPECT_EQ(trace("m", "Unit", 2, "w"), text);
    EXPECT_EQ(trace("m", "Unit", 2, 2U), number);
    EXPECT_NE(kind, text);
    EXPECT_NE(text, number);
    EXPECT_NE(kind, number);
}

TEST_F(Trace, BufferIsClearedToItsEnd) {
    (void)trace("n", "Unit", 1, std::string(400, 'x').c_str());
    const char* buffer = trace("n", "Unit", 1, "v");
    const std::string all(buffer, 512);
    EXPECT_EQ(all.substr(std::string(buffer).size()).find_first_not_of('\0'), std::string::npos);
}

TEST_F(Trace, LinesThatDoNotFitAreCutAtTheBuffersEnd) {
    const std::string huge(2000, 'x');
    EXPECT_EQ(std::string(trace("n", "Unit", 1, huge.c_str())).size(), 511U);
    EXPECT_EQ(std::string(trace("Unit", huge.c_str(), 1, TRACE_MESSAGE)).size(), 511U);
    EXPECT_EQ(std::string(trace(huge.c_str(), "Unit", 1, 1U)).size(), 511U);
}

TEST_F(Trace, LinesThatJustFitAreWhole) {
    const std::string frame = trace("n", "Unit", 1, "");
    const std::string value(511 - frame.size(), 'x');
    EXPECT_THAT(std::string(trace("n", "Unit", 1, value.c_str())), testing::EndsWith("' at line 1 in Unit"));
}

TEST_F(Trace, NullTextsShowAsSuch) {
    EXPECT_STREQ(trace("n", "Unit", 7, static_cast<const char*>(nullptr)),
                 "VARIABLE: 'n' has Value '(null)' at line 7 in Unit");
    EXPECT_STREQ(trace("Unit", nullptr, 7, TRACE_MESSAGE), "MESSAGE [File: Unit, Line: 7]: (null)");
}

TEST_F(Trace, AnEventIsFormattedAndWrittenOnceForTheLogAndAgainForTheTrace) {
    int formatted = 0;
    ProviderLog(LOGGER, "Unit", "f").write(6000, 5, [&] {
        scripted_agent::note("format " + std::to_string(++formatted));
        return "text";
    });
    EXPECT_THAT(record(), ElementsAre("buffer()", "format 1", "buffer << \"text\"", "buffer str",
                                      "log 6000 Hearth.Test Unit:5 f | text", "format 2", "buffer << \"text\"",
                                      "buffer str", "trace 6000 Hearth.Test Unit:5 f | text", "~buffer()"));
}

TEST_F(Trace, EventsCarryThePlaceTheyComeFrom) {
    const ProviderLog log(LOGGER, "Unit", __func__);
    log.message(3000, "left out");
    const std::string here = std::to_string(__LINE__ - 1);
    const std::string text =
        " Hearth.Test Unit:" + here + " TestBody | MESSAGE [File: Unit, Line: " + here + "]: left out";
    EXPECT_THAT(recorded("log"), ElementsAre("log 3000" + text));
    EXPECT_THAT(recorded("trace"), ElementsAre("trace 3000" + text));
}

TEST_F(Trace, FlowAndVariablesAreLevel4000) {
    const ProviderLog log(LOGGER, "Unit", "f");
    log.entering();
    log.variable("a", std::string("b"));
    log.variable("c", 3U);
    log.exiting();
    EXPECT_THAT(normalised(recorded("trace")),
                ElementsAre("trace 4000 Hearth.Test Unit:N f | ENTERING: f() in Unit [Line: N]",
                            "trace 4000 Hearth.Test Unit:N f | VARIABLE: 'a' has Value 'b' at line N in Unit",
                            "trace 4000 Hearth.Test Unit:N f | VARIABLE: 'c' has Value '3' at line N in Unit",
                            "trace 4000 Hearth.Test Unit:N f | EXITING: f() in Unit [Line: N]"));
}

const std::string BANNER(78, '=');

TEST_F(Trace, EntryMarkIsTheBannerThenTheEnteringLine) {
    markProviderEntry(LOGGER, "Unit", "P_EnumInstances", 99);
    const std::string at = " 4000 Hearth.Test Trace:N markProviderEntry | ";
    const std::string entering = "ENTERING: P_EnumInstances() in Unit [Line: 99]";
    std::vector<std::string> lines = recorded("");
    std::erase_if(lines, [](const std::string& line) { return line.find("buffer") != std::string::npos; });
    for (std::string& line : lines) {
        line = std::regex_replace(line, std::regex("Trace:\\d+ "), "Trace:N ");
    }
    EXPECT_THAT(lines, ElementsAre("log" + at + BANNER, "trace" + at + BANNER, "log" + at + entering,
                                   "trace" + at + entering));
}

TEST_F(Trace, ExitMarkIsTheExitingLineThenTheBanner) {
    markProviderExit(LOGGER, "Unit", "P_EnumInstances", 99);
    const std::string at = " 4000 Hearth.Test Trace:N markProviderExit | ";
    const std::string exiting = "EXITING: P_EnumInstances() in Unit [Line: 99]";
    std::vector<std::string> lines = recorded("");
    std::erase_if(lines, [](const std::string& line) { return line.find("buffer") != std::string::npos; });
    for (std::string& line : lines) {
        line = std::regex_replace(line, std::regex("Trace:\\d+ "), "Trace:N ");
    }
    EXPECT_THAT(
        lines, ElementsAre("log" + at + exiting, "trace" + at + exiting, "log" + at + BANNER, "trace" + at + BANNER));
}

TEST_F(Trace, MarksGiveALinePlaceInsideTheTraceUnit) {
    markProviderEntry(LOGGER, "Unit", "f", 99);
    for (const std::string& line : recorded("log")) {
        EXPECT_THAT(line, testing::Not(HasSubstr("Trace:99 ")));
        EXPECT_THAT(line, testing::Not(HasSubstr("Trace:0 ")));
    }
}

TEST_F(Trace, ProviderExceptionCarriesItsMessage) {
    static_assert(std::is_base_of_v<std::exception, ProviderException>);
    try {
        throw ProviderException("Failed while setting IPSupport.");
    } catch (const std::exception& caught) {
        EXPECT_STREQ(caught.what(), "Failed while setting IPSupport.");
    }
}

} // namespace
