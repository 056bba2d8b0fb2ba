#include "host/cli/Status.h"
#include "host/server/Health.h"
#include "host/server/Notify.h"
#include "host/server/Signals.h"
#include "host/server/Statistics.h"
#include "host/server/StatusReport.h"

#include <array>
#include <csignal>
#include <cstdlib>
#include <string>

#include <gmock/gmock.h>
#include <gtest/gtest.h>
#include <sys/socket.h>
#include <sys/un.h>
#include <unistd.h>

namespace marlo::server {
namespace {

using std::chrono::microseconds;
using testing::ElementsAre;
using testing::HasSubstr;
using testing::IsEmpty;
using testing::Not;
using testing::SizeIs;

StatusReport example() {
    StatusReport report;
    report.version = "1.2.3";
    report.process = 42;
    report.uptimeSeconds = 3 * 86400 + 4 * 3600 + 5;
    report.configuration = "/etc/marlo/server.toml";
    report.listeners = {"http 127.0.0.1:5988", "local /run/marlo/marlo.sock"};
    report.counters = {1, 2, 3, 7, 5, 4, 6};
    report.requests = {{"GetInstance", "ok", 6}, {"GetInstance", "CIM_ERR_NOT_FOUND", 7}};
    report.latency = {1500, 2500, 10000};
    report.openEnumerations = 8;
    report.providers = {{"A", "libA.so", "loaded", ""}, {"B", "libB.so", "failed", "no such file"}};
    report.residentBytes = 3 * 1024 * 1024;
    report.lostLogLines = 9;
    return report;
}

TEST(StatusReport, ComesBackFromJson) {
    StatusReport report = example();
    report.reasons = {"provider B: no such file"};
    const StatusReport back = parseStatusReport(toJson(report));
    EXPECT_EQ(toJson(back), toJson(report));
    EXPECT_EQ(back.requests.at(1).count, 7U);
    EXPECT_EQ(back.counters.accepted, 2U);
    EXPECT_EQ(back.counters.aside, 4U);
    EXPECT_EQ(back.counters.tooSlow, 6U);
    EXPECT_EQ(back.providers.at(1).failure, "no such file");
    EXPECT_THAT(toJson(report), HasSubstr(R"("health":"degraded")"));
    EXPECT_THAT(toJson(example()), HasSubstr(R"("health":"ok")"));
}

TEST(StatusReport, OfSomethingElseIsRefused) {
    for (const char* text : {"", "{}", "[]", "{\"version\": 1}", "nothing"}) {
        EXPECT_THROW(static_cast<void>(parseStatusReport(text)), std::invalid_argument) << text;
    }
}

TEST(StatusReport, CarriesTextThatIsNoUtf8) {
    StatusReport report = example();
    report.providers.at(1).failure = "\xFF";
    EXPECT_EQ(parseStatusReport(toJson(report)).providers.at(1).failure, "\xEF\xBF\xBD");
}

TEST(StatusReport, IsShownAsTables) {
    const std::string text = cli::showStatus(example(), 0, false);
    EXPECT_THAT(text, HasSubstr("SERVER         marlo 1.2.3\nhealth         ok\n"
                                "process        42, up 3 d 4 h\n"));
    EXPECT_THAT(text, HasSubstr("listens        http 127.0.0.1:5988\n               local /run/marlo/marlo.sock\n"));
    EXPECT_THAT(text, HasSubstr("connections    1 open, 2 accepted, 5 refused, 6 too slow\n"
                                "requests       3 received, 7 busy, 4 of them for slow clients\n"));
    EXPECT_THAT(text, HasSubstr("answers        1.5 ms median, 2.5 ms 99 of 100, 10.0 ms longest\n"));
    EXPECT_THAT(text, HasSubstr("memory         3.0 MiB\n"));
    EXPECT_THAT(text, HasSubstr("B         failed  libB.so  no such file\n"));
    EXPECT_THAT(text, HasSubstr("GetInstance  CIM_ERR_NOT_FOUND  7\n"));
}

TEST(StatusReport, SaysWhyTheHealthIsDegraded) {
    StatusReport report = example();
    report.reasons = {"first", "second"};
    EXPECT_THAT(cli::showStatus(report, 0, false),
                HasSubstr("health         degraded\n               first\n               second\n"));
}

TEST(Health, IsDegradedWhileAllWorkersAreBusyAndNotWithSlowClients) {
    const auto reasonsWith = [](std::uint64_t busy, std::uint64_t aside) {
        StatusReport report;
        report.counters.busy = busy;
        report.counters.aside = aside;
        Health().complete(report, false, 16);
        return report.reasons;
    };
    EXPECT_THAT(reasonsWith(15, 0), IsEmpty());
    EXPECT_THAT(reasonsWith(16, 0), ElementsAre("all 16 workers are busy"));
    EXPECT_THAT(reasonsWith(20, 5), IsEmpty());
    EXPECT_THAT(reasonsWith(20, 4), ElementsAre("all 16 workers are busy"));
    EXPECT_THAT(reasonsWith(4, 5), IsEmpty()) << "they are not counted at the same moment";
}

TEST(ResidentMemory, IsThatOfThisProcess) {
    EXPECT_GT(residentBytes(), 1'000'000U);
    EXPECT_LT(residentBytes(), 1'000'000'000'000U);
}

TEST(Statistics, CountOperationsByTheirEnds) {
    Statistics statistics;
    statistics.count("GetInstance", "ok", microseconds(10));
    statistics.count("GetInstance", "ok", microseconds(10));
    statistics.count("GetClass", "CIM_ERR_NOT_FOUND", microseconds(10));
    const auto requests = statistics.requests();
    ASSERT_THAT(requests, SizeIs(2));
    EXPECT_EQ(requests.at(0).operation, "GetClass");
    EXPECT_EQ(requests.at(1).count, 2U);
}

TEST(Statistics, DoNotGrowWithTheNamesThatClientsMakeUp) {
    Statistics statistics;
    for (std::size_t i = 0; i < Statistics::MostKinds + 50; ++i) {
        statistics.count("Made" + std::to_string(i), "ok", microseconds(1));
    }
    const auto requests = statistics.requests();
    EXPECT_THAT(requests, SizeIs(Statistics::MostKinds + 1));
    const auto others = std::find_if(requests.begin(), requests.end(),
                                     [](const RequestCount& each) { return each.operation == "other"; });
    ASSERT_NE(others, requests.end());
    EXPECT_EQ(others->count, 50U);
}

TEST(Statistics, SumUpLatencies) {
    Statistics statistics;
    EXPECT_EQ(statistics.latency().median, 0U);
    for (int i = 0; i < 98; ++i) {
        statistics.count("a", "ok", microseconds(100));
    }
    statistics.count("a", "ok", microseconds(50'000));
    statistics.count("a", "ok", microseconds(1'000'000));
    const Latency latency = statistics.latency();
    EXPECT_GE(latency.median, 100U);
    EXPECT_LE(latency.median, 142U);
    EXPECT_GE(latency.high, 50'000U);
    EXPECT_LE(latency.high, 71'000U);
    EXPECT_EQ(latency.highest, 1'000'000U);
}

TEST(Statistics, TakeTimesOfAnyLength) {
    Statistics statistics;
    statistics.count("a", "ok", microseconds(-5));
    statistics.count("a", "ok", microseconds::max());
    EXPECT_EQ(statistics.latency().highest, static_cast<std::uint64_t>(microseconds::max().count()));
}

/** A socket that stands for the service manager's. */
class ServiceManager : public testing::Test {
  protected:
    ServiceManager() : _fd(::socket(AF_UNIX, SOCK_DGRAM | SOCK_NONBLOCK | SOCK_CLOEXEC, 0)) {}

    ~ServiceManager() override {
        ::unsetenv("NOTIFY_SOCKET");
        ::close(_fd);
    }

    void listen(const std::string& name) {
        sockaddr_un address{};
        address.sun_family = AF_UNIX;
        name.copy(address.sun_path, sizeof address.sun_path - 1);
        if (name.front() == '@') {
            address.sun_path[0] = '\0';
        }
        const auto length = static_cast<socklen_t>(offsetof(sockaddr_un, sun_path) + name.size());
        ASSERT_EQ(::bind(_fd, reinterpret_cast<sockaddr*>(&address), length), 0);
        ::setenv("NOTIFY_SOCKET", name.c_str(), 1);
    }

    std::string receive() {
        std::array<char, 256> buffer{};
        const ssize_t size = ::recv(_fd, buffer.data(), buffer.size(), 0);
        return size < 0 ? "" : std::string(buffer.data(), static_cast<std::size_t>(size));
    }

  private:
    int _fd;
};

TEST_F(ServiceManager, IsToldTheState) {
    const std::string path = testing::TempDir() + "marlo-notify-" + std::to_string(::getpid());
    listen(path);
    notifyManager("READY=1");
    EXPECT_EQ(receive(), "READY=1");
    notifyReloading();
    EXPECT_THAT(receive(), testing::MatchesRegex("RELOADING=1\nMONOTONIC_USEC=[0-9]+"));
    ::unlink(path.c_str());
}

TEST_F(ServiceManager, MayHaveAnAbstractName) {
    listen("@marlo-notify-" + std::to_string(::getpid()));
    notifyManager("STOPPING=1");
    EXPECT_EQ(receive(), "STOPPING=1");
}

TEST_F(ServiceManager, NeedNotBeThere) {
    notifyManager("READY=1");
    ::setenv("NOTIFY_SOCKET", "/nowhere/at/all", 1);
    notifyManager("READY=1");
    EXPECT_EQ(receive(), "");
}

TEST(Signals, AreReadInTheOrderOfTheirNumbersAndOnce) {
    {
        const Signals signals({SIGHUP, SIGTERM});
        EXPECT_EQ(signals.take(), std::nullopt);
        ::raise(SIGTERM);
        ::raise(SIGHUP);
        EXPECT_EQ(signals.take(), SIGHUP);
        EXPECT_EQ(signals.take(), SIGTERM);
        EXPECT_EQ(signals.take(), std::nullopt);
    }
    sigset_t mask;
    ::pthread_sigmask(SIG_SETMASK, nullptr, &mask);
    EXPECT_EQ(sigismember(&mask, SIGTERM), 0);
}

} // namespace
} // namespace marlo::server
