#include "tests/http/ServerFixture.h"

#include <filesystem>
#include <string>
#include <vector>

#include <fcntl.h>
#include <sys/resource.h>
#include <unistd.h>

namespace {

using namespace marlo::http;
using std::chrono::milliseconds;

/** Clients that go at the wrong time. */
class Vanishing : public ServerFixture {
  protected:
    void expectNobodyLeft() {
        EXPECT_TRUE(comesTrue([this] { return server().counters().connections == 0; }));
        RawClient next = clientOf(0);
        next.send(get());
        EXPECT_EQ(next.readAnswer().status, 200U);
    }
};

TEST_F(Vanishing, BeforeARequest) {
    clientOf(0).vanish();
    expectNobodyLeft();
}

TEST_F(Vanishing, WithinAHead) {
    RawClient asking = clientOf(0);
    asking.send("GET / HT");
    EXPECT_TRUE(comesTrue([this] { return server().counters().connections == 1; }));
    asking.vanish();
    expectNobodyLeft();
}

TEST_F(Vanishing, WithinABody) {
    std::atomic<int> handled{0};
    handler.onHandle = [&handled](Request&& request, Responder& responder) {
        handled += request.body.empty() ? 0 : 1;
        responder.send({});
    };
    RawClient asking = clientOf(0);
    asking.send("POST / HTTP/1.1\r\nHost: x\r\nContent-Length: 10\r\n\r\nabc");
    EXPECT_TRUE(comesTrue([this] { return server().counters().requests == 1; }));
    asking.vanish();
    expectNobodyLeft();
    EXPECT_EQ(handled, 0) << "half a body is no request";
}

TEST_F(Vanishing, WhileTheRequestIsHandled) {
    Gate gate;
    std::atomic<bool> isGone{false};
    handler.onHandle = [&](Request&& request, Responder& responder) {
        if (request.head.target == "/slow") {
            gate.pass();
        }
        try {
            responder.send({});
        } catch (const ClientGone&) {
            isGone = true;
            throw;
        }
    };
    RawClient asking = clientOf(0);
    asking.send(get("/slow"));
    ASSERT_TRUE(gate.awaitWaiting(1));
    asking.vanish();
    gate.open();
    expectNobodyLeft();
    EXPECT_TRUE(isGone);
}

TEST_F(Vanishing, WithinAnAnswer) {
    std::atomic<bool> isGone{false};
    handler.onHandle = [&isGone](Request&& request, Responder& responder) {
        responder.begin(200, {});
        try {
            for (int count = 0; request.head.target == "/long" && count < 1000000; ++count) {
                responder.write(std::string(65536, 'b'));
            }
        } catch (const ClientGone&) {
            isGone = true;
            throw;
        }
        responder.finish();
    };
    RawClient asking = clientOf(0);
    asking.send(get("/long"));
    EXPECT_NE(asking.readSome(milliseconds(20000)), "");
    asking.vanish();
    expectNobodyLeft();
    EXPECT_TRUE(isGone);
}

TEST_F(Vanishing, WithinAWholeAnswer) {
    handler.onHandle = [](Request&& request, Responder& responder) {
        responder.send({200, {}, request.head.target == "/long" ? std::string(32 << 20, 'b') : "", false, {}});
    };
    RawClient asking = clientOf(0);
    asking.send(get("/long"));
    EXPECT_NE(asking.readSome(milliseconds(20000)), "");
    asking.vanish();
    expectNobodyLeft();
}

TEST_F(Vanishing, AfterTheLastRequestGetsItsAnswer) {
    RawClient asking = clientOf(0);
    asking.send(get());
    asking.shutDown();
    EXPECT_EQ(asking.readAnswer().status, 200U);
    EXPECT_TRUE(asking.isEndedWithin(milliseconds(10000)));
}

/** A server that ends. */
class Stopping : public ServerFixture {
  protected:
    Gate gate;

    void answerBehindTheGate() {
        handler.onHandle = [this](Request&&, Responder& responder) {
            gate.pass();
            responder.send({200, {}, "done", false, {}});
        };
    }
};

TEST_F(Stopping, EndsIdleConnectionsAtOnce) {
    RawClient asking = client();
    RawClient silent = clientOf(0);
    asking.send(get());
    EXPECT_EQ(asking.readAnswer().status, 200U);
    const auto start = std::chrono::steady_clock::now();
    server().stop(milliseconds(20000));
    EXPECT_LT(std::chrono::steady_clock::now() - start, milliseconds(10000));
    EXPECT_TRUE(asking.isEndedWithin(milliseconds(0)));
    EXPECT_TRUE(silent.isEndedWithin(milliseconds(0)));
    EXPECT_EQ(clientOf(0).descriptor(), -1) << "nobody listens any more";
}

TEST_F(Stopping, WaitsForTheAnswersThatAreUnderWay) {
    answerBehindTheGate();
    RawClient asking = client();
    RawClient other = clientOf(0);
    asking.send(get() + get());
    other.send(get());
    ASSERT_TRUE(gate.awaitWaiting(2));
    std::thread stopping([this] { server().stop(milliseconds(20000)); });
    EXPECT_TRUE(comesTrue([this] { return clientOf(0).descriptor() == -1; }));
    gate.open();
    const auto answer = asking.readAnswer();
    EXPECT_EQ(answer.body, "done");
    EXPECT_EQ(asking.readToEnd(), "") << "no request begins after that";
    EXPECT_EQ(other.readAnswer().body, "done");
    asking.close();
    other.close();
    stopping.join();
}

TEST_F(Stopping, CutsWhatTakesLongerThanItsPatience) {
    std::atomic<bool> isGone{false};
    handler.onHandle = [this, &isGone](Request&&, Responder& responder) {
        gate.pass();
        try {
            responder.send({});
        } catch (const ClientGone&) {
            isGone = true;
            throw;
        }
    };
    RawClient asking = clientOf(0);
    asking.send(get());
    ASSERT_TRUE(gate.awaitWaiting(1));
    std::thread stopping([this] { server().stop(milliseconds(50)); });
    EXPECT_EQ(asking.readAnswer().status, 0U) << "the connection has ended, though the handler has not";
    gate.open();
    stopping.join();
    EXPECT_TRUE(isGone);
}

TEST_F(Stopping, CutsAnswersThatNobodyTakes) {
    std::atomic<bool> isGone{false};
    handler.onHandle = [&isGone](Request&&, Responder& responder) {
        responder.begin(200, {});
        try {
            while (true) {
                responder.write(std::string(65536, 'b'));
            }
        } catch (const ClientGone&) {
            isGone = true;
            throw;
        }
    };
    RawClient asking = clientOf(0);
    asking.send(get());
    EXPECT_NE(asking.readSome(milliseconds(20000)), "");
    server().stop(milliseconds(50));
    EXPECT_TRUE(isGone);
}

TEST_F(Stopping, TakesNoConnectionThatItIsHandedLater) {
    server().stop(milliseconds(0));
    RawClient late = client();
    endServer();
    EXPECT_TRUE(late.isEndedWithin(milliseconds(10000)));
}

class Descriptors : public ServerFixture {};

TEST_F(Descriptors, ThatRanOutPauseAcceptingUntilThereAreSomeAgain) {
    server();
    RawClient before = clientOf(0);
    before.send(get());
    EXPECT_EQ(before.readAnswer().status, 200U);

    rlimit former{};
    ::getrlimit(RLIMIT_NOFILE, &former);
    rlimit low = former;
    low.rlim_cur = 128;
    ::setrlimit(RLIMIT_NOFILE, &low);
    std::vector<Descriptor> taken;
    while (true) {
        Descriptor next(::open("/dev/null", O_RDONLY | O_CLOEXEC));
        if (next.get() < 0) {
            break;
        }
        taken.push_back(std::move(next));
    }
    taken.pop_back(); // for the client: none is left for the server
    RawClient waiting = clientOf(0);
    ASSERT_GE(waiting.descriptor(), 0);
    waiting.send(get());
    EXPECT_TRUE(comesTrue([this] { return lines.count("no connections are accepted") == 1; }));
    EXPECT_EQ(waiting.readSome(milliseconds(300)), "");
    before.send(get());
    EXPECT_EQ(before.readAnswer().status, 200U) << "those that are open go on";

    taken.clear();
    ::setrlimit(RLIMIT_NOFILE, &former);
    EXPECT_EQ(waiting.readAnswer().status, 200U);
    EXPECT_EQ(lines.count("no connections are accepted"), 1U);
    EXPECT_EQ(lines.count("again"), 1U);
}

TEST_F(Descriptors, AreAllGivenBack) {
    const auto open = [] {
        return std::distance(std::filesystem::directory_iterator("/proc/self/fd"),
                             std::filesystem::directory_iterator());
    };
    server();
    const auto before = open();
    for (int count = 0; count < 50; ++count) {
        RawClient asking = clientOf(0);
        asking.send(count % 2 == 0 ? get() : "nonsense\n");
        asking.readAnswer();
    }
    EXPECT_TRUE(comesTrue([&] { return open() == before; }));
    endServer();
    EXPECT_LT(open(), before);
}

TEST(Crowds, OfTwoHundredConnectionsAreAllServed) {
    ScriptedHandler handler;
    Lines lines;
    handler.onHandle = [](Request&& request, Responder& responder) {
        if (request.head.target == "/slow") {
            std::this_thread::sleep_for(milliseconds(3));
        }
        responder.begin(200, {});
        responder.write(request.body);
        responder.finish();
    };
    Server server(handler, {Endpoint()}, std::nullopt, {}, lines.sink());
    const Endpoint endpoint = server.endpoints().front();
    std::atomic<int> good{0};
    std::vector<std::thread> threads;
    for (int thread = 0; thread < 20; ++thread) {
        threads.emplace_back([&endpoint, &good, thread] {
            std::vector<RawClient> clients;
            for (int count = 0; count < 10; ++count) {
                clients.push_back(RawClient::connectTo(endpoint));
            }
            for (int round = 0; round < 20; ++round) {
                for (std::size_t index = 0; index < clients.size(); ++index) {
                    const std::string body(static_cast<std::size_t>(round) * 1000 + index, 'b');
                    clients[index].send("POST " + std::string(thread % 4 == 0 ? "/slow" : "/quick") +
                                        " HTTP/1.1\r\nHost: x\r\nContent-Length: " + std::to_string(body.size()) +
                                        "\r\n\r\n" + body);
                }
                for (std::size_t index = 0; index < clients.size(); ++index) {
                    const std::string body(static_cast<std::size_t>(round) * 1000 + index, 'b');
                    good += clients[index].readAnswer().body == body ? 1 : 0;
                }
            }
        });
    }
    for (std::thread& thread : threads) {
        thread.join();
    }
    EXPECT_EQ(good, 20 * 10 * 20);
    EXPECT_EQ(server.counters().requests, 4000U);
    EXPECT_EQ(server.counters().accepted, 200U);
    EXPECT_TRUE(lines.all().empty());
}

} // namespace
