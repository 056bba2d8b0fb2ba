// marlo serve from start to stop.
#include "tests/server/Serving.h"

#include <array>
#include <csignal>
#include <sstream>
#include <thread>

#include <gmock/gmock.h>
#include <sys/socket.h>
#include <sys/un.h>
#include <unistd.h>

namespace marlo::test {
namespace {

using std::chrono::milliseconds;
using testing::AllOf;
using testing::HasSubstr;
using testing::MatchesRegex;
using testing::Not;

TEST_F(Serving, AnswersEveryShapeOfRequest) {
    start();
    for (const std::vector<std::string>& shape : std::vector<std::vector<std::string>>{
             {address()},
             {address("")},
             {"-H", "Transfer-Encoding: chunked", address()},
             {"-H", "Expect: 100-continue", address()},
             {"--http1.0", address()},
             {"-H", "TE: chunked, trailers", address()},
             {"--unix-socket", socket(), "http://localhost/cimom"},
             {"-k", "https://127.0.0.1:" + std::to_string(port("https")) + "/cimom"}}) {
        const Outcome outcome = post(shape);
        EXPECT_EQ(outcome.exitCode, 0) << testing::PrintToString(shape) << outcome.err;
        EXPECT_THAT(outcome.out, AllOf(HasSubstr("<MESSAGE ID=\"7\""), HasSubstr("<VALUE>198.51.100.23</VALUE>")))
            << testing::PrintToString(shape);
    }
    const Outcome extended = curl(
        {"-u", credentials(), "-X", "M-POST", "-H", "Man: http://www.dmtf.org/cim/mapping/http/v1.0; ns=73", "-H",
         "73-CIMOperation: MethodCall", "-H", "73-CIMMethod: EnumerateInstances", "-H", "73-CIMObject: root/tavis",
         "-H", "Content-Type: application/xml", "--data-binary", "@body", address()});
    EXPECT_THAT(extended.out, HasSubstr("<VALUE>198.51.100.23</VALUE>")) << extended.err;
}

TEST_F(Serving, LetsNobodyInWithoutCredentials) {
    start();
    for (const std::string path : {"cimom", "", "status", "any/other"}) {
        for (const char* method : {"GET", "POST", "M-POST", "OPTIONS", "PUT"}) {
            const Outcome outcome = curl({"-i", "-X", method, address(path)});
            EXPECT_THAT(outcome.out,
                        AllOf(HasSubstr("HTTP/1.1 401 "), HasSubstr("WWW-Authenticate: Basic realm=\"marlo\""),
                              HasSubstr("Content-Length: ")))
                << method << " " << path;
        }
    }
}

TEST_F(Serving, LogsEachRequest) {
    start();
    static_cast<void>(post({address()}));
    EXPECT_THAT(
        logWith("event=request"),
        MatchesRegex("(.|\n)*event=request id=[0-9]+ peer=127.0.0.1:[0-9]+ user=marlo "
                     "operation=EnumerateInstances namespace=root/tavis class=MARLO_NetworkAdapterConfiguration "
                     "status=0 result=ok http=200 us=[0-9]+ in=[0-9]+ out=[0-9]+\n(.|\n)*"));
    EXPECT_THAT(log(), Not(HasSubstr(password())));
}

TEST_F(Serving, LogsInJson) {
    configure("log", "format = \"json\"\n");
    start();
    static_cast<void>(post({address()}));
    const std::string lines = logWith("EnumerateInstances");
    std::istringstream stream(lines);
    std::size_t requests = 0;
    for (std::string line; std::getline(stream, line);) {
        const auto json = nlohmann::json::parse(line, nullptr, false);
        ASSERT_TRUE(json.is_object()) << line;
        requests += json["event"] == "request" && json["http"] == 200 ? 1 : 0;
    }
    EXPECT_EQ(requests, 1U);
}

TEST_F(Serving, EndsInSuccessWhenItIsTold) {
    for (const int signal : {SIGTERM, SIGINT}) {
        start();
        server().signal(signal);
        EXPECT_EQ(server().wait(Patience), 0) << signal;
        EXPECT_FALSE(std::filesystem::exists(socket())) << signal;
    }
}

TEST_F(Serving, FinishesARunningChangeAndSendsItsAnswerBeforeItEnds) {
    start();
    Connection idle(port("http"), credentials());
    ASSERT_EQ(enumerate(idle).status, 200U);
    HttpAnswer answer;
    std::thread client([&] {
        Connection connection(port("http"), credentials());
        answer = connection.call("Sleep", SleepObject, sleepBody(1000));
    });
    awaitNote("begun");
    server().signal(SIGTERM);
    const int ended = server().wait(Patience);
    client.join();
    EXPECT_EQ(ended, 0);
    EXPECT_EQ(answer.status, 200U);
    EXPECT_THAT(answer.body, HasSubstr("<RETURNVALUE PARAMTYPE=\"uint32\"><VALUE>0</VALUE></RETURNVALUE>"));
    EXPECT_EQ(readFile(path("things")), "begun\nended\n");
    EXPECT_EQ(enumerate(idle).status, 0U);
}

TEST_F(Serving, EndsAtOnceWhenItIsToldTwice) {
    start();
    std::thread client([&] {
        Connection connection(port("http"), credentials());
        static_cast<void>(connection.call("Sleep", SleepObject, sleepBody(600'000)));
    });
    awaitNote("begun");
    server().signal(SIGTERM);
    static_cast<void>(logWith("event=stop"));
    EXPECT_EQ(server().wait(milliseconds(200)), -1) << "a running request gets its time";
    server().signal(SIGTERM);
    EXPECT_EQ(server().wait(Patience), 1);
    client.join();
    EXPECT_THAT(log(), HasSubstr("told once more to end; 1 requests are cut"));
    EXPECT_FALSE(std::filesystem::exists(socket()));
}

TEST_F(Serving, KeepsConnectionsWhenItReadsItsConfigurationAnew) {
    start();
    Connection connection(port("http"), credentials());
    ASSERT_EQ(enumerate(connection).status, 200U);
    std::filesystem::rename(path("server.log"), path("server.log.1"));
    server().signal(SIGHUP);
    static_cast<void>(logWith("configuration and certificates are read anew"));
    EXPECT_EQ(enumerate(connection).status, 200U);
    static_cast<void>(logWith("event=request"));
    EXPECT_EQ(stop(), 0);
}

TEST_F(Serving, GoesOnWithWhatItHadWhenTheNewConfigurationIsWrong) {
    start();
    write("server.toml", "[log]\nlevel = \"loud\"\n");
    server().signal(SIGHUP);
    EXPECT_THAT(logWith("event=reload"), HasSubstr("server.toml:2: log.level: expected"));
    Connection connection(port("http"), credentials());
    EXPECT_EQ(enumerate(connection).status, 200U);
    const Outcome degraded = status();
    EXPECT_EQ(degraded.exitCode, 1);
    EXPECT_THAT(degraded.err, HasSubstr("marlo: degraded: the configuration is not taken: "));
    writeConfiguration();
    server().signal(SIGHUP);
    static_cast<void>(logWith("read anew"));
    EXPECT_EQ(status().exitCode, 0);
}

TEST_F(Serving, SaysWhatMustWaitForTheNextStart) {
    start();
    configure("limits", "workers = 3\n");
    writeConfiguration();
    server().signal(SIGHUP);
    EXPECT_THAT(logWith("next start"), HasSubstr("takes effect at the next start: limits"));
}

TEST_F(Serving, TakesANewCertificateForNewConnections) {
    start();
    std::filesystem::remove(path("state/certificate.pem"));
    std::filesystem::remove(path("state/key.pem"));
    server().signal(SIGHUP);
    static_cast<void>(logWith("read anew"));
    const Outcome outcome = post(
        {"--cacert", path("state/certificate.pem"), "https://127.0.0.1:" + std::to_string(port("https")) + "/cimom"});
    EXPECT_EQ(outcome.exitCode, 0) << outcome.err;
}

TEST_F(Serving, RefusesWrongCommandLinesAndFiles) {
    for (const std::vector<std::string>& wrong :
         std::vector<std::vector<std::string>>{{"serve", "--http", "0.0.0.0:5988"},
                                               {"serve", "--http", "here"},
                                               {"serve", "--https", "127.0.0.1:99999"},
                                               {"serve", "--schema", path("nowhere")},
                                               {"serve", "extra"},
                                               {"status", "extra"}}) {
        const Outcome outcome = marlo(wrong);
        EXPECT_EQ(outcome.exitCode, 2) << testing::PrintToString(wrong);
        EXPECT_EQ(outcome.out, "") << testing::PrintToString(wrong);
    }
    write("wrong.toml", "[listen]\nhttp = [\"192.0.2.1:5988\"]\n");
    const Outcome beyond = marlo({"serve", "--config", path("wrong.toml")});
    EXPECT_EQ(beyond.exitCode, 1);
    EXPECT_EQ(beyond.err, "marlo: " + path("wrong.toml") +
                              ":2: listen.http: 192.0.2.1:5988 is beyond loopback, where passwords go by TLS only: "
                              "list it under https\n");
    const Outcome nowhere = marlo({"serve", "--trial", "--http", "none", "--https", "none", "--socket", "none"});
    EXPECT_EQ(nowhere.exitCode, 1);
    EXPECT_THAT(nowhere.err, HasSubstr("there is nowhere to listen"));
}

TEST_F(Serving, TellsTheServiceManagerHowItIs) {
    const std::string name = path("notify");
    const int manager = ::socket(AF_UNIX, SOCK_DGRAM | SOCK_CLOEXEC, 0);
    sockaddr_un local{};
    local.sun_family = AF_UNIX;
    name.copy(local.sun_path, sizeof local.sun_path - 1);
    ASSERT_EQ(::bind(manager, reinterpret_cast<const sockaddr*>(&local), sizeof local), 0);
    const timeval patience{60, 0};
    ::setsockopt(manager, SOL_SOCKET, SO_RCVTIMEO, &patience, sizeof patience);
    const auto receive = [manager] {
        std::array<char, 256> text{};
        const ssize_t size = ::recv(manager, text.data(), text.size(), 0);
        return std::string(text.data(), size < 0 ? 0 : static_cast<std::size_t>(size));
    };
    setVariable("NOTIFY_SOCKET", name);
    start();
    EXPECT_EQ(receive(), "READY=1");
    server().signal(SIGHUP);
    EXPECT_THAT(receive(), MatchesRegex("RELOADING=1\nMONOTONIC_USEC=[0-9]+"));
    EXPECT_EQ(receive(), "READY=1");
    server().signal(SIGTERM);
    EXPECT_EQ(receive(), "STOPPING=1");
    EXPECT_EQ(server().wait(Patience), 0);
    ::close(manager);
}

} // namespace
} // namespace marlo::test
