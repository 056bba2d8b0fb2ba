#include "tests/cli/Marlo.h"

#include <filesystem>
#include <sstream>

#include <gmock/gmock.h>

namespace marlo::test {
namespace {

using testing::ElementsAre;
using testing::HasSubstr;
using testing::IsEmpty;
using testing::MatchesRegex;
using testing::Not;
using testing::StartsWith;

std::vector<std::string> splitLines(const std::string& text) {
    std::vector<std::string> lines;
    std::istringstream stream(text);
    for (std::string line; std::getline(stream, line);) {
        lines.push_back(line);
    }
    return lines;
}

class MarloShell : public MarloTest {
  protected:
    /** What bash offers for a command line whose last word is being typed. */
    [[nodiscard]] std::vector<std::string> complete(const std::string& words) const {
        const std::string bin = std::filesystem::path(MARLO_EXECUTABLE).parent_path();
        const std::string script = "export PATH=" + bin +
                                   ":$PATH; source <(marlo completion bash); compopt() { :; }; "
                                   "COMP_WORDS=(" +
                                   words +
                                   "); COMP_CWORD=$((${#COMP_WORDS[@]} - 1)); _marlo; "
                                   "printf '%s\\n' \"${COMPREPLY[@]}\"";
        const Outcome outcome = runProgram({"bash", "-c", script}, {}, "", directory());
        EXPECT_EQ(outcome.err, "");
        std::vector<std::string> lines = splitLines(outcome.out);
        std::erase(lines, "");
        return lines;
    }
};

TEST_F(MarloShell, PrintsItsVersion) {
    const Outcome outcome = marlo({"--version"});
    EXPECT_EQ(outcome.exitCode, 0);
    EXPECT_THAT(outcome.out, MatchesRegex("marlo [0-9]+\\.[0-9]+\\.[0-9]+\n"));
    EXPECT_EQ(outcome.err, "");
}

TEST_F(MarloShell, PrintsACompletionScriptThatBashReads) {
    const Outcome script = marlo({"completion", "bash"});
    EXPECT_EQ(script.exitCode, 0);
    const Outcome checked = runProgram({"bash", "-n", write("completion", script.out)});
    EXPECT_EQ(checked.exitCode, 0) << checked.err;
}

TEST_F(MarloShell, CompletesCommandsAndOptions) {
    EXPECT_THAT(complete("marlo a"), ElementsAre("adapters"));
    EXPECT_THAT(complete("marlo c"), ElementsAre("classes", "completion"));
    EXPECT_THAT(complete("marlo se"), ElementsAre("set", "serve"));
    EXPECT_THAT(complete("marlo serve --tri"), ElementsAre("--trial"));
    EXPECT_THAT(complete("marlo serve --config ho"), ElementsAre("host.toml"));
    EXPECT_THAT(complete("marlo --v"), ElementsAre("--version"));
    EXPECT_THAT(complete("marlo enum --js"), ElementsAre("--json"));
    EXPECT_THAT(complete("marlo names --prop"), IsEmpty());
    EXPECT_THAT(complete("marlo enum --prop"), ElementsAre("--property"));
    EXPECT_THAT(complete("marlo completion ''"), ElementsAre("bash"));
}

TEST_F(MarloShell, CompletesClassesOfTheNamespaceAndFiles) {
    EXPECT_THAT(complete("marlo enum MARLO_NetworkAdapterC"), ElementsAre("MARLO_NetworkAdapterConfiguration"));
    EXPECT_THAT(complete("marlo watch MARLO_NetworkAdapterO"),
                ElementsAre("MARLO_NetworkAdapterOnlineEvent", "MARLO_NetworkAdapterOfflineEvent"));
    EXPECT_THAT(complete("marlo names -n root/quarn TAVIS_"), ElementsAre("TAVIS_NetworkCard", "TAVIS_NetworkPort"));
    EXPECT_THAT(complete("marlo get MARLO_L"), ElementsAre("MARLO_LogicalNetworkAdapter."));
    EXPECT_THAT(complete("marlo adapters --tree ho"), ElementsAre("host.toml"));
}

TEST_F(MarloShell, CompletesAdaptersMethodsAndProperties) {
    EXPECT_THAT(complete("marlo dhcp --tree host.toml ''"), ElementsAre("bond0", "eth0", "eth1", "eth2"));
    EXPECT_THAT(complete("marlo static --tree host.toml eth"), ElementsAre("eth0", "eth1", "eth2"));
    EXPECT_THAT(complete("marlo static eth0 --tree host.toml ''"), IsEmpty());
    EXPECT_THAT(complete("marlo invoke eth0 Enable"), ElementsAre("EnableDHCP", "EnableStatic"));
    EXPECT_THAT(complete("marlo set --tree host.toml eth0 D"), ElementsAre("DefaultIPGateway=", "DNSDomain="));
    EXPECT_THAT(complete("marlo static eth0 --ga"), ElementsAre("--gateway"));
}

TEST_F(MarloShell, ShowsItsArgumentsByTheirNamesAlone) {
    const std::string help = marlo({"enum", "--help"}).out;
    EXPECT_THAT(help, HasSubstr("  CLASS REQUIRED "));
    EXPECT_THAT(help, HasSubstr("  --schema DIR "));
    EXPECT_THAT(marlo({"invoke", "--help"}).out, Not(HasSubstr("TEXT")));
}

TEST_F(MarloShell, ExplainsEveryCommandWithExamples) {
    for (const char* command : {"adapters", "enum", "names", "get", "invoke", "set", "static", "dhcp", "dns",
                                "gateway", "restart", "watch", "classes", "serve", "status", "completion"}) {
        const Outcome outcome = marlo({command, "--help"});
        EXPECT_EQ(outcome.exitCode, 0) << command;
        EXPECT_EQ(outcome.err, "") << command;
        EXPECT_THAT(outcome.out, HasSubstr(std::string("marlo ") + command)) << command;
        EXPECT_THAT(outcome.out, HasSubstr("Examples:")) << command;
    }
}

TEST_F(MarloShell, AnswersEveryExampleOfItsHelp) {
    const std::string bin = std::filesystem::path(MARLO_EXECUTABLE).parent_path();
    std::size_t examples = 0;
    for (const char* command : {"", "adapters", "enum", "names", "get", "invoke", "set", "static", "dhcp", "dns",
                                "gateway", "classes", "completion"}) {
        const Outcome help = marlo(*command == '\0' ? std::vector<std::string>{"--help"}
                                                    : std::vector<std::string>{command, "--help"});
        const std::size_t begin = help.out.find("Examples:");
        ASSERT_NE(begin, std::string::npos) << help.out;
        for (const std::string& line : splitLines(help.out.substr(begin))) {
            if (!line.starts_with("  marlo ")) {
                continue;
            }
            ++examples;
            const Outcome outcome = runProgram({"bash", "-c", "export PATH=" + bin + ":$PATH; " + line},
                                               {"ORV_AGENT_TREE=" + tree()}, "", directory());
            EXPECT_EQ(outcome.exitCode, 0) << line;
            EXPECT_EQ(outcome.err, "") << line;
            EXPECT_NE(outcome.out, "") << line;
        }
    }
    EXPECT_GT(examples, 24U);
}

TEST_F(MarloShell, PassesItsLogOptionsToTheAgent) {
    const std::string log = path("agent.log");
    const std::string trace = path("agent.trace");
    const Outcome outcome = marlo({"enum", "MARLO_NetworkAdapterConfiguration", "--log-level", "4000", "--log-sink",
                                   "file:" + log, "--trace-level", "3000", "--trace-sink", "file:" + trace});
    EXPECT_EQ(outcome.exitCode, 0) << outcome.err;
    EXPECT_EQ(outcome.err, "");
    EXPECT_GT(std::filesystem::file_size(log), 0U);
    EXPECT_GT(std::filesystem::file_size(trace), 0U);
}

TEST_F(MarloShell, PutsItsTreeBeforeTheEnvironmentsBackEnd) {
    const Outcome outcome = runProgram({MARLO_EXECUTABLE, "adapters", "--tree", tree()}, {"ORV_AGENT_BACKEND=linux"});
    EXPECT_EQ(outcome.exitCode, 0) << outcome.err;
    EXPECT_THAT(outcome.out, HasSubstr("bond0"));
}

TEST_F(MarloShell, TakesTheAgentsConfiguration) {
    const std::string configuration = write("agent.toml", "back_end = \"file\"\ntree_file = \"" + tree() + "\"\n");
    const Outcome outcome = runProgram({MARLO_EXECUTABLE, "adapters", "--agent-config", configuration});
    EXPECT_EQ(outcome.exitCode, 0) << outcome.err;
    EXPECT_THAT(outcome.out, HasSubstr("bond0"));
}

} // namespace
} // namespace marlo::test
