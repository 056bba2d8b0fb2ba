#include "tests/cli/Marlo.h"

#include <filesystem>
#include <sstream>

#include <gmock/gmock.h>
#include <unistd.h>

namespace marlo::test {
namespace {

using testing::Contains;
using testing::HasSubstr;
using testing::SizeIs;

constexpr const char* Configuration = "MARLO_NetworkAdapterConfiguration";

class MarloBadInput : public FixtureTest {
  protected:
    /** The program says something on standard error, nothing on standard output, and ends so. */
    static void expectFailure(const Outcome& outcome, int exitCode, const std::string& message) {
        EXPECT_EQ(outcome.exitCode, exitCode);
        EXPECT_EQ(outcome.out, "");
        EXPECT_THAT(linesOfMarlo(outcome), Contains(HasSubstr(message)));
    }

    /** What marlo itself says; providers may write to standard error too. */
    static std::vector<std::string> linesOfMarlo(const Outcome& outcome) {
        std::vector<std::string> lines;
        std::istringstream stream(outcome.err);
        for (std::string line; std::getline(stream, line);) {
            if (line.starts_with("marlo: ")) {
                lines.push_back(line);
            }
        }
        return lines;
    }
};

TEST_F(MarloBadInput, UnknownClass) {
    expectFailure(marlo({"enum", "MARLO_Nothing"}), 1, "CIM_ERR_INVALID_CLASS (5): ");
    expectFailure(marlo({"enum", "MARLO_Nothing", "--json"}), 1, "MARLO_Nothing");
    expectFailure(marlo({"names", "MARLO_Nothing"}), 1, "CIM_ERR_INVALID_CLASS (5): ");
    expectFailure(marlo({"get", "MARLO_Nothing.K=\"1\""}), 1, "CIM_ERR_INVALID_CLASS (5): ");
}

TEST_F(MarloBadInput, UnknownNamespace) {
    expectFailure(marlo({"enum", Configuration, "-n", "root/nothing"}), 1, "CIM_ERR_INVALID_NAMESPACE (3): ");
    expectFailure(marlo({"get", "root/nothing:MARLO_NetworkAdapterConfiguration.SettingID=\"eth0\""}), 1,
                  "CIM_ERR_INVALID_NAMESPACE (3): ");
    expectFailure(marlo({"adapters", "-n", "root/nothing"}), 1, "CIM_ERR_INVALID_NAMESPACE (3): ");
    expectFailure(marlo({"classes", "-n", "root/nothing"}), 1, "CIM_ERR_INVALID_NAMESPACE (3): ");
}

TEST_F(MarloBadInput, ClassOfAnotherNamespace) {
    expectFailure(marlo({"enum", "TAVIS_NetworkCard"}), 1, "CIM_ERR_INVALID_CLASS (5): ");
}

TEST_F(MarloBadInput, UnknownProperty) {
    const std::string message = "class MARLO_NetworkAdapterConfiguration has no property \"Colour\"";
    expectFailure(marlo({"enum", Configuration, "-p", "Colour"}), 2, message);
    expectFailure(marlo({"get", "MARLO_NetworkAdapterConfiguration.SettingID=\"eth0\"", "-p", "SettingID,Colour"}), 2,
                  message);
    expectFailure(marlo({"adapters", "-p", "Colour"}), 2, message);
}

TEST_F(MarloBadInput, PathThatDoesNotParse) {
    for (const char* wrong : {"MARLO_X.", "MARLO_X.K", "MARLO_X.K=", "MARLO_X.K=\"open", "MARLO_X.K=\"a\",", "1X",
                              ":", "root/tavis:", "//host", "X.K=maybe"}) {
        expectFailure(marlo({"get", wrong}), 2, std::string("not an object path: ") + wrong + ": position ");
    }
}

TEST_F(MarloBadInput, PathThatNamesNoInstance) {
    expectFailure(marlo({"get", "MARLO_NetworkAdapterConfiguration.SettingID=\"eth9\""}), 1,
                  "CIM_ERR_NOT_FOUND (6): ");
}

TEST_F(MarloBadInput, KeyOfTheWrongTypeOrName) {
    expectFailure(marlo({"get", "MARLO_NetworkAdapterConfiguration.SettingID=5"}), 1,
                  "CIM_ERR_INVALID_PARAMETER (4): ");
    expectFailure(marlo({"get", "MARLO_NetworkAdapterConfiguration.Name=\"eth0\""}), 1,
                  "CIM_ERR_INVALID_PARAMETER (4): ");
    expectFailure(marlo({"get", Configuration}), 1, "CIM_ERR_INVALID_PARAMETER (4): ");
}

TEST_F(MarloBadInput, CommandLineThatIsWrong) {
    expectFailure(marlo({}), 2, "subcommand is required");
    expectFailure(marlo({"frobnicate"}), 2, "try marlo --help");
    expectFailure(marlo({"enum"}), 2, "CLASS is required");
    expectFailure(marlo({"enum", "A", "B"}), 2, "try marlo --help");
    expectFailure(marlo({"adapters", "--frobnicate"}), 2, "--frobnicate");
    expectFailure(marlo({"adapters", "--log-level", "high"}), 2, "--log-level");
    expectFailure(marlo({"adapters", "-p", ""}), 2, "-p");
    expectFailure(marlo({"adapters", "--tree", ""}), 2, "--tree");
    expectFailure(marlo({"completion", "fish"}), 2, "fish");
}

TEST_F(MarloBadInput, TreeFileThatCannotBeOpened) {
    expectFailure(marlo({"adapters", "--tree", path("gone.toml")}), 2,
                  "--tree: cannot open " + path("gone.toml") + ": No such file or directory");
    expectFailure(marlo({"adapters", "--tree", directory()}), 2, "--tree: cannot open " + directory());
    expectFailure(marlo({"adapters", "--agent-config", path("gone.toml")}), 2,
                  "--agent-config: cannot open " + path("gone.toml"));
    expectFailure(marlo({"enum", Configuration, "--tree", path("gone.toml")}), 2, "gone.toml");
}

TEST_F(MarloBadInput, TreeFileThatIsMalformed) {
    const std::string wrong = write("wrong.toml", "[[adapter]]\nidentity = \"eth0\"\nstatus = \"up\"\n");
    const std::vector<std::vector<std::string>> commands = {{"adapters"}, {"enum", Configuration}};
    for (std::vector<std::string> arguments : commands) {
        arguments.insert(arguments.end(), {"--tree", wrong});
        expectFailure(marlo(arguments), 1, "wrong.toml");
        EXPECT_THAT(marlo(arguments).err, HasSubstr("status"));
    }
}

TEST_F(MarloBadInput, TreeFileThatVanished) {
    const Outcome outcome = runProgram({MARLO_EXECUTABLE, "enum", Configuration},
                                       {"ORV_AGENT_TREE=" + path("vanished.toml")}, "", directory());
    expectFailure(outcome, 1, "vanished.toml");
}

TEST_F(MarloBadInput, AgentConfigurationThatIsWrong) {
    const std::string wrong = write("agent.toml", "[log]\nlevel = \"loud\"\n");
    expectFailure(marlo({"enum", Configuration, "--agent-config", wrong}), 1, wrong + ":2: log.level: ");
}

TEST_F(MarloBadInput, IsSaidOnce) {
    const std::string wrong = write("wrong.toml", "[[adapter]]\nidentity = 5\n");
    const Outcome outcome = marlo({"adapters", "--tree", wrong});
    EXPECT_EQ(outcome.exitCode, 1);
    EXPECT_THAT(linesOfMarlo(outcome), SizeIs(1)) << outcome.err;
    EXPECT_THAT(linesOfMarlo(marlo({"adapters", "-n", "root/nothing"})), SizeIs(1));
}

TEST_F(MarloBadInput, SchemaThatIsMissingOrWrong) {
    expectFailure(marlo({"adapters", "--schema", path("gone")}), 2, "--schema");
    expectFailure(marlo({"adapters", "--schema", path("libraries")}), 1, "no *.mof files in the schema directory");
    write("wrong/a.mof", "class A {\n  string B\n};\n");
    expectFailure(marlo({"adapters", "--schema", path("wrong")}), 1,
                  "/wrong/a.mof:3:1: expected ';' behind B, found '}'");
}

TEST_F(MarloBadInput, RegistrationThatIsMissingOrWrong) {
    expectFailure(marlo({"adapters", "--providers", path("gone")}), 2, "--providers");
    write("providers/wrong.toml", "library = \"libFixture.so\"\n[[provider]]\nnmae = \"FixtureProvider\"\n");
    expectFailure(marlo(onFixture({"enum", "TEST_Typed"})), 1, "wrong.toml");
    write("providers/wrong.toml", "library = \n");
    expectFailure(marlo(onFixture({"enum", "TEST_Typed"})), 1, "wrong.toml");
}

TEST_F(MarloBadInput, ProviderLibraryThatIsMissing) {
    registerProvider("gone.toml", "libGone.so", "GoneProvider", {"TEST_Elsewhere"});
    expectFailure(marlo(onFixture({"enum", "TEST_Elsewhere"})), 1, "libGone.so");
    EXPECT_EQ(marlo(onFixture({"enum", "TEST_Typed"})).exitCode, 0);
}

TEST_F(MarloBadInput, ProviderLibraryWithoutTheFactory) {
    registerProvider("other.toml", "libFixture.so", "OtherProvider", {"TEST_Elsewhere"});
    expectFailure(marlo(onFixture({"enum", "TEST_Elsewhere"})), 1, "OtherProvider_Create_InstanceMI");
}

TEST_F(MarloBadInput, ProviderThatThrows) {
    expectFailure(marlo(onFixture({"enum", "TEST_Throwing"})), 1,
                  "CIM_ERR_FAILED (1): provider FixtureProvider threw: the fixture throws");
    expectFailure(marlo(onFixture({"get", "TEST_Throwing.Id=\"1\""})), 1, "the fixture throws");
}

TEST_F(MarloBadInput, ProviderThatRefuses) {
    expectFailure(marlo(onFixture({"enum", "TEST_Refusing"})), 1, "CIM_ERR_ACCESS_DENIED (2): not for you");
}

TEST_F(MarloBadInput, ClassThatNobodyServes) {
    expectFailure(marlo(onFixture({"enum", "TEST_Unserved"})), 1, "TEST_Unserved");
}

TEST_F(MarloBadInput, OutputThatIsFull) {
    for (const std::vector<std::string>& arguments : {std::vector<std::string>{"adapters"},
                                                      {"enum", Configuration},
                                                      {"enum", Configuration, "--json"},
                                                      {"names", Configuration},
                                                      {"classes"},
                                                      {"--help"},
                                                      {"--version"},
                                                      {"completion", "bash"}}) {
        std::vector<std::string> program = {MARLO_EXECUTABLE};
        program.insert(program.end(), arguments.begin(), arguments.end());
        const Outcome outcome = runProgram(program, {"ORV_AGENT_TREE=" + tree()}, "/dev/full");
        EXPECT_EQ(outcome.exitCode, 1) << arguments.front();
        EXPECT_EQ(outcome.err, "marlo: cannot write the output: No space left on device\n") << arguments.front();
    }
}

TEST_F(MarloBadInput, ReaderThatGoesAway) {
    std::string adapters;
    for (int i = 0; i < 2000; ++i) {
        adapters += "[[adapter]]\nidentity = \"eth" + std::to_string(i) + "\"\n";
    }
    write("many.toml", adapters);
    const std::string command = std::string(MARLO_EXECUTABLE) + " enum " + Configuration + " --tree many.toml";
    const Outcome killed =
        runProgram({"bash", "-c", command + " | head -1; exit ${PIPESTATUS[0]}"}, {}, "", directory());
    EXPECT_EQ(killed.exitCode, 128 + SIGPIPE);
    EXPECT_EQ(killed.err, "");
    const Outcome ignoring = runProgram(
        {"bash", "-c", "trap '' PIPE; " + command + " | head -1; exit ${PIPESTATUS[0]}"}, {}, "", directory());
    EXPECT_EQ(ignoring.exitCode, 1);
    EXPECT_EQ(ignoring.err, "");
}

} // namespace
} // namespace marlo::test
