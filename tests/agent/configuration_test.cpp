#include "agent/config/Configuration.h"
#include "tests/agent/TemporaryFile.h"

#include <filesystem>

#include <gmock/gmock.h>
#include <gtest/gtest.h>

namespace {

using Orv::Agent::Configuration;
using Orv::Agent::loadConfiguration;
using Orv::Agent::ManagerChoice;
using Orv::Agent::readConfigurationFile;
using Orv::Test::messageOf;
using Orv::Test::TemporaryFile;
using testing::ElementsAre;
using testing::IsEmpty;

constexpr const char* variables[] = {"ORV_AGENT_CONFIG",      "ORV_AGENT_BACKEND",   "ORV_AGENT_TREE",
                                     "ORV_AGENT_LOG_LEVEL",   "ORV_AGENT_LOG_SINKS", "ORV_AGENT_TRACE_LEVEL",
                                     "ORV_AGENT_TRACE_SINKS", "ORV_AGENT_CONTROL",   "ORV_AGENT_PERSISTENCE"};

void clearVariables() {
    for (const char* name : variables) {
        ::unsetenv(name);
    }
}

struct ConfigurationTest : testing::Test {
    ConfigurationTest() {
        clearVariables();
        ::setenv("ORV_AGENT_CONFIG", file.path().c_str(), 1);
    }

    ~ConfigurationTest() override { clearVariables(); }

    TemporaryFile file{"agent.toml", ""};
};

TEST_F(ConfigurationTest, HasDefaultsWhenNothingIsConfigured) {
    const Configuration configuration = loadConfiguration();
    EXPECT_EQ(configuration.backEnd, Configuration::BackEndKind::Linux);
    EXPECT_EQ(configuration.log.level, 6000);
    EXPECT_THAT(configuration.log.sinks, ElementsAre("stderr"));
    EXPECT_THAT(configuration.trace.sinks, IsEmpty());
    EXPECT_EQ(configuration, Configuration());
}

TEST_F(ConfigurationTest, MayLackTheFileInItsUsualPlaceOnly) {
    ::unsetenv("ORV_AGENT_CONFIG");
    const bool exists = std::filesystem::exists("/etc/marlo/agent.toml");
    EXPECT_EQ(loadConfiguration(), exists ? readConfigurationFile("/etc/marlo/agent.toml") : Configuration());
    ::setenv("ORV_AGENT_CONFIG", "/nowhere/agent.toml", 1);
    EXPECT_EQ(messageOf(loadConfiguration), "/nowhere/agent.toml: cannot be read: No such file or directory");
}

TEST_F(ConfigurationTest, ReadsEveryKey) {
    file.write(R"(
back_end = "file"
tree_file = "/srv/lab.toml"
control = "lab.control"
persistence = "networkd"
[log]
level = 4000
sinks = ["syslog", "file:/var/log/marlo.log"]
[trace]
level = 3000
sinks = ["stderr"]
)");
    const Configuration expected{Configuration::BackEndKind::File,
                                 "/srv/lab.toml",
                                 {4000, {"syslog", "file:/var/log/marlo.log"}},
                                 {3000, {"stderr"}},
                                 (file.directory() / "lab.control").string(),
                                 ManagerChoice::networkd};
    EXPECT_EQ(readConfigurationFile(file.path()), expected);
}

TEST_F(ConfigurationTest, KeepsTheDefaultsOfKeysThatAreNotThere) {
    file.write("[log]\nlevel = 4000\n");
    EXPECT_THAT(loadConfiguration().log.sinks, ElementsAre("stderr"));
    file.write("[log]\nsinks = []\n");
    EXPECT_EQ(loadConfiguration().log.level, 6000);
}

TEST_F(ConfigurationTest, TakesATreeFileRelativeToItself) {
    file.write("tree_file = \"lab.toml\"\n");
    const Configuration configuration = loadConfiguration();
    EXPECT_EQ(configuration.treeFile, (file.directory() / "lab.toml").string());
    EXPECT_EQ(configuration.backEnd, Configuration::BackEndKind::File);
}

TEST_F(ConfigurationTest, KeepsTheHostsBackEndBesideATreeFileWhenToldSo) {
    file.write("tree_file = \"lab.toml\"\nback_end = \"linux\"\n");
    EXPECT_EQ(loadConfiguration().backEnd, Configuration::BackEndKind::Linux);
}

struct Refused {
    const char* what;
    const char* content;
    const char* message; ///< after the file's name
};

class RefusedConfiguration : public testing::TestWithParam<Refused> {};

TEST_P(RefusedConfiguration, NamesFileLineKeyAndReason) {
    const TemporaryFile file("agent.toml", GetParam().content);
    EXPECT_EQ(messageOf([&] { readConfigurationFile(file.path()); }), file.path() + GetParam().message);
}

INSTANTIATE_TEST_SUITE_P(
    Files, RefusedConfiguration,
    testing::Values(
        Refused{"UnknownKey", "\ncolour = 1\n", ":2: colour: unknown key"},
        Refused{"UnknownTable", "[logs]\nlevel = 1\n", ":1: logs: unknown key"},
        Refused{"UnknownKeyOfAChannel", "[log]\nlevel = 1\nsink = \"stderr\"\n", ":3: log.sink: unknown key"},
        Refused{"BackEndOfAnotherType", "back_end = 1\n", ":1: back_end: expected a string, found an integer"},
        Refused{"UnknownBackEnd", "back_end = \"bsd\"\n",
                ":1: back_end: expected \"linux\" or \"file\", found \"bsd\""},
        Refused{"UnknownManager", "persistence = \"wicked\"\n",
                ":1: persistence: expected \"auto\", \"ifupdown\", \"networkd\" or \"none\", found \"wicked\""},
        Refused{"FileBackEndWithoutAFile", "back_end = \"file\"\n",
                ":1: back_end: the file back end needs tree_file"},
        Refused{"ChannelOfAnotherType", "trace = true\n", ":1: trace: expected a table, found a boolean"},
        Refused{"LevelOfAnotherType", "[log]\nlevel = \"high\"\n",
                ":2: log.level: expected an integer from 0 to 2147483647, found a string"},
        Refused{"NegativeLevel", "[log]\nlevel = -1\n",
                ":2: log.level: expected an integer from 0 to 2147483647, found -1"},
        Refused{"LevelOutOfRange", "[log]\nlevel = 2147483648\n",
                ":2: log.level: expected an integer from 0 to 2147483647, found 2147483648"},
        Refused{"SinksOfAnotherType", "[log]\nsinks = \"stderr\"\n",
                ":2: log.sinks: expected a list of strings, found a string"},
        Refused{"SinkOfAnotherType", "[log]\nsinks = [\n\"stderr\",\n3]\n",
                ":4: log.sinks: expected a list of strings, found an integer"},
        Refused{"UnknownSink", "[trace]\nlevel = 0\nsinks = [\"stdout\"]\n",
                ":3: trace.sinks: expected \"stderr\", \"syslog\" or \"file:PATH\", found \"stdout\""},
        Refused{"SinkWithoutAPath", "[trace]\nsinks = [\"file:\"]\n",
                ":2: trace.sinks: expected \"stderr\", \"syslog\" or \"file:PATH\", found \"file:\""}),
    [](const auto& testCase) { return testCase.param.what; });

TEST_F(ConfigurationTest, NamesTheLineOfWhatIsNotToml) {
    file.write("[log]\n\nlevel = = 1\n");
    EXPECT_THAT(messageOf(loadConfiguration), testing::StartsWith(file.path() + ":3: "));
}

TEST_F(ConfigurationTest, IsOverriddenByTheEnvironment) {
    file.write("[log]\nlevel = 1\nsinks = [\"syslog\"]\n[trace]\nlevel = 2\n");
    ::setenv("ORV_AGENT_TREE", "lab.toml", 1);
    ::setenv("ORV_AGENT_LOG_LEVEL", "4000", 1);
    ::setenv("ORV_AGENT_LOG_SINKS", "stderr,file:/tmp/a b", 1);
    ::setenv("ORV_AGENT_TRACE_LEVEL", "3000", 1);
    ::setenv("ORV_AGENT_TRACE_SINKS", "syslog", 1);
    ::setenv("ORV_AGENT_CONTROL", "lab.control", 1);
    ::setenv("ORV_AGENT_PERSISTENCE", "none", 1);
    const Configuration expected{Configuration::BackEndKind::File,
                                 "lab.toml",
                                 {4000, {"stderr", "file:/tmp/a b"}},
                                 {3000, {"syslog"}},
                                 "lab.control",
                                 ManagerChoice::none};
    EXPECT_EQ(loadConfiguration(), expected);
}

TEST_F(ConfigurationTest, SwitchesAChannelOffByAnEmptyListOfSinks) {
    ::setenv("ORV_AGENT_LOG_SINKS", "", 1);
    EXPECT_THAT(loadConfiguration().log.sinks, IsEmpty());
}

TEST_F(ConfigurationTest, TakesOtherEmptyVariablesAsNotSet) {
    for (const char* name : {"ORV_AGENT_BACKEND", "ORV_AGENT_TREE", "ORV_AGENT_PERSISTENCE", "ORV_AGENT_LOG_LEVEL",
                             "ORV_AGENT_TRACE_LEVEL"}) {
        ::setenv(name, "", 1);
    }
    EXPECT_EQ(loadConfiguration(), Configuration());
}

TEST_F(ConfigurationTest, OverridesTheBackEnd) {
    file.write("tree_file = \"lab.toml\"\n");
    ::setenv("ORV_AGENT_BACKEND", "linux", 1);
    EXPECT_EQ(loadConfiguration().backEnd, Configuration::BackEndKind::Linux);
    ::setenv("ORV_AGENT_BACKEND", "file", 1);
    EXPECT_EQ(loadConfiguration().backEnd, Configuration::BackEndKind::File);
}

TEST_F(ConfigurationTest, LetsATreeFileMeanTheFileBackEnd) {
    ::setenv("ORV_AGENT_BACKEND", "linux", 1);
    ::setenv("ORV_AGENT_TREE", "lab.toml", 1);
    EXPECT_EQ(loadConfiguration().backEnd, Configuration::BackEndKind::File);
}

struct RefusedVariable {
    const char* name;
    const char* value;
    const char* message; ///< after the variable's name
};

class RefusedEnvironment : public testing::TestWithParam<RefusedVariable> {};

TEST_P(RefusedEnvironment, NamesTheVariableAndTheReason) {
    clearVariables();
    const TemporaryFile file("agent.toml", "");
    ::setenv("ORV_AGENT_CONFIG", file.path().c_str(), 1);
    ::setenv(GetParam().name, GetParam().value, 1);
    EXPECT_EQ(messageOf(loadConfiguration), std::string(GetParam().name) + GetParam().message);
    clearVariables();
}

INSTANTIATE_TEST_SUITE_P(
    Variables, RefusedEnvironment,
    testing::Values(
        RefusedVariable{"ORV_AGENT_BACKEND", "bsd", ": expected \"linux\" or \"file\", found \"bsd\""},
        RefusedVariable{"ORV_AGENT_BACKEND", "file", ": the file back end needs ORV_AGENT_TREE"},
        RefusedVariable{"ORV_AGENT_PERSISTENCE", "Auto",
                        ": expected \"auto\", \"ifupdown\", \"networkd\" or \"none\", found \"Auto\""},
        RefusedVariable{"ORV_AGENT_LOG_LEVEL", "high", ": expected an integer from 0 to 2147483647, found \"high\""},
        RefusedVariable{"ORV_AGENT_LOG_LEVEL", "60 ", ": expected an integer from 0 to 2147483647, found \"60 \""},
        RefusedVariable{"ORV_AGENT_TRACE_LEVEL", "-1", ": expected an integer from 0 to 2147483647, found \"-1\""},
        RefusedVariable{"ORV_AGENT_TRACE_LEVEL", "2147483648",
                        ": expected an integer from 0 to 2147483647, found \"2147483648\""},
        RefusedVariable{"ORV_AGENT_LOG_SINKS", "stderr,,syslog",
                        ": expected \"stderr\", \"syslog\" or \"file:PATH\", found \"\""},
        RefusedVariable{"ORV_AGENT_TRACE_SINKS", "stdout",
                        ": expected \"stderr\", \"syslog\" or \"file:PATH\", found \"stdout\""}));

} // namespace
