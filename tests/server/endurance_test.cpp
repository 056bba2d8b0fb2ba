// What a server outlives, and what it says about it.
#include "tests/server/Serving.h"

#include <csignal>
#include <memory>
#include <thread>

#include <gmock/gmock.h>
#include <sys/resource.h>

namespace marlo::test {
namespace {

using testing::AllOf;
using testing::HasSubstr;
using testing::Not;

/** A server under conditions that are none of its making. */
class Endurance : public Serving {};

TEST_F(Endurance, StartsOverTheSocketOfOneThatWasKilled) {
    start();
    server().signal(SIGKILL);
    EXPECT_EQ(server().wait(Patience), 128 + SIGKILL);
    EXPECT_TRUE(std::filesystem::exists(socket()));
    const Outcome none = status();
    EXPECT_EQ(none.exitCode, 1);
    EXPECT_THAT(none.err, HasSubstr("marlo: not running: " + socket() + ": Connection refused"));
    start();
    EXPECT_EQ(status().exitCode, 0);
}

TEST_F(Endurance, LeavesBusyPlacesToTheServerThatHasThem) {
    start();
    const std::string taken = "127.0.0.1:" + std::to_string(port("http"));
    write("second.toml", "[listen]\nhttps = []\n[directories]\nstate = \"second\"\n");
    const std::vector<std::string> places{"serve", "--config", path("second.toml"), "--http", taken, "--socket"};
    auto arguments = places;
    arguments.insert(arguments.end(), {"none"});
    const Outcome busy = marlo(arguments);
    EXPECT_EQ(busy.exitCode, 1);
    EXPECT_THAT(busy.err, HasSubstr(taken));
    arguments = places;
    arguments.back() = "--http";
    arguments.insert(arguments.end(), {"127.0.0.1:0", "--socket", socket()});
    arguments.erase(arguments.begin() + 3, arguments.begin() + 5);
    const Outcome second = marlo(arguments);
    EXPECT_EQ(second.exitCode, 1);
    EXPECT_THAT(second.err, HasSubstr(socket()));
    Process trial({MARLO_EXECUTABLE, "serve", "--trial", "--config", path("second.toml"), "--http", taken, "--socket",
                   socket()},
                  {{"ORV_AGENT_TREE", tree()}}, directory(), path("second.err"));
    const std::string words = trial.readUntil("serving");
    EXPECT_THAT(words, AllOf(HasSubstr("is busy, another one is taken"), HasSubstr("listening: http 127.0.0.1:"),
                             HasSubstr("this one has no local socket"), Not(HasSubstr("listening: http " + taken))));
}

TEST_F(Endurance, OutlivesProvidersThatThrowAndThatHang) {
    start();
    Connection hanging(port("http"), credentials());
    std::thread client([&] { static_cast<void>(hanging.call("Sleep", SleepObject, sleepBody(600'000))); });
    awaitNote("begun");
    Connection connection(port("http"), credentials());
    const HttpAnswer thrown =
        connection.call("EnumerateInstances", "root/served",
                        intrinsic("EnumerateInstances", "root/served", classParameter("SERVED_Throwing")));
    EXPECT_THAT(thrown.body, HasSubstr("<ERROR CODE=\"1\" DESCRIPTION=\"provider ServedThings threw: thrown in the"));
    for (int i = 0; i < 20; ++i) {
        EXPECT_EQ(enumerate(connection).status, 200U);
    }
    server().signal(SIGKILL);
    client.join();
}

TEST_F(Endurance, OutlivesClientsThatVanish) {
    start();
    for (const std::string& bytes :
         {std::string("POST /cimom HTTP/1.1\r\nHost: a\r\n"), std::string("\x16\x03\x01"), std::string()}) {
        for (const bool rudely : {false, true}) {
            Connection connection(port("http"), credentials());
            EXPECT_TRUE(connection.send(bytes));
            connection.leave(rudely);
            Connection overTls(port("https"), credentials());
            EXPECT_TRUE(overTls.send(bytes));
            overTls.leave(rudely);
        }
    }
    Connection connection(port("http"), credentials());
    std::thread client([&] { static_cast<void>(connection.call("Sleep", SleepObject, sleepBody(300))); });
    awaitNote("begun");
    Connection other(port("http"), credentials());
    EXPECT_EQ(enumerate(other).status, 200U);
    client.join();
    EXPECT_EQ(stop(), 0);
}

TEST_F(Endurance, GoesOnWhenDescriptorsAreFreeAgain) {
    setUp([] {
        const rlimit few{64, 64};
        ::setrlimit(RLIMIT_NOFILE, &few);
    });
    start();
    {
        // UndefinedBehaviorSanitizer meets the types of a connection while descriptors are free.
        Connection first(port("http"), credentials());
        EXPECT_EQ(enumerate(first).status, 200U);
        std::vector<std::unique_ptr<Connection>> many;
        for (int i = 0; i < 80; ++i) {
            many.push_back(std::make_unique<Connection>(port("http"), credentials()));
        }
        EXPECT_TRUE(server().isRunning());
    }
    Connection connection(port("http"), credentials());
    EXPECT_EQ(enumerate(connection).status, 200U);
    EXPECT_EQ(stop(), 0);
}

TEST_F(Endurance, AnswersWhileItsLogIsFull) {
    start();
    std::string text = readFile(path("server.toml"));
    const std::string sink = "file:server.log";
    text.replace(text.find(sink), sink.size(), "file:/dev/full");
    write("server.toml", text);
    server().signal(SIGHUP);
    Connection connection(port("http"), credentials());
    Outcome full;
    const auto end = std::chrono::steady_clock::now() + Patience;
    do {
        EXPECT_EQ(enumerate(connection).status, 200U);
        full = status();
    } while (full.exitCode == 0 && std::chrono::steady_clock::now() < end);
    EXPECT_EQ(full.exitCode, 1);
    EXPECT_THAT(full.err, HasSubstr("marlo: degraded: the log takes no lines, "));
    EXPECT_THAT(readFile(path("server.err")), HasSubstr("marlo: log file:/dev/full: lines are lost: "));
}

TEST_F(Endurance, TellsItsStatus) {
    start();
    Connection connection(port("http"), credentials());
    ASSERT_EQ(enumerate(connection).status, 200U);
    const Outcome table = status();
    EXPECT_EQ(table.exitCode, 0) << table.err;
    EXPECT_THAT(table.out,
                AllOf(HasSubstr("health         ok\n"), HasSubstr("http 127.0.0.1:" + std::to_string(port("http"))),
                      HasSubstr("EnumerateInstances  ok      1\n")));
    const Outcome raw = status({"--json"});
    const auto json = nlohmann::json::parse(raw.out, nullptr, false);
    ASSERT_TRUE(json.is_object()) << raw.out;
    EXPECT_EQ(json["health"], "ok");
    EXPECT_EQ(json["pid"], server().id());
    EXPECT_EQ(json["connections"]["refused"], 0);
    const Outcome overHttp = curl({"-u", credentials(), address("status")});
    EXPECT_TRUE(nlohmann::json::parse(overHttp.out, nullptr, false).is_object()) << overHttp.out;
}

TEST_F(Endurance, IsDegradedWhenAProviderCannotBeLoaded) {
    start();
    Connection connection(port("http"), credentials());
    ASSERT_EQ(connection
                  .call("EnumerateInstances", "root/served",
                        intrinsic("EnumerateInstances", "root/served", classParameter("SERVED_Missing")))
                  .status,
              200U);
    const Outcome outcome = status();
    EXPECT_EQ(outcome.exitCode, 1);
    EXPECT_THAT(outcome.err, HasSubstr("marlo: degraded: provider Missing: "));
    EXPECT_THAT(outcome.out, AllOf(HasSubstr("libNowhere.so"), HasSubstr("failed")));
}

TEST_F(Endurance, IsNotRunningWhereNothingAnswers) {
    const Outcome outcome = status();
    EXPECT_EQ(outcome.exitCode, 1);
    EXPECT_EQ(outcome.out, "");
    EXPECT_EQ(outcome.err, "marlo: not running: " + socket() + ": No such file or directory\n");
}

} // namespace
} // namespace marlo::test
