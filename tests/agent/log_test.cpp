#include "agent/library/Log.h"
#include "tests/agent/TemporaryFile.h"

#include <climits>
#include <thread>

#include <gmock/gmock.h>
#include <gtest/gtest.h>

namespace {

using Orv::Agent::Configuration;
using Orv::Agent::Log;
using Orv::Agent::LogChannel;
using Orv::Agent::LogLine;
using Orv::Test::TemporaryFile;
using testing::ContainsRegex;
using testing::ElementsAre;
using testing::HasSubstr;

LogLine line(int level, std::string_view text, std::string_view logger = "Hearth.Test") {
    return {"function", "dir/File.cpp", 12, logger, level, text};
}

std::size_t linesOf(const std::string& text) {
    return static_cast<std::size_t>(std::count(text.begin(), text.end(), '\n'));
}

struct LogChannelTest : testing::Test {
    std::string fileSink() const { return "file:" + file.path(); }

    TemporaryFile file{"marlo.log"};
    LogChannel channel;
};

TEST_F(LogChannelTest, KeepsNothingUntilItIsConfigured) {
    EXPECT_FALSE(channel.keeps(6000));
    channel.write(line(6000, "lost"), false);
}

TEST_F(LogChannelTest, KeepsNothingWithoutSinks) {
    channel.configure({0, {}}, "%v");
    EXPECT_FALSE(channel.keeps(6000));
    EXPECT_FALSE(channel.keeps(INT_MAX - 1));
}

TEST_F(LogChannelTest, KeepsLinesOfItsLevelAndAbove) {
    channel.configure({4000, {fileSink()}}, "%v");
    EXPECT_FALSE(channel.keeps(3999));
    EXPECT_TRUE(channel.keeps(4000));
    EXPECT_TRUE(channel.keeps(6000));
}

TEST_F(LogChannelTest, AppendsToAFile) {
    file.write("before\n");
    channel.configure({0, {fileSink()}}, "%l [%n] %v");
    channel.write(line(6000, "it failed"), false);
    channel.write(line(4000, "it went on"), false);
    channel.write(line(3000, "it was filtered"), false);
    EXPECT_EQ(file.read(), "before\nerror [Hearth.Test] it failed\ninfo [Hearth.Test] it went on\n"
                           "debug [Hearth.Test] it was filtered\n");
}

TEST_F(LogChannelTest, SaysWhereALineComesFrom) {
    channel.configure({0, {fileSink()}}, "%s:%# %!(): %v");
    channel.write(line(4000, "text"), false);
    channel.write({nullptr, nullptr, 7, "", 4000, "from nowhere"}, false);
    EXPECT_THAT(file.read(), HasSubstr("File.cpp:12 function(): text\n"));
    EXPECT_THAT(file.read(), HasSubstr("from nowhere\n"));
}

TEST_F(LogChannelTest, KeepsALineOneLineOfValidText) {
    channel.configure({0, {fileSink()}}, "%v");
    channel.write(line(6000, "a\nforged line \xFF"), false);
    EXPECT_EQ(file.read(), "a forged line \xEF\xBF\xBD\n");
}

TEST_F(LogChannelTest, WritesToTheStandardErrorStream) {
    testing::internal::CaptureStderr();
    channel.configure({0, {"stderr"}}, "%v");
    channel.write(line(6000, "seen"), false);
    EXPECT_EQ(testing::internal::GetCapturedStderr(), "seen\n");
}

TEST_F(LogChannelTest, LeavesTheStandardErrorStreamOutOfWhatIsShownElsewhere) {
    testing::internal::CaptureStderr();
    channel.configure({0, {"stderr", fileSink()}}, "%v");
    channel.write(line(6000, "shown"), true);
    EXPECT_EQ(testing::internal::GetCapturedStderr(), "");
    EXPECT_EQ(file.read(), "shown\n");
}

TEST_F(LogChannelTest, WritesToEverySink) {
    const TemporaryFile other("other.log");
    channel.configure({0, {fileSink(), "file:" + other.path()}}, "%v");
    channel.write(line(6000, "twice"), false);
    EXPECT_EQ(file.read(), "twice\n");
    EXPECT_EQ(other.read(), "twice\n");
}

TEST_F(LogChannelTest, GoesOnWithoutASinkThatCannotBeOpened) {
    testing::internal::CaptureStderr();
    channel.configure({0, {"file:/proc/none/x.log", fileSink()}}, "%v");
    EXPECT_THAT(testing::internal::GetCapturedStderr(), HasSubstr("log sink file:/proc/none/x.log: not opened: "));
    channel.write(line(6000, "kept"), false);
    EXPECT_EQ(file.read(), "kept\n");
}

TEST_F(LogChannelTest, SaysOnceThatADiskIsFullAndGoesOn) {
    channel.configure({0, {"file:/dev/full", fileSink()}}, "%v");
    testing::internal::CaptureStderr();
    channel.write(line(6000, "one"), false);
    channel.write(line(6000, "two"), false);
    const std::string said = testing::internal::GetCapturedStderr();
    EXPECT_THAT(said, HasSubstr("log sink file:/dev/full: lines are lost: "));
    EXPECT_EQ(linesOf(said), 1U) << said;
    EXPECT_EQ(file.read(), "one\ntwo\n");
}

TEST_F(LogChannelTest, KeepsLinesOfManyThreadsWholeWhileItIsConfiguredAnew) {
    channel.configure({0, {fileSink()}}, "%v");
    std::vector<std::thread> threads;
    for (int i = 0; i < 4; ++i) {
        threads.emplace_back([&, i] {
            for (int j = 0; j < 250; ++j) {
                channel.write(line(6000, std::string(50, static_cast<char>('a' + i))), false);
            }
        });
    }
    for (int i = 0; i < 20; ++i) {
        channel.configure({0, {fileSink()}}, "%v");
    }
    for (auto& thread : threads) {
        thread.join();
    }
    std::istringstream text(file.read());
    std::size_t count = 0;
    for (std::string one; std::getline(text, one); ++count) {
        ASSERT_EQ(one, std::string(50, one.at(0)));
    }
    EXPECT_EQ(count, 1000U);
}

/** The log of the process, with what an observer was shown. */
struct LogTest : testing::Test {
    ~LogTest() override { Log::instance().observe(0, nullptr, nullptr); }

    void configure(int logLevel, int traceLevel) const {
        Configuration configuration;
        configuration.log = {logLevel, {"file:" + log.path()}};
        configuration.trace = {traceLevel, {"file:" + trace.path()}};
        Log::instance().configure(configuration);
    }

    void observe(int level) { Log::instance().observe(level, &LogTest::show, this); }

    static void show(int level, const char* logger, const char* message, void* context) {
        static_cast<LogTest*>(context)->shown.push_back(std::to_string(level) + " " + logger + " " + message);
    }

    TemporaryFile log{"marlo.log"};
    TemporaryFile trace{"marlo.trace"};
    std::vector<std::string> shown;
};

TEST_F(LogTest, KeepsLogAndTraceApartWithThresholdsOfTheirOwn) {
    configure(6000, 4000);
    for (const int level : {3000, 4000, 6000}) {
        Log::instance().log(line(level, "log " + std::to_string(level)));
        Log::instance().trace(line(level, "trace " + std::to_string(level)));
    }
    EXPECT_THAT(log.read(), ContainsRegex("^[0-9-]+ [0-9:.]+ error \\[Hearth.Test\\] log 6000\n$"));
    EXPECT_EQ(linesOf(trace.read()), 2U);
    EXPECT_THAT(trace.read(), HasSubstr("info [Hearth.Test] File.cpp:12 function(): trace 4000\n"));
    EXPECT_THAT(trace.read(), HasSubstr("error [Hearth.Test] File.cpp:12 function(): trace 6000\n"));
}

TEST_F(LogTest, ShowsTheObserverLinesOfItsLevelWhateverIsKept) {
    configure(6000, 0);
    observe(4000);
    Log::instance().log(line(3999, "too low"));
    Log::instance().log(line(4000, "below the threshold"));
    Log::instance().log(line(6000, "kept\ntoo", "Hearth.Other"));
    Log::instance().trace(line(6000, "a trace line"));
    EXPECT_THAT(shown, ElementsAre("4000 Hearth.Test below the threshold", "6000 Hearth.Other kept too"));
    EXPECT_EQ(linesOf(log.read()), 1U);
}

TEST_F(LogTest, ShowsNothingAfterTheObserverHasGone) {
    configure(6000, 0);
    observe(0);
    Log::instance().observe(0, nullptr, nullptr);
    Log::instance().log(line(6000, "unseen"));
    EXPECT_THAT(shown, testing::IsEmpty());
}

TEST_F(LogTest, HasOneObserverAtATime) {
    configure(6000, 0);
    std::vector<std::string> first;
    observe(6000);
    Log::instance().observe(
        4000, [](int, const char*, const char*, void* context) { ++*static_cast<int*>(context); }, nullptr);
    int count = 0;
    Log::instance().observe(
        4000, [](int, const char*, const char*, void* context) { ++*static_cast<int*>(context); }, &count);
    Log::instance().log(line(4000, "to the last"));
    EXPECT_EQ(count, 1);
    EXPECT_THAT(shown, testing::IsEmpty());
}

TEST_F(LogTest, DoesNotRepeatOnTheStandardErrorStreamWhatTheObserverIsShown) {
    Configuration configuration;
    Log::instance().configure(configuration);
    observe(6000);
    testing::internal::CaptureStderr();
    Log::instance().log(line(6000, "shown"));
    Log::instance().observe(0, nullptr, nullptr);
    Log::instance().log(line(6000, "not shown"));
    const std::string said = testing::internal::GetCapturedStderr();
    EXPECT_THAT(said, HasSubstr("] not shown\n"));
    EXPECT_EQ(linesOf(said), 1U) << said;
}

TEST_F(LogTest, SurvivesAnObserverThatThrows) {
    configure(6000, 0);
    Log::instance().observe(
        0, [](int, const char*, const char*, void*) { throw 1; }, nullptr);
    EXPECT_NO_THROW(Log::instance().log(line(6000, "text")));
}

TEST_F(LogTest, MayBeObservedAndConfiguredWhileThreadsLog) {
    configure(6000, 6000);
    std::vector<std::thread> threads;
    for (int i = 0; i < 4; ++i) {
        threads.emplace_back([] {
            for (int j = 0; j < 500; ++j) {
                Log::instance().log(line(6000, "log"));
                Log::instance().trace(line(3000, "trace"));
            }
        });
    }
    std::atomic<int> count{0};
    for (int i = 0; i < 50; ++i) {
        configure(6000, i % 2 == 0 ? 3000 : 6000);
        Log::instance().observe(
            i * 1000,
            [](int, const char*, const char*, void* context) { ++*static_cast<std::atomic<int>*>(context); }, &count);
    }
    for (auto& thread : threads) {
        thread.join();
    }
    EXPECT_EQ(linesOf(log.read()), 2000U);
}

} // namespace
