/** @file Every request of golden/ gets the answer beside it, over a stream at hand and over TCP. */
#include "tests/wbem/Golden.h"
#include "tests/wbem/Host.h"

#include <array>
#include <cstdlib>
#include <stdexcept>

#include <arpa/inet.h>
#include <gmock/gmock.h>
#include <gtest/gtest.h>
#include <netinet/in.h>
#include <sys/socket.h>
#include <unistd.h>

namespace marlo::test {
namespace {

using testing::EndsWith;
using testing::HasSubstr;
using testing::Not;
using testing::StartsWith;

constexpr const char* recordVariable = "MARLO_RECORD_GOLDEN";

/** Closed at the end. */
class Socket {
  public:
    explicit Socket(int descriptor) : _descriptor(descriptor) {
        if (descriptor < 0) {
            throw std::runtime_error("no socket");
        }
    }

    ~Socket() { close(_descriptor); }

    Socket(const Socket&) = delete;
    Socket& operator=(const Socket&) = delete;

    [[nodiscard]] int get() const { return _descriptor; }

  private:
    int _descriptor;
};

std::string exchangeOverStream(Host& host, const std::string& requests, const http::Limits& limits = {}) {
    http::Server server(host.service(), {}, std::nullopt, limits, [](const std::string& /*line*/) {});
    std::array<int, 2> ends{};
    if (socketpair(AF_UNIX, SOCK_STREAM | SOCK_CLOEXEC, 0, ends.data()) != 0) {
        throw std::runtime_error("no socket pair");
    }
    const Socket client(ends[0]);
    server.serve(ends[1], {http::Transport::tcp, "127.0.0.1", 40000, std::nullopt, std::nullopt});
    return exchange(client.get(), requests);
}

std::string exchangeOverTcp(Host& host, const std::string& requests) {
    http::Server server(host.service(), {{}}, std::nullopt, {}, [](const std::string& /*line*/) {});
    const Socket client(socket(AF_INET, SOCK_STREAM | SOCK_CLOEXEC, 0));
    sockaddr_in address{};
    address.sin_family = AF_INET;
    address.sin_port = htons(server.endpoints().at(0).port);
    address.sin_addr.s_addr = htonl(INADDR_LOOPBACK);
    if (connect(client.get(), reinterpret_cast<const sockaddr*>(&address), sizeof address) != 0) {
        throw std::runtime_error("cannot connect");
    }
    return exchange(client.get(), requests);
}

class Golden : public testing::TestWithParam<std::string> {
  protected:
    Host host;
};

TEST_P(Golden, OverStream) {
    const std::string answer = exchangeOverStream(host, readGolden(GetParam() + ".request"));
    if (std::getenv(recordVariable) != nullptr) {
        ASSERT_EQ(std::getenv("CI"), nullptr) << "answers are recorded by whoever reads them";
        writeGolden(GetParam() + ".response", answer);
        GTEST_SKIP() << "recorded, not compared";
    }
    EXPECT_EQ(answer, readGolden(GetParam() + ".response"));
}

TEST_P(Golden, OverTcp) {
    EXPECT_EQ(exchangeOverTcp(host, readGolden(GetParam() + ".request")), readGolden(GetParam() + ".response"));
}

INSTANTIATE_TEST_SUITE_P(Pairs, Golden, testing::ValuesIn(goldenNames()),
                         [](const testing::TestParamInfo<std::string>& pair) { return pair.param; });

/** A request for a class whose provider fails after a hundred instances, by a client that takes trailers or not. */
std::string askForTheBrokenOff(const std::string& fields) {
    Host host;
    host.items().streamLength = 101;
    host.items().streamFailsAt = 101;
    http::Limits limits;
    limits.gathered = 1000; // so that the answer is on its way when it breaks off
    const std::string body =
        "<CIM CIMVERSION=\"2.0\" DTDVERSION=\"2.0\"><MESSAGE ID=\"1\" "
        "PROTOCOLVERSION=\"1.0\"><SIMPLEREQ><IMETHODCALL "
        "NAME=\"EnumerateInstances\"><LOCALNAMESPACEPATH><NAMESPACE NAME=\"root\"/><NAMESPACE NAME=\"test\"/>"
        "</LOCALNAMESPACEPATH><IPARAMVALUE NAME=\"ClassName\"><CLASSNAME NAME=\"TEST_Stream\"/></IPARAMVALUE>"
        "</IMETHODCALL></SIMPLEREQ></MESSAGE></CIM>";
    return exchangeOverStream(
        host,
        "POST /cimom HTTP/1.1\r\nHost: h\r\nAuthorization: " + Host::credentials(Host::everything) +
            "\r\nCIMOperation: MethodCall\r\nCIMMethod: EnumerateInstances\r\nCIMObject: "
            "root/test\r\n" +
            fields + "Content-Length: " + std::to_string(body.size()) + "\r\n\r\n" + body,
        limits);
}

TEST(BrokenOff, EndsWithTheErrorForWhomTakesTrailers) {
    const std::string answer = askForTheBrokenOff("TE: trailers\r\nConnection: TE\r\n");
    EXPECT_THAT(answer, HasSubstr("\r\nTransfer-Encoding: chunked\r\n"));
    EXPECT_THAT(answer, HasSubstr("\r\nTrailer: CIMStatusCode, CIMStatusCodeDescription\r\n"));
    EXPECT_THAT(answer,
                EndsWith("\r\n0\r\nCIMStatusCode: 1\r\nCIMStatusCodeDescription: broke off at 100 %25\r\n\r\n"));
}

TEST(BrokenOff, IsNoWholeAnswerForAllOthers) {
    const std::string answer = askForTheBrokenOff("");
    EXPECT_THAT(answer, StartsWith("HTTP/1.1 200 OK\r\n"));
    EXPECT_THAT(answer, HasSubstr("\r\nTransfer-Encoding: chunked\r\n"));
    EXPECT_THAT(answer, Not(HasSubstr("\r\n0\r\n")));
    EXPECT_THAT(answer, Not(HasSubstr("</CIM>")));
}

TEST(GoldenPairs, AreAtLeastAHundredAndFifty) {
    EXPECT_GE(goldenNames().size(), 150U);
    for (const std::string& name : goldenNames()) {
        EXPECT_TRUE(readGolden(name + ".response").starts_with("HTTP/1.1 ")) << name;
    }
}

} // namespace
} // namespace marlo::test
