// What the agent library does with a process's first use of it; the process is agent_probe, one per case.
#include "tests/agent/TemporaryFile.h"

#include <filesystem>

#include <gmock/gmock.h>
#include <gtest/gtest.h>
#include <sys/wait.h>

namespace {

using Orv::Test::TemporaryFile;
using testing::HasSubstr;
using testing::StartsWith;

struct Outcome {
    int exitCode;
    std::string output;
    std::string errors;
};

struct ProcessTest : testing::Test {
    /** Runs the probe with these variables and arguments. */
    Outcome probe(const std::string& variables, const std::string& arguments) {
        const std::string output = (files.directory() / "output").string();
        const std::string errors = (files.directory() / "errors").string();
        const std::string command =
            "env " + variables + " '" AGENT_PROBE "' " + arguments + " >'" + output + "' 2>'" + errors + "'";
        const int status = std::system(command.c_str()); // NOLINT(cert-env33-c): the command is the test's own
        return {WIFEXITED(status) ? WEXITSTATUS(status) : -1, TemporaryFile::readFrom(output),
                TemporaryFile::readFrom(errors)};
    }

    std::string configured(const std::string& content) const {
        file.write(content);
        return "ORV_AGENT_CONFIG='" + file.path() + "'";
    }

    TemporaryFile files{"unused"};
    TemporaryFile file{"agent.toml"};
    TemporaryFile tree{"lab.toml", "[[adapter]]\nidentity = \"eth0\"\n"};
};

TEST_F(ProcessTest, ReadsTheTreeThatTheConfigurationNames) {
    const Outcome outcome = probe(configured("tree_file = \"" + tree.path() + "\"\n"), "scan");
    EXPECT_EQ(outcome.exitCode, 0);
    EXPECT_EQ(outcome.output, "eth0\n");
    EXPECT_EQ(outcome.errors, "");
}

TEST_F(ProcessTest, ReadsTheTreeThatTheEnvironmentNames) {
    EXPECT_EQ(probe(configured("") + " ORV_AGENT_TREE='" + tree.path() + "'", "scan").output, "eth0\n");
}

TEST_F(ProcessTest, FailsWithTheReasonWhenTheConfigurationIsWrong) {
    const Outcome outcome = probe(configured("[log]\nlevel = \"high\"\n"), "scan");
    const std::string why = file.path() + ":2: log.level: expected an integer from 0 to 2147483647, found a string";
    EXPECT_EQ(outcome.exitCode, 1);
    EXPECT_EQ(outcome.output, "thrown: " + why + "\n");
    EXPECT_THAT(outcome.errors, HasSubstr("error [Hearth.Agent] " + why + "\n"));
}

TEST_F(ProcessTest, TellsTheReasonOnceWhereAnObserverIsToldIt) {
    const Outcome outcome = probe(configured("back_end = \"bsd\"\n"), "observe scan");
    const std::string why = file.path() + R"(:1: back_end: expected "linux" or "file", found "bsd")";
    EXPECT_EQ(outcome.output, "observed: 6000 Hearth.Agent " + why + "\nthrown: " + why + "\n");
    EXPECT_EQ(outcome.errors, "");
}

TEST_F(ProcessTest, TriesAgainAfterAWrongConfigurationAndUsesItsLogThen) {
    const TemporaryFile log("marlo.log");
    const TemporaryFile mended("mended.toml", "tree_file = \"" + tree.path() +
                                                  "\"\n[log]\nlevel = 4000\nsinks = [\"file:" + log.path() + "\"]\n");
    const Outcome outcome = probe(configured("[log]\nlevel = -1\n"),
                                  "scan rename '" + mended.path() + "' '" + file.path() + "' scan log");
    EXPECT_THAT(outcome.output, StartsWith("thrown: " + file.path() + ":2: log.level: "));
    EXPECT_THAT(outcome.output, HasSubstr("\neth0\n"));
    EXPECT_THAT(log.read(), HasSubstr("info [Hearth.Probe] a line\n"));
}

TEST_F(ProcessTest, LogsBeforeAnyCursorByTheConfiguration) {
    const TemporaryFile log("marlo.log");
    const Outcome outcome = probe(configured("[log]\nlevel = 4000\nsinks = [\"file:" + log.path() + "\"]\n"), "log");
    EXPECT_EQ(outcome.errors, "");
    EXPECT_THAT(log.read(), HasSubstr("info [Hearth.Probe] a line\n"));
}

TEST_F(ProcessTest, KeepsFailuresOnTheStandardErrorStreamAndNoTraceByDefault) {
    const Outcome outcome = probe(configured(""), "log fail trace");
    EXPECT_THAT(outcome.errors, HasSubstr("error [Hearth.Probe] a failure\n"));
    EXPECT_THAT(outcome.errors, Not(HasSubstr("a line")));
    EXPECT_THAT(outcome.errors, Not(HasSubstr("a trace line")));
}

/** A daemon that goes into the background leaves the threads of the library behind. */
TEST_F(ProcessTest, MonitorsInAForkedProcessToo) {
    // ThreadSanitizer wants to be told that threads after a fork are meant, and the leak check that the memory of the
    // threads left behind is nobody's.
    const Outcome outcome = probe("TSAN_OPTIONS=die_after_fork=0 ASAN_OPTIONS=$ASAN_OPTIONS:detect_leaks=0 " +
                                      configured("") + " ORV_AGENT_TREE='" + tree.path() + "'",
                                  "watch 12 fork watch 5");
    EXPECT_EQ(outcome.exitCode, 0) << outcome.errors;
    EXPECT_EQ(outcome.output, "event: 12\nevent: 5\n");
}

TEST_F(ProcessTest, ExportsItsInterfaceAndNothingElse) {
    const std::string command =
        "nm -D --defined-only -C '" AGENT_LIBRARY "' >'" + (files.directory() / "names").string() + "'";
    ASSERT_EQ(std::system(command.c_str()), 0); // NOLINT(cert-env33-c)
    std::istringstream names(TemporaryFile::readFrom(files.directory() / "names"));
    int count = 0;
    for (std::string line; std::getline(names, line); ++count) {
        const std::string name = line.substr(19); // after the address and the kind
        const bool belongs = name == "OrvAgent_observeLog" || name.starts_with("Orv::Instrumentation::") ||
                             name.starts_with("Orv::DateTime::") || name.starts_with("LumLog::LumMessageBuffer::") ||
                             name.starts_with("LumLog::LumLogger::") || name.starts_with("Orv::textEqual(") ||
                             name.starts_with("Orv::stripSpaces(") || name.starts_with("Orv::getSystemName") ||
                             name.starts_with("Orv::isObjPathsEqual(") || name.starts_with("Orv::mapProperty(") ||
                             name.starts_with("Orv::Locale::") || name.starts_with("Orv::ResourceString(") ||
                             name.starts_with("Orv::make_string(") || name.starts_with("Orv::Product::");
        EXPECT_TRUE(belongs) << line;
        EXPECT_EQ(name.find("State"), std::string::npos) << line;
    }
    EXPECT_GT(count, 40);
}

} // namespace
