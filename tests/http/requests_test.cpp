#include "tests/http/ServerFixture.h"

#include <string>
#include <vector>

namespace {

using namespace marlo::http;

using Requests = ServerFixture;

TEST_F(Requests, AreAnsweredWithALength) {
    RawClient asking = client();
    asking.send(get("/a?b=c"));
    const auto answer = asking.readAnswer();
    EXPECT_EQ(answer.status, 200U);
    EXPECT_EQ(answer.body, "GET /a?b=c ");
    EXPECT_EQ(answer.field("Content-Length"), "11");
    EXPECT_EQ(answer.field("Connection"), "");
    EXPECT_EQ(answer.field("Date").size(), 29U);
}

TEST_F(Requests, ComeOneAfterTheOther) {
    RawClient asking = client();
    for (int count = 0; count < 100; ++count) {
        asking.send(get("/" + std::to_string(count)));
        ASSERT_EQ(asking.readAnswer().body, "GET /" + std::to_string(count) + " ");
    }
}

TEST_F(Requests, ThatArePipelinedAreAnsweredInTheirOrder) {
    RawClient asking = client();
    std::string all;
    for (int count = 0; count < 1000; ++count) {
        const std::string body(static_cast<std::size_t>(count % 7), 'b');
        all += "POST /" + std::to_string(count) +
               " HTTP/1.1\r\nHost: x\r\nContent-Length: " + std::to_string(body.size()) + "\r\n\r\n" + body;
    }
    ASSERT_TRUE(asking.send(all));
    for (int count = 0; count < 1000; ++count) {
        const std::string body(static_cast<std::size_t>(count % 7), 'b');
        ASSERT_EQ(asking.readAnswer().body, "POST /" + std::to_string(count) + " " + body);
    }
}

TEST_F(Requests, ThatTakeTheirTimeDoNotHoldUpOthers) {
    Gate gate;
    handler.onHandle = [&gate](Request&& request, Responder& responder) {
        if (request.head.target == "/slow") {
            gate.pass();
        }
        responder.send({200, {}, request.head.target, false, {}});
    };
    std::vector<RawClient> slow;
    for (int count = 0; count < 15; ++count) { // one less than there are workers
        slow.push_back(client());
        slow.back().send(get("/slow"));
    }
    ASSERT_TRUE(gate.awaitWaiting(15));
    for (int count = 0; count < 20; ++count) {
        RawClient quick = client();
        quick.send(get("/quick"));
        EXPECT_EQ(quick.readAnswer().body, "/quick");
    }
    gate.open();
    for (RawClient& each : slow) {
        EXPECT_EQ(each.readAnswer().body, "/slow");
    }
}

} // namespace
