#include "tests/cli/Marlo.h"

#include <filesystem>
#include <fstream>
#include <sstream>

#include <gmock/gmock.h>

namespace marlo::test {
namespace {

using testing::ElementsAre;
using testing::HasSubstr;
using testing::MatchesRegex;
using testing::SizeIs;
using testing::StartsWith;

std::vector<std::string> linesOf(const std::string& text) {
    std::vector<std::string> lines;
    std::istringstream stream(text);
    for (std::string line; std::getline(stream, line);) {
        lines.push_back(line);
    }
    return lines;
}

std::string readFile(const std::string& file) {
    std::ifstream stream(file);
    return {std::istreambuf_iterator<char>(stream), {}};
}

/** marlo watch on a provider that delivers what a script says. */
class WatchedScript : public MarloTest {
  protected:
    WatchedScript() {
        std::filesystem::create_directories(path("libraries"));
        std::filesystem::create_symlink(MARLO_ALERT_PROVIDER, path("libraries/libAlerts.so"));
        write(
            "providers/alerts.toml",
            "library = \"libAlerts.so\"\n[[provider]]\nname = \"AlertProvider\"\nkinds = [\"indication\"]\n"
            "namespaces = [\"root/tavis\"]\nclasses = [\"CIM_AlertIndication\", \"MARLO_NetworkAdapterOnlineEvent\", "
            "\"MARLO_NetworkAdapterOfflineEvent\", \"MARLO_NetworkAdapterSwitchOverEvent\", "
            "\"MARLO_NetworkAdapterSwitchBackEvent\"]\n");
    }

    Outcome watch(std::vector<std::string> arguments, const std::string& script,
                  std::vector<std::string> environment = {}) {
        arguments.insert(arguments.begin(), {"timeout", "60", MARLO_EXECUTABLE, "watch", "--providers",
                                             path("providers"), "--libraries", path("libraries")});
        environment.push_back("ALERT_SCRIPT=" + write("script", script));
        return runProgram(arguments, environment, "", directory());
    }
};

constexpr const char* offline =
    "MARLO_NetworkAdapterOfflineEvent|EventTime=20260307050409.000250+060|PerceivedSeverity=3|Message=It is off.|"
    "AlertingManagedElement=root/tavis:MARLO_PhysicalNetworkAdapter.CreationClassName=\"X\",Tag=\"eth0\"\n";

TEST_F(WatchedScript, IsPrintedLineByLine) {
    const Outcome outcome =
        watch({"--count", "3"}, offline + std::string("MARLO_NetworkAdapterSwitchBackEvent|PerceivedSeverity=2\n"
                                                      "MARLO_NetworkAdapterOnlineEvent|PerceivedSeverity=99|"
                                                      "Description=only this|AlertingManagedElement=no path\n"));
    EXPECT_EQ(outcome.exitCode, 0) << outcome.err;
    EXPECT_THAT(linesOf(outcome.out),
                ElementsAre("2026-03-07 05:04:09  eth0      Offline     Degraded/Warning  It is off.",
                            "-                    -         SwitchBack  Information       -",
                            "-                    no path   Online      99                only this"));
}

TEST_F(WatchedScript, IsPrintedAsJsonOnALineEach) {
    const Outcome outcome = watch({"--count", "2", "--json"}, offline + std::string(offline));
    EXPECT_EQ(outcome.exitCode, 0) << outcome.err;
    const auto lines = linesOf(outcome.out);
    ASSERT_THAT(lines, SizeIs(2));
    const auto json = nlohmann::json::parse(lines[1]);
    EXPECT_EQ(json.at("class"), "MARLO_NetworkAdapterOfflineEvent");
    EXPECT_EQ(json.at("properties").at("PerceivedSeverity"), 3);
    EXPECT_EQ(json.at("properties").at("EventTime"), "20260307050409.000250+060");
}

TEST_F(WatchedScript, CannotSteerTheTerminal) {
    const Outcome outcome = watch({"--count", "1"}, "MARLO_NetworkAdapterOnlineEvent|Message=a\x1b[31m\r\tb\n");
    EXPECT_EQ(outcome.exitCode, 0) << outcome.err;
    EXPECT_EQ(outcome.out.find_first_of("\x1b\r\t"), std::string::npos) << outcome.out;
}

TEST_F(WatchedScript, IsChosenFromByAFilter) {
    const std::string script = offline +
                               std::string("MARLO_NetworkAdapterOnlineEvent|PerceivedSeverity=2|Message=on\n") +
                               "CIM_AlertIndication|PerceivedSeverity=5|Message=worse\n";
    const auto messages = [&](const std::string& filter, const std::string& language) {
        const Outcome outcome = watch({"--timeout", "2", "--filter", filter, "--language", language}, script);
        EXPECT_EQ(outcome.exitCode, 0) << outcome.err;
        std::vector<std::string> words;
        for (const std::string& line : linesOf(outcome.out)) {
            words.push_back(line.substr(line.rfind("  ") + 2));
        }
        return words;
    };
    EXPECT_THAT(messages("SELECT * FROM CIM_AlertIndication WHERE PerceivedSeverity >= 3", "WQL"),
                ElementsAre("It is off.", "worse"));
    EXPECT_THAT(messages("SELECT * FROM CIM_AlertIndication AS a WHERE a.Message LIKE 'o.*'", "CQL"),
                ElementsAre("on"));
}

TEST_F(WatchedScript, IsShownOnceWhenClassesContainEachOther) {
    const Outcome outcome = watch({"MARLO_NetworkAdapterOfflineEvent", "CIM_Indication", "cim_indication",
                                   "MARLO_NetworkAdapterOnlineEvent", "--timeout", "2"},
                                  offline);
    EXPECT_EQ(outcome.exitCode, 0) << outcome.err;
    EXPECT_THAT(linesOf(outcome.out), SizeIs(1));
}

TEST_F(WatchedScript, IsShownWholeHoweverLong) {
    const Outcome outcome = watch({"--count", "10000"}, "*10000 " + std::string(offline));
    EXPECT_EQ(outcome.exitCode, 0) << outcome.err;
    EXPECT_THAT(linesOf(outcome.out), SizeIs(10000));
}

TEST_F(WatchedScript, EndsEverySubscription) {
    const Outcome outcome = watch({"--count", "1"}, offline);
    EXPECT_EQ(outcome.exitCode, 0);
    EXPECT_THAT(linesOf(outcome.err),
                ElementsAre("marlo: watching; interrupt to end", "alerts: deactivated", "alerts: deactivated",
                            "alerts: deactivated", "alerts: deactivated", "alerts: disabled"));
}

TEST_F(WatchedScript, FailsWhenItEndsTooEarly) {
    EXPECT_EQ(watch({"--count", "2", "--timeout", "1"}, offline).exitCode, 1);
    EXPECT_EQ(watch({"--count", "1", "--timeout", "60"}, offline).exitCode, 0);
    EXPECT_EQ(watch({"--timeout", "0.2"}, "").exitCode, 0);
}

TEST_F(WatchedScript, FailsWithTheReasonWhenNothingCanBeWatched) {
    const Outcome refused = watch({}, "", {"ALERT_REFUSAL=no monitoring here"});
    EXPECT_EQ(refused.exitCode, 1);
    EXPECT_EQ(refused.out, "");
    EXPECT_EQ(refused.err, "marlo: CIM_ERR_FAILED (1): nothing can be watched with SELECT * FROM "
                           "MARLO_NetworkAdapterOnlineEvent: activateFilter of provider AlertProvider for "
                           "MARLO_NetworkAdapterOnlineEvent: no monitoring here\n");
    const Outcome wrong = watch({"MARLO_NetworkAdapterConfiguration"}, "");
    EXPECT_EQ(wrong.exitCode, 1);
    EXPECT_THAT(wrong.err, HasSubstr("MARLO_NetworkAdapterConfiguration is not a class of indications"));
    const Outcome filter = watch({"--filter", "SELECT * FROM CIM_Indication WHERE"}, "");
    EXPECT_EQ(filter.exitCode, 1);
    EXPECT_THAT(filter.err, HasSubstr("line 1, column 35: expected a property or a value"));
}

TEST_F(WatchedScript, RefusesWrongCommandLines) {
    for (const std::vector<std::string>& arguments :
         std::vector<std::vector<std::string>>{{"--count", "0"},
                                               {"--count", "-1"},
                                               {"--count", "many"},
                                               {"--timeout", "0"},
                                               {"--timeout", "nan"},
                                               {"--timeout", "soon"},
                                               {"--filter", ""},
                                               {"CIM_Indication", "--filter", "SELECT * FROM CIM_Indication"}}) {
        const Outcome outcome = watch(arguments, "");
        EXPECT_EQ(outcome.exitCode, 2) << testing::PrintToString(arguments);
        EXPECT_THAT(outcome.err, StartsWith("marlo: ")) << testing::PrintToString(arguments);
    }
}

/** marlo watch on the described host, whose file is changed meanwhile. */
class WatchedHost : public MarloTest {
  protected:
    /** Runs `script` in bash, with the watching marlo as $pid, once it watches. */
    Outcome watch(const std::string& arguments, const std::string& script) const {
        const std::string whole = "set -m; rm -f out err\n" MARLO_EXECUTABLE " watch " + arguments +
                                  " >out 2>err & pid=$!\n"
                                  "for i in {1..400}; do grep -q watching err && break; sleep 0.05; done\n" +
                                  script + "\nwait $pid";
        Outcome outcome =
            runProgram({"bash", "-c", whole}, {"ORV_AGENT_TREE=" + tree(), "LC_ALL=C"}, "", directory());
        outcome.out = readFile(path("out"));
        outcome.err = readFile(path("err"));
        return outcome;
    }

    /** Gives an adapter another status. */
    static std::string change(const std::string& adapter, const std::string& status) {
        return "sed -i '/identity = \"" + adapter + "\"/,/status/ s/^status = .*/status = " + status +
               "/' host.toml\n";
    }

    /** Waits until so many lines have come: of two changes that the file shows at once, either may be told first. */
    static std::string awaitLines(int count) {
        return "for i in {1..400}; do [ $(wc -l <out) -ge " + std::to_string(count) +
               " ] && break; sleep 0.05; done\n";
    }
};

constexpr const char* timePattern = "20[0-9][0-9]-[0-9][0-9]-[0-9][0-9] [0-9][0-9]:[0-9][0-9]:[0-9][0-9]  ";

TEST_F(WatchedHost, ShowsWhatHappensToItsAdapters) {
    const Outcome outcome =
        watch("--count 3 --timeout 60",
              change("eth0", "12") + awaitLines(1) + change("eth0", "1") + awaitLines(2) + change("bond0", "5"));
    EXPECT_EQ(outcome.exitCode, 0) << outcome.err;
    EXPECT_THAT(linesOf(outcome.out),
                ElementsAre(MatchesRegex(std::string(timePattern) + "eth0      Offline     Degraded/Warning  .+"),
                            MatchesRegex(std::string(timePattern) + "eth0      Online      Information       .+"),
                            MatchesRegex(std::string(timePattern) + "bond0     Offline     Degraded/Warning  .+")));
}

TEST_F(WatchedHost, ShowsOnlyWhatWasAskedFor) {
    const Outcome outcome = watch("MARLO_NetworkAdapterOnlineEvent --timeout 3",
                                  change("eth0", "12") + "sleep 0.5\n" + change("eth1", "1"));
    EXPECT_EQ(outcome.exitCode, 0) << outcome.err;
    const auto lines = linesOf(outcome.out);
    ASSERT_THAT(lines, SizeIs(1)) << outcome.out;
    EXPECT_THAT(lines[0], HasSubstr("eth1      Online"));
}

TEST_F(WatchedHost, PrintsEachLineAtOnce) {
    const Outcome outcome = watch("--count 2 --timeout 60", change("eth0", "12") + awaitLines(1) +
                                                                "wc -l < out > seen\n" + change("eth0", "1"));
    EXPECT_EQ(outcome.exitCode, 0) << outcome.err;
    EXPECT_EQ(readFile(path("seen")), "1\n");
}

TEST_F(WatchedHost, EndsCleanlyWhenInterrupted) {
    const std::vector<std::pair<std::string, std::string>> signalsAndStatuses = {{"INT", "12"}, {"TERM", "1"}};
    for (const auto& [signal, status] : signalsAndStatuses) {
        const std::string kill = "kill -" + signal + " $pid\n";
        const Outcome outcome = watch("", change("eth0", status) + awaitLines(1) + kill);
        EXPECT_EQ(outcome.exitCode, 0) << signal << outcome.err;
        EXPECT_THAT(linesOf(outcome.out), SizeIs(1)) << signal;
        EXPECT_EQ(outcome.err, "marlo: watching; interrupt to end\n") << signal;
        EXPECT_EQ(watch("--count 1", kill).exitCode, 1) << signal;
    }
}

TEST_F(WatchedHost, EndsWithItsReader) {
    const std::string script = MARLO_EXECUTABLE " watch 2>err | head -n 0; echo ${PIPESTATUS[0]} >code";
    runProgram({"timeout", "60", "bash", "-c", script}, {"ORV_AGENT_TREE=" + tree()}, "", directory());
    EXPECT_EQ(readFile(path("code")), "1\n");
}

} // namespace
} // namespace marlo::test
