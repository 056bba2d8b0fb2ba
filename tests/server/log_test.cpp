#include "host/server/Log.h"

#include <filesystem>
#include <fstream>
#include <nlohmann/json.hpp>
#include <sstream>
#include <stdexcept>

#include <gmock/gmock.h>
#include <gtest/gtest.h>

namespace marlo::server {
namespace {

using testing::ElementsAre;
using testing::HasSubstr;
using testing::IsEmpty;
using testing::MatchesRegex;

std::string readFile(const std::string& file) {
    std::ifstream stream(file);
    return {std::istreambuf_iterator<char>(stream), {}};
}

/** A log file of the test's own. */
class ServerLog : public testing::Test {
  protected:
    ServerLog() {
        std::string pattern = testing::TempDir() + "marlo-log-XXXXXX";
        if (mkdtemp(pattern.data()) == nullptr) {
            throw std::runtime_error("mkdtemp failed");
        }
        _directory = pattern;
    }

    ~ServerLog() override { std::filesystem::remove_all(_directory); }

    [[nodiscard]] LogOptions options(const std::string& name, LogLevel level = LogLevel::info) const {
        return {level, LogFormat::logfmt, "file:" + _directory + "/" + name};
    }

    [[nodiscard]] std::string text(const std::string& name) const { return readFile(_directory + "/" + name); }

    [[nodiscard]] const std::string& directory() const { return _directory; }

  private:
    std::string _directory;
};

TEST(LogLine, QuotesInLogfmtWhatNeedsIt) {
    EXPECT_EQ(
        formatLogLine(LogFormat::logfmt, "T", LogLevel::info, "request",
                      {{"id", std::uint64_t{7}},
                       {"user", "marlo"},
                       {"empty", ""},
                       {"path", "C.K=\"a b\""},
                       {"back", "a\\b"},
                       {"umlaut", "\xC3\xA4"}}),
        R"(time=T level=info event=request id=7 user=marlo empty="" path="C.K=\"a b\"" back="a\\b" umlaut="ä")");
}

TEST(LogLine, IsAnObjectInJson) {
    const std::string line = formatLogLine(LogFormat::json, "T", LogLevel::error, "start",
                                           {{"id", std::uint64_t{7}}, {"text", "\"q\"\\"}});
    const auto json = nlohmann::ordered_json::parse(line);
    EXPECT_EQ(json.dump(), R"({"time":"T","level":"error","event":"start","id":7,"text":"\"q\"\\"})");
}

TEST(LogLine, StaysOneLineOfValidText) {
    const LogFields fields{{"text", "a\nb\r\x1b[31m\xFF"}};
    EXPECT_THAT(formatLogLine(LogFormat::logfmt, "T", LogLevel::info, "x", fields),
                HasSubstr("text=\"a b  [31m\xEF\xBF\xBD\""));
    const auto json = nlohmann::json::parse(formatLogLine(LogFormat::json, "T", LogLevel::info, "x", fields));
    EXPECT_EQ(json["text"], "a b  [31m\xEF\xBF\xBD");
}

TEST_F(ServerLog, HasLinesWithTheirTime) {
    Log log(options("log"));
    log.write(LogLevel::warning, "access", "no");
    EXPECT_THAT(text("log"), MatchesRegex("time=20[0-9-]+T[0-9:]+\\.[0-9][0-9][0-9]Z level=warning event=access "
                                          "text=no\n"));
}

TEST_F(ServerLog, LeavesOutWhatIsBelowItsLevel) {
    Log log(options("log", LogLevel::warning));
    log.write(LogLevel::info, "a", "");
    log.write(LogLevel::error, "b", "");
    EXPECT_THAT(text("log"), HasSubstr("event=b"));
    EXPECT_THAT(text("log"), Not(HasSubstr("event=a")));
}

TEST_F(ServerLog, GoesOnInANewFileAfterItWasMovedAway) {
    Log log(options("log"));
    log.write(LogLevel::info, "a", "");
    std::filesystem::rename(directory() + "/log", directory() + "/log.1");
    log.reopen(options("log"));
    log.write(LogLevel::info, "b", "");
    EXPECT_THAT(text("log.1"), HasSubstr("event=a"));
    EXPECT_THAT(text("log"), HasSubstr("event=b"));
}

TEST_F(ServerLog, KeepsWhatItHasWhereANewSinkCannotBeOpened) {
    Log log(options("log"));
    std::filesystem::create_directory(directory() + "/directory");
    EXPECT_THROW(log.reopen(options("directory")), std::exception);
    log.write(LogLevel::info, "a", "");
    EXPECT_THAT(text("log"), HasSubstr("event=a"));
}

TEST_F(ServerLog, CountsWhatAFullDiskCosts) {
    Log log({LogLevel::info, LogFormat::logfmt, "file:/dev/full"});
    testing::internal::CaptureStderr();
    log.write(LogLevel::info, "a", "");
    log.write(LogLevel::info, "b", "");
    const std::string said = testing::internal::GetCapturedStderr();
    EXPECT_EQ(log.lost(), 2U);
    EXPECT_TRUE(log.isFailing());
    EXPECT_THAT(said, HasSubstr("marlo: log file:/dev/full: lines are lost: "));
    EXPECT_EQ(said.find("lost"), said.rfind("lost")) << "said once";
    log.reopen(options("log"));
    log.write(LogLevel::info, "c", "");
    EXPECT_FALSE(log.isFailing());
    EXPECT_EQ(log.lost(), 2U);
}

TEST(LogLevels, HaveNames) {
    EXPECT_EQ(logLevelOf("debug"), LogLevel::debug);
    EXPECT_EQ(logLevelOf("error"), LogLevel::error);
    EXPECT_EQ(logLevelOf("Error"), std::nullopt);
}

} // namespace
} // namespace marlo::server
