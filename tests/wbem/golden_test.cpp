/** @file Every request of golden/ gets the answer beside it, over a stream at hand and over TCP. */
#include "tests/wbem/Golden.h"
#include "tests/wbem/Host.h"

#include <array>
#include <cstdlib>
#include <stdexcept>

#include <arpa/inet.h>
#include <gtest/gtest.h>
#include <netinet/in.h>
#include <sys/socket.h>
#include <unistd.h>

namespace marlo::test {
namespace {

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

std::string exchangeOverStream(Host& host, const std::string& requests) {
    http::Server server(host.service(), {}, std::nullopt, {}, [](const std::string& /*line*/) {});
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

TEST(GoldenPairs, AreAtLeastAHundredAndFifty) {
    EXPECT_GE(goldenNames().size(), 150U);
    for (const std::string& name : goldenNames()) {
        EXPECT_TRUE(readGolden(name + ".response").starts_with("HTTP/1.1 ")) << name;
    }
}

} // namespace
} // namespace marlo::test
