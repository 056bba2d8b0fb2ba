// How long a client may take: a connection, looked at just before and just after it has used up its time. The clock
// is the test's own.
#include "host/http/Roster.h"
#include "tests/http/RawClient.h"
#include "tests/http/ScriptedHandler.h"

#include <array>
#include <memory>
#include <string>

#include <gtest/gtest.h>
#include <sys/socket.h>

namespace {

using namespace marlo::http;
using namespace std::chrono_literals;
using Clock = Connection::Clock;

class ConnectionTimes : public testing::Test {
  protected:
    ConnectionTimes() {
        limits.headTime = 1h;
        limits.bodyTime = 2h;
        limits.idleTime = 3h;
        limits.sendTime = 4h;
    }

    ~ConnectionTimes() override {
        if (connection) {
            connection->cut();
        }
    }

    /** Lets the connection do its next step, and notes between which times that was. */
    template <typename Step>
    void atStep(Step step) {
        before = Clock::now();
        step();
        after = Clock::now();
    }

    void connect() {
        std::array<int, 2> ends{};
        ASSERT_EQ(::socketpair(AF_UNIX, SOCK_STREAM | SOCK_CLOEXEC, 0, ends.data()), 0);
        client = std::make_unique<RawClient>(Descriptor(ends[1]));
        site = std::make_unique<Site>(handler, limits, lines.sink(), 1);
        roster = std::make_unique<Roster>(loop, site->limits);
        connection = std::make_shared<Connection>(*site, loop, *roster, Descriptor(ends[0]), makePlainStream(ends[0]),
                                                  Peer{Transport::local, "test", 0, std::nullopt, std::nullopt},
                                                  *site->seats.take("test"));
        atStep([this] { connection->start(); });
    }

    void send(const std::string& text) {
        ASSERT_TRUE(client->send(text));
        atStep([this] { connection->onReady(); });
    }

    void runJob() {
        ASSERT_FALSE(loop.ready().empty());
        const auto job = loop.ready().front();
        loop.ready().pop_front();
        atStep([&job] {
            job->run();
            job->done();
        });
    }

    void lookBefore(Clock::duration time) { connection->tick(before + time - 1ns); }

    void lookAfter(Clock::duration time) { connection->tick(after + time); }

    /** Nothing came, and the connection is open. */
    bool isInPeace() { return client->readSome(0ms).empty() && !client->isEndedWithin(0ms); }

    ScriptedHandler handler;
    Lines lines;
    Limits limits;
    Loop loop;
    std::unique_ptr<Site> site;
    std::unique_ptr<Roster> roster;
    std::unique_ptr<RawClient> client;
    std::shared_ptr<Connection> connection;
    Clock::time_point before;
    Clock::time_point after;
};

TEST_F(ConnectionTimes, OfSilence) {
    connect();
    lookBefore(3h);
    EXPECT_TRUE(isInPeace());
    lookAfter(3h);
    EXPECT_TRUE(client->isEndedWithin(0ms));
}

TEST_F(ConnectionTimes, OfAHead) {
    connect();
    send("GET / HTTP/1.1\r\n");
    const auto first = before;
    send("X: y\r\n");
    before = first;
    lookBefore(1h);
    EXPECT_TRUE(isInPeace());
    lookAfter(1h);
    EXPECT_EQ(client->readAnswer().status, 408U);
    EXPECT_EQ(client->readToEnd(), "");
}

TEST_F(ConnectionTimes, OfAHeadCountFromItsFirstByte) {
    connect();
    send("GET / HTTP/1.1\r\n");
    const auto first = after;
    send("X: y\r\n");
    connection->tick(first + 1h);
    EXPECT_EQ(client->readAnswer().status, 408U);
}

TEST_F(ConnectionTimes, OfAHeadThatIsCompleteAreOver) {
    connect();
    send("GET / HTTP/1.1\r\n");
    send("Host: x\r\n\r\n");
    lookAfter(100h);
    runJob();
    EXPECT_EQ(client->readAnswer().status, 200U);
}

TEST_F(ConnectionTimes, OfABody) {
    connect();
    send("POST / HTTP/1.1\r\nHost: x\r\nContent-Length: 5\r\n\r\n");
    runJob();
    const auto first = before;
    const auto last = after;
    send("bod");
    before = first;
    after = last;
    lookBefore(2h);
    EXPECT_TRUE(isInPeace());
    lookAfter(2h);
    EXPECT_EQ(client->readAnswer().status, 408U);
    EXPECT_EQ(client->readToEnd(), "");
}

TEST_F(ConnectionTimes, OfABodyThatIsCompleteAreOver) {
    connect();
    send("POST / HTTP/1.1\r\nHost: x\r\nContent-Length: 5\r\n\r\n");
    runJob();
    lookBefore(2h);
    send("bodys");
    lookAfter(100h);
    runJob();
    EXPECT_EQ(client->readAnswer().body, "POST / bodys");
}

/** More than a socket holds. */
class TimesOfLargeAnswers : public ConnectionTimes {
  protected:
    static constexpr std::size_t size = std::size_t{8} << 20U;

    TimesOfLargeAnswers() {
        handler.onHandle = [](Request&&, Responder& responder) {
            responder.send({200, {}, std::string(size, 'b'), false, {}});
        };
    }

    void ask() {
        connect();
        send("GET / HTTP/1.1\r\nHost: x\r\n\r\n");
        runJob();
    }
};

TEST_F(TimesOfLargeAnswers, ThatAreNotTaken) {
    ask();
    lookBefore(4h);
    EXPECT_EQ(site->tooSlow, 0U);
    lookAfter(4h);
    EXPECT_EQ(site->tooSlow, 1U);
    EXPECT_EQ(lines.count("dropped test: it took its answer too slowly"), 1U);
    EXPECT_FALSE(client->readAnswer().isWhole);
}

TEST_F(TimesOfLargeAnswers, ThatAreTakenInDribs) {
    limits.sendRate = 200;
    ask();
    Clock::time_point now = after;
    int hours = 0;
    for (; site->tooSlow == 0 && hours < 100; ++hours) {
        for (std::size_t taken = 0; taken < 1800 * limits.sendRate;) {
            const std::size_t came = client->readSome(0ms).size();
            taken += came;
            connection->onReady();
            ASSERT_GT(came, 0U);
        }
        now += 1h;
        connection->tick(now);
    }
    // At half of the rate, or a little more, the four hours last for eight, or a little more.
    EXPECT_GE(hours, 7);
    EXPECT_LE(hours, 11);
}

TEST_F(TimesOfLargeAnswers, ThatAreTakenSlowlyButSteadily) {
    limits.sendRate = 100;
    ask();
    Clock::time_point now = after;
    std::size_t taken = 0;
    while (taken < size) {
        now += 3h;
        connection->tick(now);
        for (std::size_t wanted = taken + 3 * 3600 * 100; taken < wanted && taken < size;) {
            taken += client->readSome(0ms).size();
            connection->onReady();
        }
    }
    EXPECT_EQ(site->tooSlow, 0U);
}

} // namespace
