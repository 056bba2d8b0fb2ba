#include "tests/http/ServerFixture.h"

#include <string>
#include <vector>

namespace {

using namespace marlo::http;
using std::chrono::milliseconds;

/** At each limit and one past it. */
class HttpLimits : public ServerFixture {
  protected:
    /** A GET of exactly so many bytes. */
    static std::string headOf(std::size_t size) {
        const std::string start = "GET / HTTP/1.1\r\nHost: x\r\nX: ";
        return start + std::string(size - start.size() - 4, 'x') + "\r\n\r\n";
    }

    static std::string chunked(const std::string& body) {
        std::string text = "POST / HTTP/1.1\r\nHost: x\r\nTransfer-Encoding: chunked\r\n\r\n";
        for (const char byte : body) {
            text += std::string("1\r\n") + byte + "\r\n";
        }
        return text + "0\r\n\r\n";
    }
};

TEST_F(HttpLimits, OfAHead) {
    limits.headBytes = 1000;
    RawClient asking = client();
    asking.send(headOf(1000));
    EXPECT_EQ(asking.readAnswer().status, 200U);
    asking.send(headOf(1001));
    const auto answer = asking.readAnswer();
    EXPECT_EQ(answer.status, 431U);
    EXPECT_EQ(answer.field("Connection"), "close");
    EXPECT_EQ(asking.readToEnd(), "");
}

TEST_F(HttpLimits, OfAHeadThatNeverEnds) {
    limits.headBytes = 1000;
    RawClient asking = client();
    asking.send("GET /" + std::string(995, 'x'));
    EXPECT_EQ(asking.readAnswer().status, 431U);
}

TEST_F(HttpLimits, OfABody) {
    limits.bodyBytes = 1000;
    RawClient asking = client();
    asking.send(post(std::string(1000, 'b')));
    EXPECT_EQ(asking.readAnswer().status, 200U);
    asking.send(post(std::string(1001, 'b')));
    EXPECT_EQ(asking.readAnswer().status, 413U);
}

TEST_F(HttpLimits, OfABodyInChunks) {
    limits.bodyBytes = 1000;
    RawClient asking = client();
    asking.send(chunked(std::string(1000, 'b')));
    EXPECT_EQ(asking.readAnswer().status, 200U);
    asking.send(chunked(std::string(1001, 'b')));
    EXPECT_EQ(asking.readAnswer().status, 413U);
    EXPECT_EQ(asking.readToEnd(), "");
}

TEST_F(HttpLimits, OfTheHeadOfAChunk) {
    limits.headBytes = 1000;
    const std::string start = "POST / HTTP/1.1\r\nHost: x\r\nTransfer-Encoding: chunked\r\n\r\n1";
    RawClient asking = client();
    asking.send(start + ";x=" + std::string(900, 'x') + "\r\nb\r\n0\r\n\r\n");
    EXPECT_EQ(asking.readAnswer().status, 200U);
    asking.send(start + ";x=" + std::string(2000, 'x'));
    EXPECT_EQ(asking.readAnswer().status, 431U);
}

TEST_F(HttpLimits, OfTrailers) {
    limits.headBytes = 1000;
    const std::string start = "POST / HTTP/1.1\r\nHost: x\r\nTransfer-Encoding: chunked\r\n\r\n0\r\nX: ";
    RawClient asking = client();
    asking.send(start + std::string(900, 'x') + "\r\n\r\n");
    EXPECT_EQ(asking.readAnswer().status, 200U);
    asking.send(start + std::string(2000, 'x'));
    EXPECT_EQ(asking.readAnswer().status, 431U);
}

TEST_F(HttpLimits, OfConnectionsOfOnePeer) {
    limits.connectionsPerPeer = 3;
    std::vector<RawClient> taken;
    for (int count = 0; count < 3; ++count) {
        taken.push_back(clientOf(0));
        taken.back().send(get());
        EXPECT_EQ(taken.back().readAnswer().status, 200U);
    }
    RawClient refused = clientOf(0);
    const auto answer = refused.readAnswer();
    EXPECT_EQ(answer.status, 503U);
    EXPECT_EQ(answer.field("Content-Length"), std::to_string(answer.body.size()));
    EXPECT_EQ(server().counters().refusedConnections, 1U);

    RawClient other = client(); // who is somebody else
    other.send(get());
    EXPECT_EQ(other.readAnswer().status, 200U);

    taken.pop_back();
    ASSERT_TRUE(comesTrue([this] { return server().counters().connections == 3; }));
    RawClient next = clientOf(0);
    next.send(get());
    EXPECT_EQ(next.readAnswer().status, 200U);
}

TEST_F(HttpLimits, OfConnectionsOfAllPeers) {
    limits.connections = 2;
    RawClient one = client();
    RawClient two = clientOf(0);
    two.send(get());
    EXPECT_EQ(two.readAnswer().status, 200U);
    EXPECT_EQ(clientOf(0).readAnswer().status, 503U);
    one.close();
    ASSERT_TRUE(comesTrue([this] { return server().counters().connections == 1; }));
    RawClient next = clientOf(0);
    next.send(get());
    EXPECT_EQ(next.readAnswer().status, 200U);
}

TEST_F(HttpLimits, OfRequestsAtOnceMakeOthersWait) {
    limits.workers = 2;
    limits.queued = 3;
    Gate gate;
    handler.onHandle = [&gate](Request&&, Responder& responder) {
        gate.pass();
        responder.send({});
    };
    std::vector<RawClient> served;
    for (std::size_t count = 0; count < 5; ++count) {
        served.push_back(client());
        served.back().send(get());
        ASSERT_TRUE(comesTrue([this, count] { return server().counters().busy == count + 1; }));
    }
    ASSERT_TRUE(gate.awaitWaiting(2));
    RawClient late = client();
    late.send(get());
    EXPECT_EQ(late.readAnswer().status, 503U);
    EXPECT_EQ(late.readToEnd(), "");
    gate.open();
    for (RawClient& each : served) {
        EXPECT_EQ(each.readAnswer().status, 200U);
    }
    EXPECT_TRUE(comesTrue([this] { return server().counters().busy == 0; }));
}

class HttpTimes : public ServerFixture {
  protected:
    HttpTimes() { limits.idleTime = limits.headTime = limits.bodyTime = limits.sendTime = milliseconds(60000); }
};

TEST_F(HttpTimes, OfAnIdleConnectionEndItInSilence) {
    limits.idleTime = milliseconds(100);
    RawClient asking = client();
    asking.send(get());
    EXPECT_EQ(asking.readAnswer().status, 200U);
    EXPECT_TRUE(asking.isEndedWithin(milliseconds(10000)));
    EXPECT_TRUE(comesTrue([this] { return server().counters().connections == 0; }));
}

TEST_F(HttpTimes, OfAConnectionThatNeverAskedEndItInSilence) {
    limits.idleTime = milliseconds(100);
    RawClient asking = client();
    EXPECT_TRUE(asking.isEndedWithin(milliseconds(10000)));
}

TEST_F(HttpTimes, OfAHeadAreNotProlongedByMoreOfIt) {
    limits.headTime = milliseconds(200);
    RawClient asking = client();
    const auto start = std::chrono::steady_clock::now();
    asking.send("GET / HTTP/1.1\r\n");
    std::string answer;
    while (answer.empty() && std::chrono::steady_clock::now() - start < milliseconds(10000)) {
        asking.send("X: y\r\n");
        answer = asking.readSome(milliseconds(20));
    }
    EXPECT_EQ(answer.substr(0, 12), "HTTP/1.1 408");
    EXPECT_NE(answer.find("Content-Length: "), std::string::npos);
}

TEST_F(HttpTimes, OfABodyAreNotProlongedByMoreOfIt) {
    limits.bodyTime = milliseconds(200);
    RawClient asking = client();
    asking.send("POST / HTTP/1.1\r\nHost: x\r\nContent-Length: 100000\r\n\r\n");
    const auto start = std::chrono::steady_clock::now();
    std::string answer;
    while (answer.empty() && std::chrono::steady_clock::now() - start < milliseconds(10000)) {
        asking.send("b");
        answer = asking.readSome(milliseconds(20));
    }
    EXPECT_EQ(answer.substr(0, 12), "HTTP/1.1 408");
}

TEST_F(HttpTimes, OfAnAnswerThatIsNotTakenEndItsConnection) {
    limits.sendTime = milliseconds(200);
    handler.onHandle = [](Request&&, Responder& responder) {
        responder.send({200, {}, std::string(64 << 20, 'b'), false, {}});
    };
    RawClient asking = client();
    asking.send(get());
    EXPECT_TRUE(
        comesTrue([this] { return server().counters().requests == 1 && server().counters().connections == 0; }));
    const auto answer = asking.readAnswer();
    EXPECT_EQ(answer.status, 200U);
    EXPECT_FALSE(answer.isWhole);
}

TEST_F(HttpTimes, OfAWrittenAnswerThatIsNotTakenAreTheHandlersToKnow) {
    limits.sendTime = milliseconds(200);
    std::atomic<bool> isGone{false};
    handler.onHandle = [&isGone](Request&&, Responder& responder) {
        responder.begin(200, {});
        try {
            while (true) {
                responder.write(std::string(1 << 20, 'b'));
            }
        } catch (const ClientGone&) {
            isGone = true;
            throw;
        }
    };
    RawClient asking = client();
    asking.send(get());
    EXPECT_TRUE(comesTrue([&isGone] { return isGone.load(); }));
    EXPECT_FALSE(asking.readAnswer().isWhole);
    EXPECT_TRUE(lines.all().empty()) << "a client that went is no error of the server's";
}

TEST_F(HttpTimes, OfAClientThatSendsOnAfterItsLastAnswer) {
    limits.lingerTime = milliseconds(200);
    RawClient asking = client();
    asking.send("GET / HTTP/1.0\r\n\r\n");
    EXPECT_EQ(asking.readAnswer().status, 200U);
    bool isTaken = true;
    for (int count = 0; isTaken && count < 1000; ++count) {
        isTaken = asking.send("more");
        std::this_thread::sleep_for(milliseconds(10));
    }
    EXPECT_FALSE(isTaken);
}

} // namespace
