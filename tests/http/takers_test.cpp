// Clients that take long answers slowly, and requests whose admission is put off: nobody else waits for them.
#include "tests/http/ServerFixture.h"
#include "tests/http/TlsClient.h"

#include <memory>
#include <string>
#include <vector>

#include <sys/socket.h>

namespace {

using namespace marlo::http;
using std::chrono::milliseconds;

/** Asked for "/long", it writes more than sockets hold. */
class Takers : public ServerFixture {
  protected:
    static constexpr std::size_t pieces = 24;
    static constexpr std::size_t pieceSize = std::size_t{1} << 20U;

    Takers() {
        limits.holdTime = milliseconds(20);
        handler.onHandle = [](Request&& request, Responder& responder) {
            responder.begin(200, {});
            for (std::size_t count = 0; count < (request.head.target == "/long" ? pieces : 1); ++count) {
                responder.write(std::string(pieceSize, 'b'));
            }
            responder.finish();
        };
    }

    RawClient slowTaker() {
        RawClient taker = clientOf(0);
        taker.send(get("/long"));
        return taker;
    }

    bool comeAside(std::size_t count) {
        return comesTrue([this, count] { return server().counters().aside == count; });
    }

    std::size_t answerSize(RawClient& asking, const std::string& target) {
        asking.send(get(target));
        const auto answer = asking.readAnswer();
        return answer.isWhole ? answer.body.size() : 0;
    }
};

TEST_F(Takers, WhoAreMoreThanTheWorkersKeepNobodyWaiting) {
    limits.workers = 2;
    std::vector<RawClient> takers;
    for (std::size_t count = 0; count < 2 * limits.workers + 1; ++count) {
        takers.push_back(slowTaker());
    }
    ASSERT_TRUE(comeAside(takers.size()));
    EXPECT_EQ(server().counters().busy, takers.size());
    RawClient other = clientOf(0);
    for (int count = 0; count < 3; ++count) {
        for (RawClient& taker : takers) {
            EXPECT_GT(taker.readSome(milliseconds(20000)).size(), 0U);
        }
        EXPECT_EQ(answerSize(other, "/"), pieceSize);
    }
    EXPECT_EQ(server().counters().aside, takers.size());
    EXPECT_EQ(server().counters().tooSlow, 0U);
}

TEST_F(Takers, GetAllOfTheirAnswersAndGiveTheirPlacesBack) {
    limits.workers = 1;
    limits.aside = 2;
    for (int round = 0; round < 2; ++round) {
        std::vector<RawClient> takers;
        takers.push_back(slowTaker());
        takers.push_back(slowTaker());
        ASSERT_TRUE(comeAside(2));
        for (RawClient& taker : takers) {
            const auto answer = taker.readAnswer();
            EXPECT_TRUE(answer.isWhole);
            EXPECT_EQ(answer.body.size(), pieces * pieceSize);
        }
        ASSERT_TRUE(comeAside(0));
        EXPECT_TRUE(comesTrue([this] { return server().counters().busy == 0; }));
    }
    EXPECT_EQ(server().counters().tooSlow, 0U);
}

TEST_F(Takers, BeyondTheLimitHoldAWorkerUntilThereIsAPlace) {
    limits.workers = 2;
    limits.aside = 1;
    limits.longestHold = milliseconds(60000);
    RawClient first = slowTaker();
    ASSERT_TRUE(comeAside(1));
    RawClient second = slowTaker();
    RawClient other = clientOf(0);
    EXPECT_EQ(answerSize(other, "/"), pieceSize);
    EXPECT_TRUE(first.readAnswer().isWhole);
    ASSERT_TRUE(comesTrue([this] { return server().counters().busy == 1 && server().counters().aside == 1; }));
    EXPECT_TRUE(second.readAnswer().isWhole);
    EXPECT_EQ(server().counters().tooSlow, 0U);
}

TEST_F(Takers, BeyondTheLimitAreDroppedWhenTheyHoldAWorkerForTooLong) {
    limits.workers = 1;
    limits.aside = 2;
    limits.longestHold = milliseconds(100);
    const auto reason = std::make_shared<std::string>();
    handler.onHandle = [reason, write = handler.onHandle](Request&& request, Responder& responder) {
        try {
            write(std::move(request), responder);
        } catch (const ClientGone& gone) {
            *reason = gone.what();
            throw;
        }
    };
    std::vector<RawClient> takers;
    takers.push_back(slowTaker());
    takers.push_back(slowTaker());
    ASSERT_TRUE(comeAside(2));
    EXPECT_EQ(server().counters().tooSlow, 0U);
    RawClient late = slowTaker();
    ASSERT_TRUE(comesTrue([this] { return server().counters().tooSlow == 1; }));
    ASSERT_TRUE(comesTrue([this] { return server().counters().connections == 2; }));
    EXPECT_EQ(*reason, "too many clients take their answers slowly");
    EXPECT_FALSE(late.readAnswer().isWhole);

    RawClient other = clientOf(0);
    EXPECT_EQ(answerSize(other, "/"), pieceSize);
    for (RawClient& taker : takers) {
        EXPECT_TRUE(taker.readAnswer().isWhole);
    }
}

TEST_F(Takers, OfAByteNowAndThenAreDropped) {
    limits.sendTime = milliseconds(300);
    RawClient taker = slowTaker();
    char byte = 0;
    const auto start = std::chrono::steady_clock::now();
    while (server().counters().tooSlow == 0 && std::chrono::steady_clock::now() - start < milliseconds(20000)) {
        ::recv(taker.descriptor(), &byte, 1, MSG_DONTWAIT);
        std::this_thread::sleep_for(milliseconds(5));
    }
    EXPECT_EQ(server().counters().tooSlow, 1U);
    EXPECT_TRUE(comesTrue([this] { return server().counters().connections == 0; }));
}

TEST_F(Takers, WhoAreSlowButKeepTheRateGetAllOfTheirAnswers) {
    limits.sendTime = milliseconds(1000);
    limits.sendRate = std::size_t{256} * 1024;
    handler.onHandle = [](Request&&, Responder& responder) {
        responder.begin(200, {});
        responder.write(std::string(4 * pieceSize, 'b'));
        responder.finish();
    };
    RawClient taker = client();
    taker.send(get());
    std::size_t taken = 0;
    const auto start = std::chrono::steady_clock::now();
    while (taken < 4 * pieceSize) {
        std::this_thread::sleep_for(milliseconds(20));
        const std::size_t came = taker.readSome(milliseconds(20000)).size();
        ASSERT_GT(came, 0U);
        taken += came;
    }
    EXPECT_GT(std::chrono::steady_clock::now() - start, limits.sendTime);
    EXPECT_EQ(server().counters().tooSlow, 0U);
}

TEST_F(Takers, ThroughTlsKeepNobodyWaitingEither) {
    Certificates certificates;
    certificates.make("server", "/CN=server");
    tls = certificates.server("server");
    endpoints.push_back({Transport::tls, "127.0.0.1", 0, 0});
    limits.workers = 1;
    std::vector<std::unique_ptr<TlsClient>> takers;
    for (int count = 0; count < 3; ++count) {
        takers.push_back(std::make_unique<TlsClient>(server().endpoints().at(1), certificates,
                                                     TlsClient::Options{0, "", "", false}));
        takers.back()->send(get("/long"));
    }
    ASSERT_TRUE(comeAside(3));
    TlsClient other(server().endpoints().at(1), certificates, {0, "", "", false});
    other.send(get());
    EXPECT_GT(other.read(pieceSize).size(), pieceSize);
    for (const auto& taker : takers) {
        EXPECT_GT(taker->read(pieces * pieceSize).size(), pieces * pieceSize);
    }
    EXPECT_EQ(server().counters().tooSlow, 0U);
}

/** A handler that cannot tell at once who asks "/who". */
class Postponed : public ServerFixture {
  protected:
    Postponed() {
        limits.workers = 1;
        handler.onAdmit = [this](const RequestHead& head, const Peer&, std::any&) -> std::optional<Answer> {
            if (head.target != "/who" || (++asked > 0 && isKnown)) {
                return std::nullopt;
            }
            Answer answer{503, {{"Retry-After", "1"}}, "not now", false, {}};
            answer.isForNow = true;
            return answer;
        };
    }

    std::atomic<int> asked{0};
    std::atomic<bool> isKnown{false};
};

TEST_F(Postponed, RequestsHoldNoWorkerAndAreAnsweredInTheEnd) {
    RawClient asking = client();
    asking.send("POST /who HTTP/1.1\r\nHost: x\r\nContent-Length: 4\r\n\r\nbody" + get());
    ASSERT_TRUE(comesTrue([this] { return asked >= 2; }));
    RawClient other = client();
    other.send(get());
    EXPECT_EQ(other.readAnswer().status, 200U);
    EXPECT_EQ(server().counters().requests, 2U);
    isKnown = true;
    EXPECT_EQ(asking.readAnswer().body, "POST /who body");
    EXPECT_EQ(asking.readAnswer().body, "GET / ");
}

TEST_F(Postponed, ForTooLongRequestsAreRefusedWithWhatTheHandlerSaid) {
    limits.admissionTime = milliseconds(100);
    RawClient asking = client();
    asking.send(get("/who") + get());
    const auto answer = asking.readAnswer();
    EXPECT_EQ(answer.status, 503U);
    EXPECT_EQ(answer.field("Retry-After"), "1");
    EXPECT_GE(asked, 2);
    EXPECT_EQ(lines.count("nobody could say in time who asks"), 1U);
    EXPECT_EQ(asking.readAnswer().status, 200U);

    asked = 0;
    asking.send(get("/who"));
    EXPECT_EQ(asking.readAnswer().status, 503U);
    EXPECT_GE(asked, 2) << "each request has its time";
}

TEST_F(Postponed, WithoutTimeRequestsAreRefusedAtOnce) {
    limits.admissionTime = milliseconds(0);
    RawClient asking = client();
    asking.send(get("/who"));
    EXPECT_EQ(asking.readAnswer().status, 503U);
    EXPECT_EQ(asked, 1);
}

TEST_F(Postponed, RequestsAreRefusedWhenTheServerStops) {
    limits.admissionTime = milliseconds(60000);
    RawClient asking = client();
    asking.send(get("/who"));
    ASSERT_TRUE(comesTrue([this] { return asked >= 1; }));
    std::thread stopping([this] { server().stop(milliseconds(20000)); });
    EXPECT_EQ(asking.readAnswer().status, 503U);
    asking.close();
    stopping.join();
}

} // namespace
