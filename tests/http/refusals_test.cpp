#include "tests/http/ServerFixture.h"

#include <string>

namespace {

using namespace marlo::http;
using std::chrono::milliseconds;

/** Requests that are not admitted, and those whose body is not wanted. */
class Refusals : public ServerFixture {
  protected:
    void refuseAll() {
        handler.onAdmit = [](const RequestHead& head, const Peer&, std::any&) -> std::optional<Answer> {
            return head.target == "/next"
                       ? std::nullopt
                       : std::optional(Answer{401, {{"WWW-Authenticate", "Basic"}}, "no", false, {}});
        };
    }

    /** The next request on a connection is read from where it begins. */
    static void expectGoesOn(RawClient& asking) {
        asking.send(get("/next"));
        EXPECT_EQ(asking.readAnswer().body, "GET /next ");
    }
};

TEST_F(Refusals, WithoutABodyKeepTheConnection) {
    refuseAll();
    RawClient asking = client();
    asking.send(get());
    const auto answer = asking.readAnswer();
    EXPECT_EQ(answer.status, 401U);
    EXPECT_EQ(answer.field("WWW-Authenticate"), "Basic");
    EXPECT_EQ(answer.field("Content-Length"), "2");
    expectGoesOn(asking);
}

TEST_F(Refusals, WithABodyAtHandKeepTheConnection) {
    refuseAll();
    RawClient asking = client();
    asking.send(post("GET /smuggled HTTP/1.1\r\nHost: x\r\n\r\n"));
    EXPECT_EQ(asking.readAnswer().status, 401U);
    expectGoesOn(asking);
}

TEST_F(Refusals, ComeBeforeTheBodyAndTheConnectionGoesOnBehindIt) {
    refuseAll();
    RawClient asking = client();
    asking.send("POST / HTTP/1.1\r\nHost: x\r\nContent-Length: 4\r\n\r\n");
    EXPECT_EQ(asking.readAnswer().status, 401U);
    asking.send("GET ");
    expectGoesOn(asking);
}

TEST_F(Refusals, OfChunksGoOnBehindTheLastOne) {
    refuseAll();
    RawClient asking = client();
    asking.send("POST / HTTP/1.1\r\nHost: x\r\nTransfer-Encoding: chunked\r\n\r\n4\r\nGET");
    EXPECT_EQ(asking.readAnswer().status, 401U);
    asking.send(" \r\n0\r\nX: y\r\n\r\n");
    expectGoesOn(asking);
}

TEST_F(Refusals, OfABodyAtTheLimitOfWhatIsDrainedKeepTheConnection) {
    refuseAll();
    limits.drained = 1000;
    RawClient asking = client();
    asking.send(post(std::string(1000, 'b')));
    const auto answer = asking.readAnswer();
    EXPECT_EQ(answer.status, 401U);
    EXPECT_EQ(answer.field("Connection"), "");
    expectGoesOn(asking);
}

TEST_F(Refusals, OfALongerBodyCloseAfterTheAnswer) {
    refuseAll();
    limits.drained = 1000;
    RawClient asking = client();
    asking.send(post(std::string(1001, 'b')));
    const auto answer = asking.readAnswer();
    EXPECT_EQ(answer.status, 401U);
    EXPECT_EQ(answer.field("Connection"), "close");
    EXPECT_EQ(asking.readToEnd(), "");
    EXPECT_FALSE(asking.wasReset());
}

TEST_F(Refusals, OfMoreChunksThanAreDrainedCloseAfterTheAnswer) {
    refuseAll();
    limits.drained = 1000;
    RawClient asking = client();
    asking.send("POST / HTTP/1.1\r\nHost: x\r\nTransfer-Encoding: chunked\r\n\r\n3e9\r\n" + std::string(1001, 'b'));
    EXPECT_EQ(asking.readAnswer().status, 401U);
    EXPECT_EQ(asking.readToEnd(), "");
}

TEST_F(Refusals, AreSeenByAClientThatGoesOnSending) {
    refuseAll();
    RawClient asking = clientOf(0);
    const std::string body(3 << 20, 'b');
    EXPECT_TRUE(asking.send("POST / HTTP/1.1\r\nHost: x\r\nContent-Length: 3145728\r\n\r\n" + body));
    EXPECT_EQ(asking.readAnswer().status, 401U);
    asking.shutDown();
    EXPECT_EQ(asking.readToEnd(), "");
    EXPECT_FALSE(asking.wasReset());
}

TEST_F(Refusals, MayBeHeldBackWithoutAWorker) {
    limits.workers = 1;
    handler.onAdmit = [](const RequestHead& head, const Peer&, std::any&) -> std::optional<Answer> {
        return head.target == "/next" ? std::nullopt : std::optional(Answer{401, {}, "no", false, milliseconds(300)});
    };
    RawClient guessing = client();
    RawClient knowing = client();
    const auto start = std::chrono::steady_clock::now();
    guessing.send(get());
    expectGoesOn(knowing);
    EXPECT_LT(std::chrono::steady_clock::now() - start, milliseconds(250));
    EXPECT_EQ(guessing.readAnswer().status, 401U);
    EXPECT_GE(std::chrono::steady_clock::now() - start, milliseconds(300));
    expectGoesOn(guessing);
}

TEST_F(Refusals, LeaveWhatWasAdmittedToTheHandler) {
    handler.onAdmit = [](const RequestHead&, const Peer&, std::any& admission) -> std::optional<Answer> {
        admission = std::string("somebody");
        return std::nullopt;
    };
    handler.onHandle = [](Request&& request, Responder& responder) {
        responder.send({200, {}, std::any_cast<std::string>(request.admission), false, {}});
    };
    RawClient asking = client();
    asking.send(post("abc"));
    EXPECT_EQ(asking.readAnswer().body, "somebody");
}

TEST_F(Refusals, OfBodiesWithoutALengthSayThatItIsMissing) {
    for (const std::string method : {"POST", "M-POST"}) {
        RawClient asking = client();
        asking.send(method + " / HTTP/1.1\r\nHost: x\r\n\r\n");
        EXPECT_EQ(asking.readAnswer().status, 411U);
        expectGoesOn(asking);
    }
}

class Expectations : public Refusals {};

TEST_F(Expectations, AreMetOnceTheHeadHasBeenAdmitted) {
    RawClient asking = client();
    asking.send("POST / HTTP/1.1\r\nHost: x\r\nExpect: 100-Continue\r\nContent-Length: 3\r\n\r\n");
    EXPECT_EQ(asking.readAnswer().status, 100U);
    asking.send("abc");
    EXPECT_EQ(asking.readAnswer().body, "POST / abc");
    expectGoesOn(asking);
}

TEST_F(Expectations, AreNotMetWhenTheHeadIsRefused) {
    refuseAll();
    RawClient asking = client();
    asking.send("POST / HTTP/1.1\r\nHost: x\r\nExpect: 100-continue\r\nContent-Length: 3\r\n\r\n");
    const auto answer = asking.readAnswer();
    EXPECT_EQ(answer.status, 401U);
    EXPECT_EQ(answer.field("Connection"), "close") << "whether a body follows is the client's choice";
    EXPECT_EQ(asking.readToEnd(), "");
}

TEST_F(Expectations, ThatCameWithTheBodyNeedNoWord) {
    RawClient asking = client();
    asking.send(post("abc", "Expect: 100-continue\r\n"));
    EXPECT_EQ(asking.readAnswer().status, 200U);
}

TEST_F(Expectations, OfOneDotZeroAreIgnored) {
    RawClient asking = client();
    asking.send("POST / HTTP/1.0\r\nExpect: 100-continue\r\nContent-Length: 3\r\n\r\n");
    EXPECT_EQ(asking.readSome(milliseconds(100)), "");
    asking.send("abc");
    EXPECT_EQ(asking.readAnswer().body, "POST / abc");
}

TEST_F(Expectations, ThatNobodyKnowsFail) {
    RawClient asking = client();
    asking.send(post("abc", "Expect: 200-ok\r\n"));
    EXPECT_EQ(asking.readAnswer().status, 417U);
    expectGoesOn(asking);
}

TEST_F(Expectations, AreNotMetForABodyThatIsTooLong) {
    limits.bodyBytes = 10;
    RawClient asking = client();
    asking.send("POST / HTTP/1.1\r\nHost: x\r\nExpect: 100-continue\r\nContent-Length: 11\r\n\r\n");
    EXPECT_EQ(asking.readAnswer().status, 413U);
    EXPECT_EQ(asking.readToEnd(), "");
}

} // namespace
