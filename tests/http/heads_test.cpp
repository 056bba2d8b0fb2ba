#include "tests/http/ServerFixture.h"

#include <string>
#include <vector>

namespace {

using namespace marlo::http;

/** Bytes that begin a request, and what a server says to them. */
struct Head {
    const char* what;
    std::string bytes;
    unsigned status;
};

void PrintTo(const Head& head, std::ostream* stream) {
    *stream << head.what;
}

class Heads : public ServerFixture, public testing::WithParamInterface<Head> {};

class GoodHeads : public Heads {};

class BadHeads : public Heads {};

TEST_P(GoodHeads, AreAnsweredAndTheConnectionKept) {
    RawClient asking = client();
    asking.send(GetParam().bytes);
    EXPECT_EQ(asking.readAnswer(GetParam().bytes.starts_with("HEAD")).status, GetParam().status);
    asking.send(get("/next"));
    EXPECT_EQ(asking.readAnswer().body, "GET /next ");
}

TEST_P(GoodHeads, MayComeByteByByte) {
    RawClient asking = client();
    for (const char byte : GetParam().bytes) {
        asking.send(std::string(1, byte));
    }
    EXPECT_EQ(asking.readAnswer(GetParam().bytes.starts_with("HEAD")).status, GetParam().status);
}

TEST_P(BadHeads, AreRefusedWithALengthAndNothingBehindThemIsRead) {
    std::atomic<int> handled{0};
    handler.onHandle = [&handled](Request&&, Responder& responder) {
        ++handled;
        responder.send({});
    };
    RawClient asking = client();
    asking.send(GetParam().bytes + get("/smuggled"));
    const auto answer = asking.readAnswer();
    EXPECT_EQ(answer.status, GetParam().status) << answer.body;
    EXPECT_EQ(answer.field("Content-Length"), std::to_string(answer.body.size()));
    EXPECT_FALSE(answer.body.empty());
    EXPECT_EQ(answer.field("Connection"), "close");
    EXPECT_EQ(asking.readToEnd(), "");
    endServer();
    EXPECT_EQ(handled, 0);
}

const std::string host = "Host: x\r\n";

std::string head(const std::string& fields, const std::string& method = "POST") {
    return method + " / HTTP/1.1\r\n" + host + fields + "\r\n";
}

INSTANTIATE_TEST_SUITE_P(
    , GoodHeads,
    testing::Values(Head{"nothing but what is needed", head("", "GET"), 200},
                    Head{"any method", head("Content-Length: 0\r\n", "M-POST"), 200},
                    Head{"a method nobody knows", head("", "F.O!#$%&'*+-^_`|~"), 200},
                    Head{"OPTIONS *", "OPTIONS * HTTP/1.1\r\n" + host + "\r\n", 200},
                    Head{"a whole address", "GET http://x/a HTTP/1.1\r\n" + host + "\r\n", 200},
                    Head{"HEAD", head("", "HEAD"), 200},
                    Head{"empty lines in front", "\r\n\r\n" + head("", "GET"), 200},
                    Head{"a field without a value", head("X:\r\n", "GET"), 200},
                    Head{"spaces and tabs around a value", head("X: \t y\t \r\n", "GET"), 200},
                    Head{"an empty host", "GET / HTTP/1.1\r\nHost:\r\n\r\n", 200},
                    Head{"a length", head("Content-Length: 3\r\n") + "abc", 200},
                    Head{"names of fields in any case", head("cONTENT-lENGTH: 3\r\n") + "abc", 200},
                    Head{"chunks", head("Transfer-Encoding: chunked\r\n") + "3\r\nabc\r\n0\r\n\r\n", 200},
                    Head{"chunks of any case",
                         head("transfer-encoding: CHUNKED\r\n") + "a\r\n0123456789\r\n0\r\n\r\n", 200},
                    Head{"chunks with extensions",
                         head("Transfer-Encoding: chunked\r\n") + "3;a=b;c=\"d;e\"\r\nabc\r\n0;z\r\n\r\n", 200},
                    Head{"chunks with trailers",
                         head("Transfer-Encoding: chunked\r\n") + "3\r\nabc\r\n0\r\nX: y\r\nZ: z\r\n\r\n", 200},
                    Head{"no chunk but the last", head("Transfer-Encoding: chunked\r\n") + "0\r\n\r\n", 200},
                    Head{"bytes above ASCII in a value", head("X: \xc3\xa4\r\n", "GET"), 200}));

INSTANTIATE_TEST_SUITE_P(
    , BadHeads,
    testing::Values(
        Head{"no method", " / HTTP/1.1\r\n" + host + "\r\n", 400},
        Head{"TLS", std::string("\x16\x03\x01\x02\x00", 5), 400},
        Head{"no target", "GET HTTP/1.1\r\n" + host + "\r\n", 400},
        Head{"two spaces", "GET  / HTTP/1.1\r\n" + host + "\r\n", 400},
        Head{"a space in the target", "GET /a b HTTP/1.1\r\n" + host + "\r\n", 505},
        Head{"a control character in the target", "GET /a\x01 HTTP/1.1\r\n" + host + "\r\n", 400},
        Head{"no version", "GET /\r\n" + host + "\r\n", 400}, Head{"HTTP/2", "PRI * HTTP/2.0\r\n\r\n", 505},
        Head{"HTTP/0.9", "GET / HTTP/0.9\r\n\r\n", 505}, Head{"another protocol", "GET / HTCPCP/1.0\r\n\r\n", 505},
        Head{"no host", "GET / HTTP/1.1\r\n\r\n", 400},
        Head{"two hosts", "GET / HTTP/1.1\r\n" + host + host + "\r\n", 400},
        Head{"two hosts in HTTP/1.0", "GET / HTTP/1.0\r\n" + host + host + "\r\n", 400},
        Head{"a bare LF behind the first line", "GET / HTTP/1.1\n" + host + "\r\n", 400},
        Head{"a bare LF behind a field", "GET / HTTP/1.1\r\nHost: x\nX: y\r\n\r\n", 400},
        Head{"a bare LF at the end", "GET / HTTP/1.1\r\nHost: x\r\n\n", 400},
        Head{"a bare CR within a value", "GET / HTTP/1.1\r\nHost: x\rX: y\r\n\r\n", 400},
        Head{"a NUL within a value", "GET / HTTP/1.1\r\nHost: x" + std::string(1, '\0') + "\r\n\r\n", 400},
        Head{"a field that goes on in the next line", head("X: y\r\n z\r\n", "GET"), 400},
        Head{"a field that goes on behind a tab", head("X: y\r\n\tz\r\n", "GET"), 400},
        Head{"a space in front of the first field", "GET / HTTP/1.1\r\n Host: x\r\n\r\n", 400},
        Head{"a space in front of the colon", head("Content-Length : 3\r\n") + "abc", 400},
        Head{"a field without a name", head(": y\r\n", "GET"), 400},
        Head{"a field without a colon", head("X\r\n", "GET"), 400},
        Head{"a length that is none", head("Content-Length: x\r\n"), 400},
        Head{"an empty length", head("Content-Length:\r\n"), 400},
        Head{"a negative length", head("Content-Length: -1\r\n"), 400},
        Head{"a length with a plus", head("Content-Length: +3\r\n"), 400},
        Head{"a hexadecimal length", head("Content-Length: 0x3\r\n"), 400},
        Head{"a length beyond 64 bits", head("Content-Length: 18446744073709551616\r\n"), 400},
        Head{"two lengths", head("Content-Length: 3\r\nContent-Length: 4\r\n") + "abc", 400},
        Head{"the same length twice", head("Content-Length: 3\r\nContent-Length: 3\r\n") + "abc", 400},
        Head{"a list of lengths", head("Content-Length: 3, 3\r\n") + "abc", 400},
        Head{"a length and chunks",
             head("Content-Length: 3\r\nTransfer-Encoding: chunked\r\n") + "3\r\nabc\r\n0\r\n\r\n", 400},
        Head{"chunks and a length",
             head("Transfer-Encoding: chunked\r\nContent-Length: 3\r\n") + "3\r\nabc\r\n0\r\n\r\n", 400},
        Head{"chunks twice", head("Transfer-Encoding: chunked\r\nTransfer-Encoding: chunked\r\n"), 400},
        Head{"chunks in chunks", head("Transfer-Encoding: chunked, chunked\r\n"), 501},
        Head{"another coding", head("Transfer-Encoding: gzip, chunked\r\n"), 501},
        Head{"a coding behind the chunks", head("Transfer-Encoding: chunked, gzip\r\n"), 501},
        Head{"no coding at all", head("Transfer-Encoding: identity\r\n"), 501},
        Head{"an empty coding", head("Transfer-Encoding:\r\n"), 501},
        Head{"a quoted coding", head("Transfer-Encoding: \"chunked\"\r\n"), 501},
        Head{"chunks in HTTP/1.0", "POST / HTTP/1.0\r\nTransfer-Encoding: chunked\r\n\r\n0\r\n\r\n", 400},
        Head{"a chunk without a size", head("Transfer-Encoding: chunked\r\n") + "\r\nabc\r\n0\r\n\r\n", 400},
        Head{"a chunk with a sign", head("Transfer-Encoding: chunked\r\n") + "+3\r\nabc\r\n0\r\n\r\n", 400},
        Head{"a chunk of 0x3", head("Transfer-Encoding: chunked\r\n") + "0x3\r\nabc\r\n0\r\n\r\n", 400},
        Head{"a chunk that is longer than its size", head("Transfer-Encoding: chunked\r\n") + "2\r\nabc\r\n0\r\n\r\n",
             400},
        Head{"a chunk of more than 64 bits",
             head("Transfer-Encoding: chunked\r\n") + "10000000000000000\r\nabc\r\n0\r\n\r\n", 400},
        Head{"a chunk with a bare LF", head("Transfer-Encoding: chunked\r\n") + "3\nabc\r\n0\r\n\r\n", 400},
        Head{"a bare LF in an extension", head("Transfer-Encoding: chunked\r\n") + "3;a=\"\nb\"\r\nabc\r\n0\r\n\r\n",
             400},
        Head{"a length among the trailers",
             head("Transfer-Encoding: chunked\r\n") + "3\r\nabc\r\n0\r\nContent-Length: 3\r\n\r\n", 400},
        Head{"an unknown version of a chunk's end", head("Transfer-Encoding: chunked\r\n") + "3\r\nabcXX0\r\n\r\n",
             400}));

class Versions : public ServerFixture {};

TEST_F(Versions, OneDotOneIsKeptUntilSomebodyCloses) {
    RawClient asking = client();
    asking.send("GET / HTTP/1.1\r\nHost: x\r\nConnection: foo, Close\r\n\r\n");
    const auto answer = asking.readAnswer();
    EXPECT_EQ(answer.status, 200U);
    EXPECT_EQ(answer.field("Connection"), "close");
    EXPECT_TRUE(asking.isEndedWithin(std::chrono::seconds(10)));
}

TEST_F(Versions, OneDotZeroIsClosed) {
    RawClient asking = client();
    asking.send("GET / HTTP/1.0\r\n\r\n");
    const auto answer = asking.readAnswer();
    EXPECT_EQ(answer.status, 200U);
    EXPECT_EQ(answer.field("Connection"), "close");
    EXPECT_TRUE(asking.isEndedWithin(std::chrono::seconds(10)));
}

TEST_F(Versions, OneDotZeroIsKeptWhereTheClientAsksForIt) {
    RawClient asking = client();
    for (int count = 0; count < 2; ++count) {
        asking.send("GET / HTTP/1.0\r\nConnection: Keep-Alive\r\n\r\n");
        const auto answer = asking.readAnswer();
        EXPECT_EQ(answer.status, 200U);
        EXPECT_EQ(answer.field("Connection"), "keep-alive");
    }
}

TEST_F(Versions, AnAnswerMayCloseWhateverTheClientWants) {
    handler.onHandle = [](Request&&, Responder& responder) { responder.send({200, {}, "last", true, {}}); };
    RawClient asking = client();
    asking.send(get() + get());
    EXPECT_EQ(asking.readAnswer().field("Connection"), "close");
    EXPECT_EQ(asking.readToEnd(), "");
}

TEST_F(Versions, TheHandlerSeesWhatCame) {
    std::optional<Request> seen;
    handler.onHandle = [&seen](Request&& request, Responder& responder) {
        seen = std::move(request);
        responder.send({});
    };
    RawClient asking = client();
    asking.send("M-POST /cimom?a HTTP/1.1\r\nHost: x\r\nX-One: 1\r\nx-one: 2 \r\n"
                "Transfer-Encoding: chunked\r\n\r\n4\r\n1234\r\n2;x\r\n56\r\n0\r\nAuthorization: late\r\n\r\n");
    ASSERT_EQ(asking.readAnswer().status, 200U);
    endServer();
    EXPECT_EQ(seen->head.method, "M-POST");
    EXPECT_EQ(seen->head.target, "/cimom?a");
    EXPECT_EQ(seen->head.version, 11U);
    EXPECT_EQ(seen->head.values("X-ONE"), (std::vector<std::string_view>{"1", "2"}));
    EXPECT_EQ(seen->head.value("x-one"), "1");
    EXPECT_EQ(seen->head.value("Authorization"), std::nullopt) << "trailers are not of the head";
    EXPECT_EQ(seen->body, "123456");
    EXPECT_EQ(seen->id, 1U);
    EXPECT_EQ(seen->peer.toString(), "test");
}

} // namespace
