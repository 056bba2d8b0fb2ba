#include "tests/http/ServerFixture.h"

#include <array>
#include <string>

#include <netinet/in.h>
#include <netinet/tcp.h>
#include <sys/socket.h>

namespace {

using namespace marlo::http;
using std::chrono::milliseconds;

/** What a handler does with its responder, and what its client gets of it. */
class Answers : public ServerFixture {
  protected:
    /** Answers are written in about ten pieces. */
    void write(std::size_t size) {
        handler.onHandle = [size](Request&&, Responder& responder) {
            const std::size_t piece = size / 10 + 1;
            responder.begin(200, {{"X", "y"}});
            for (std::size_t sent = 0; sent < size; sent += piece) {
                responder.write(std::string(std::min(piece, size - sent), 'b'));
            }
            responder.finish();
        };
    }
};

TEST_F(Answers, ThatAreWrittenGoOutWholeWhereTheyAreShort) {
    limits.gathered = 1000;
    write(999);
    RawClient asking = client();
    asking.send(get());
    const auto answer = asking.readAnswer();
    EXPECT_EQ(answer.field("Content-Length"), "999");
    EXPECT_EQ(answer.field("Transfer-Encoding"), "");
    EXPECT_EQ(answer.field("X"), "y");
    EXPECT_EQ(answer.body, std::string(999, 'b'));
}

TEST_F(Answers, ThatAreWrittenGoOutInChunksWhereTheyAreLong) {
    limits.gathered = 1000;
    write(1000);
    RawClient asking = client();
    asking.send(get());
    const auto answer = asking.readAnswer();
    EXPECT_EQ(answer.field("Transfer-Encoding"), "chunked");
    EXPECT_EQ(answer.field("Content-Length"), "");
    EXPECT_EQ(answer.body, std::string(1000, 'b'));
    EXPECT_TRUE(answer.isWhole);
    asking.send(get());
    EXPECT_EQ(asking.readAnswer().status, 200U);
}

TEST_F(Answers, OfAnyLengthArriveWhole) {
    for (const std::size_t size : {0U, 1U, 65535U, 65536U, 65537U, 1000000U, 10000000U}) {
        endServer();
        write(size);
        RawClient asking = clientOf(0);
        asking.send(get());
        EXPECT_EQ(asking.readAnswer().body, std::string(size, 'b'));
    }
}

TEST_F(Answers, ToOneDotZeroEndWithTheConnectionWhereTheyAreLong) {
    limits.gathered = 1000;
    write(5000);
    RawClient asking = client();
    asking.send("GET / HTTP/1.0\r\nConnection: keep-alive\r\n\r\n");
    const auto answer = asking.readAnswer();
    EXPECT_EQ(answer.field("Transfer-Encoding"), "");
    EXPECT_EQ(answer.field("Connection"), "close");
    EXPECT_EQ(answer.body, std::string(5000, 'b'));
}

TEST_F(Answers, ToHeadHaveAHeadOnly) {
    limits.gathered = 1000;
    RawClient asking = client();
    write(500);
    asking.send("HEAD / HTTP/1.1\r\nHost: x\r\n\r\n");
    EXPECT_EQ(asking.readAnswer(true).field("Content-Length"), "500");
    endServer();
    RawClient again = client();
    write(5000);
    again.send("HEAD / HTTP/1.1\r\nHost: x\r\n\r\n");
    EXPECT_EQ(again.readAnswer(true).status, 200U);
    again.send(get());
    EXPECT_EQ(again.readAnswer().body, std::string(5000, 'b'));
}

TEST_F(Answers, WithoutContentSayNothingOfItsLength) {
    handler.onHandle = [](Request&&, Responder& responder) { responder.send({204, {}, "", false, {}}); };
    RawClient asking = client();
    asking.send(get());
    const auto answer = asking.readAnswer();
    EXPECT_EQ(answer.status, 204U);
    EXPECT_EQ(answer.field("Content-Length"), "");
}

TEST_F(Answers, CannotBeSplitByTheValueOfAField) {
    handler.onHandle = [](Request&&, Responder& responder) {
        responder.send({200, {{"X", "a\r\nY: b\r\n\r\nc"}}, "", false, {}});
    };
    RawClient asking = client();
    asking.send(get());
    const auto answer = asking.readAnswer();
    EXPECT_EQ(answer.field("X"), "a  Y: b    c");
    EXPECT_EQ(answer.field("Y"), "");
}

TEST_F(Answers, ThatFailBeforeAnythingWasSentAreReplaced) {
    handler.onHandle = [](Request&&, Responder& responder) {
        responder.begin(200, {});
        responder.write("half of it");
        responder.fail({500, {}, "instead", false, {}}, {});
    };
    RawClient asking = client();
    asking.send(get());
    const auto answer = asking.readAnswer();
    EXPECT_EQ(answer.status, 500U);
    EXPECT_EQ(answer.body, "instead");
    asking.send(get());
    EXPECT_EQ(asking.readAnswer().status, 500U);
}

class HalfAnswers : public Answers {
  protected:
    HalfAnswers() {
        limits.gathered = 1000;
        handler.onHandle = [](Request&&, Responder& responder) {
            responder.begin(200, {});
            responder.write(std::string(1500, 'b'));
            responder.fail({500, {}, "instead", false, {}}, {{"CIMStatusCode", "1"}});
        };
    }
};

TEST_F(HalfAnswers, EndWithTrailersWhereTheClientTakesThem) {
    RawClient asking = client();
    asking.send("GET / HTTP/1.1\r\nHost: x\r\nTE: chunked, trailers\r\n\r\n");
    const auto answer = asking.readAnswer();
    EXPECT_EQ(answer.status, 200U);
    EXPECT_TRUE(answer.isWhole);
    EXPECT_EQ(answer.body, std::string(1500, 'b'));
    EXPECT_EQ(answer.trailers, "CIMStatusCode: 1\n");
}

TEST_F(HalfAnswers, AreNotTakenForWholeOnes) {
    RawClient asking = clientOf(0);
    asking.send(get());
    EXPECT_FALSE(asking.readAnswer().isWhole);
}

TEST_F(HalfAnswers, AreResetForOneDotZeroWhereTheEndWouldMeanSuccess) {
    RawClient asking = clientOf(0);
    asking.send("GET / HTTP/1.0\r\n\r\n");
    EXPECT_FALSE(asking.readAnswer().isWhole);
    EXPECT_TRUE(asking.wasReset());
}

class Handlers : public Answers {};

TEST_F(Handlers, ThatThrowAreAnsweredForAndLogged) {
    handler.onHandle = [](Request&&, Responder&) { throw std::runtime_error("broken"); };
    RawClient asking = client();
    asking.send(get());
    EXPECT_EQ(asking.readAnswer().status, 500U);
    asking.send(get());
    EXPECT_EQ(asking.readAnswer().status, 500U);
    EXPECT_EQ(lines.count("broken"), 2U);
}

TEST_F(Handlers, ThatThrowWhatIsNoExceptionAreAnsweredFor) {
    handler.onHandle = [](Request&&, Responder&) { throw 1; };
    RawClient asking = client();
    asking.send(get());
    EXPECT_EQ(asking.readAnswer().status, 500U);
}

TEST_F(Handlers, ThatThrowOnceMoreWhenTheyAreToRefuseLoseTheConnectionOnly) {
    handler.onHandle = [](Request&& request, Responder& responder) {
        if (request.head.target == "/good") {
            responder.send({});
        } else {
            throw std::runtime_error("broken");
        }
    };
    handler.onRefuse = [] { throw std::runtime_error("broken again"); };
    RawClient asking = clientOf(0);
    asking.send(get());
    EXPECT_EQ(asking.readAnswer().status, 0U);
    RawClient bad = clientOf(0);
    bad.send("nonsense\n");
    EXPECT_EQ(bad.readAnswer().status, 0U);
    RawClient next = clientOf(0);
    next.send(get("/good"));
    EXPECT_EQ(next.readAnswer().status, 200U);
}

TEST_F(Handlers, ThatThrowOnAdmissionAreAnsweredFor) {
    handler.onAdmit = [](const RequestHead&, const Peer&, std::any&) -> std::optional<Answer> {
        throw std::runtime_error("broken");
    };
    RawClient asking = client();
    asking.send(post("abc"));
    EXPECT_EQ(asking.readAnswer().status, 500U);
    EXPECT_EQ(lines.count("broken"), 1U);
}

TEST_F(Handlers, ThatThrowInTheMiddleCutTheConnection) {
    limits.gathered = 1000;
    handler.onHandle = [](Request&&, Responder& responder) {
        responder.begin(200, {});
        responder.write(std::string(1500, 'b'));
        throw std::runtime_error("broken");
    };
    RawClient asking = clientOf(0);
    asking.send(get());
    EXPECT_FALSE(asking.readAnswer().isWhole);
    EXPECT_EQ(lines.count("broken"), 1U);
}

TEST_F(Handlers, ThatDoNotAnswerAreAnsweredFor) {
    handler.onHandle = [](Request&&, Responder&) {};
    RawClient asking = client();
    asking.send(get());
    EXPECT_EQ(asking.readAnswer().status, 500U);
    EXPECT_EQ(lines.count("without an answer"), 1U);
}

TEST_F(Handlers, ThatAnswerTwiceAreToldSo) {
    handler.onHandle = [](Request&&, Responder& responder) {
        responder.send({200, {}, "one", false, {}});
        EXPECT_THROW(responder.send({200, {}, "two", false, {}}), std::logic_error);
        EXPECT_THROW(responder.begin(200, {}), std::logic_error);
        EXPECT_THROW(responder.write(""), std::logic_error);
        EXPECT_THROW(responder.finish(), std::logic_error);
    };
    RawClient asking = client();
    asking.send(get() + get("/next"));
    EXPECT_EQ(asking.readAnswer().body, "one");
    EXPECT_EQ(asking.readAnswer().body, "one");
}

/**
 * A client of TCP that acknowledges late, as all do: a server whose answers leave in two parts, the second of which
 * waits for the first to be acknowledged, loses 40 ms with each.
 */
class LateAcknowledgements : public Answers {
  protected:
    static constexpr int answers = 100;

    template <typename Ask>
    milliseconds timeOf(Ask ask) {
        RawClient asking = clientOf(0);
        const auto start = std::chrono::steady_clock::now();
        for (int count = 0; count < answers; ++count) {
            const int late = 0;
            ::setsockopt(asking.descriptor(), IPPROTO_TCP, TCP_QUICKACK, &late, sizeof(late));
            ask(asking);
            EXPECT_TRUE(asking.readAnswer().isWhole);
        }
        return std::chrono::duration_cast<milliseconds>(std::chrono::steady_clock::now() - start);
    }

    /** Less than half of what a stall with each answer would take. */
    static constexpr milliseconds bound{answers * 20};
};

TEST_F(LateAcknowledgements, DoNotHoldUpAnswersOfAnySize) {
    for (const std::size_t size : {10U, 3000U, 50000U, 70000U, 150000U}) {
        write(size);
        EXPECT_LT(timeOf([](RawClient& asking) { asking.send(get()); }), bound) << size;
        endServer();
    }
}

TEST_F(LateAcknowledgements, DoNotHoldUpBodiesThatComeBehindTheirHeads) {
    EXPECT_LT(timeOf([](RawClient& asking) {
                  asking.send("POST / HTTP/1.1\r\nHost: x\r\nContent-Length: 3\r\n\r\n");
                  asking.send("abc");
              }),
              bound);
}

} // namespace
