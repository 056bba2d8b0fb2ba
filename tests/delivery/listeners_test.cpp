#include "tests/delivery/DeliveryFixture.h"

#include <thread>

namespace marlo::delivery {
namespace {

using namespace std::chrono_literals;
using testing::ElementsAre;
using testing::HasSubstr;
using testing::IsEmpty;

class Listeners : public DeliveryFixture {};

TEST_F(Listeners, AreToldInOrderOverOneConnection) {
    const Listener listener;
    const auto delivery = openFor(listener);
    post(*delivery, 0, 200);
    ASSERT_TRUE(listener.await(200));
    const auto received = listener.received();
    for (std::size_t place = 0; place < received.size(); ++place) {
        EXPECT_EQ(received[place].number, static_cast<std::int64_t>(place));
        EXPECT_EQ(received[place].property("Description"), std::to_string(place));
    }
    EXPECT_EQ(listener.connections(), 1);
    ASSERT_TRUE(eventually([&] { return countersOf(*delivery).sent == 200; }));
    const Counters counters = countersOf(*delivery);
    EXPECT_EQ(counters.queued, 0U);
    EXPECT_EQ(counters.queuedBytes, 0U);
    EXPECT_EQ(counters.retried, 0U);
    EXPECT_EQ(counters.dropped, 0U);
    EXPECT_EQ(counters.sequenceContext, received.front().context);
    EXPECT_EQ(counters.lastError, "");
    EXPECT_GT(counters.latencyMedian, 0us);
    EXPECT_GE(counters.latency99, counters.latencyMedian);
}

TEST_F(Listeners, GetWhatTheStandardAsksFor) {
    const Listener listener;
    const auto delivery = openFor(listener);
    post(*delivery, 0, 1);
    ASSERT_TRUE(listener.await(1));
    const Listener::Received received = listener.received().front();
    EXPECT_THAT(received.head, testing::StartsWith("POST /listen?to=me HTTP/1.1\r\nHost: 127.0.0.1:"));
    EXPECT_THAT(received.head, HasSubstr("\r\nContent-Type: application/xml; charset=\"utf-8\"\r\n"));
    EXPECT_THAT(received.head, HasSubstr("\r\nCIMExport: MethodRequest\r\n"));
    EXPECT_THAT(received.head, HasSubstr("\r\nCIMExportMethod: ExportIndication\r\n"));
    EXPECT_THAT(received.head, testing::Not(HasSubstr("Accept")));
    EXPECT_THAT(received.body, HasSubstr("<SIMPLEEXPREQ><EXPMETHODCALL NAME=\"ExportIndication\">"));
    EXPECT_THAT(received.body, HasSubstr("<PROPERTY NAME=\"SequenceNumber\" TYPE=\"sint64\"><VALUE>0</VALUE>"));
    EXPECT_EQ(received.context.size(), 32U);
}

TEST_F(Listeners, OfSeveralSubscriptionsGetACopyForEach) {
    const Listener listener;
    const auto delivery = openFor(listener);
    delivery->setSubscription({"b", "a", OnFatalError::ignore, {}});
    delivery->wait(delivery->post(std::vector<std::string>{"a", "b", "unknown"}, alert("both")));
    ASSERT_TRUE(listener.await(2));
    EXPECT_THAT(listener.numbers(), ElementsAre(0, 1));
}

/** A reaction for the first requests and another one from then on. */
Listener::React firstThen(int count, Listener::React first, Listener::React then = Listener::accept) {
    auto left = std::make_shared<std::atomic<int>>(count);
    return [=](const Listener::Received& received) { return (*left)-- > 0 ? first(received) : then(received); };
}

Listener::React always(const Listener::Reaction& reaction) {
    return [reaction](const Listener::Received& /*received*/) { return reaction; };
}

struct Misbehaviour {
    std::string name;
    Listener::Reaction reaction;
    std::string error; ///< part of what the counters say
};

class Misbehaving : public Listeners, public testing::WithParamInterface<Misbehaviour> {};

TEST_P(Misbehaving, GetsEverythingInOrderInTheEnd) {
    options.exchangeTime = 300ms;
    options.answerHeadBytes = 2000;
    options.answerBodyBytes = 2000;
    const Listener listener(firstThen(3, always(GetParam().reaction)));
    const auto delivery = openFor(listener);
    post(*delivery, 0, 5);
    ASSERT_TRUE(listener.await(8));
    ASSERT_TRUE(eventually([&] { return countersOf(*delivery).sent == 5; }));
    EXPECT_THAT(listener.numbers(), ElementsAre(0, 0, 0, 0, 1, 2, 3, 4));
    const Counters counters = countersOf(*delivery);
    EXPECT_EQ(counters.retried, 3U);
    EXPECT_THAT(counters.lastError, HasSubstr(GetParam().error));
    EXPECT_TRUE(counters.lastErrorTime.has_value());
    EXPECT_FALSE(counters.failingSince.has_value());
    EXPECT_TRUE(isLogged(GetParam().error));
    EXPECT_TRUE(isLogged("takes indications again"));
}

const std::string good = Listener::accept({}).bytes;

std::vector<Misbehaviour> misbehaviours() {
    const std::string head = "HTTP/1.1 200 OK\r\n";
    return {
        {"Unavailable", Listener::answer(503), "answered HTTP 503"},
        {"NotAcceptable", Listener::answer(406, {}, "CIMError: header-mismatch\r\n"),
         "answered HTTP 406, CIMError \"header-mismatch\""},
        {"OkWithCimError", Listener::answer(200, {}, "CIMError: x\r\n"), "CIMError \"x\""},
        {"FullQueue", Listener::refuse({}), "refused with status 1: \"the queue is full\""},
        {"NoXml", Listener::answer(200, "<html>Log in first</html>"), "something else than the answer to an export"},
        {"HalfAnAnswer", Listener::answer(200, good.substr(good.size() - 60)), "something else"},
        {"NoHttp", {"What?\r\n\r\n", true, {}, {}}, "no answer"},
        {"ClosedAtOnce", {"", true, {}, {}}, "no answer: the listener closed the connection"},
        {"ClosedInTheHead", {head, true, {}, {}}, "no answer: the listener closed the connection"},
        {"ClosedInTheBody", {head + "Content-Length: 10\r\n\r\n12345", true, {}, {}}, "closed the connection"},
        {"LengthTooLarge", {head + "Content-Length: 900\r\n\r\n12345", false, {}, {}}, "no answer: not in time"},
        {"LengthTooSmall", {head + "Content-Length: 5\r\n\r\n<CIM></CIM>", false, {}, {}}, "something else"},
        {"LengthBeyondAllLimits", {head + "Content-Length: 99999999999\r\n\r\n", false, {}, {}}, "body limit"},
        {"LengthOfNothing", {head + "Content-Length: -1\r\n\r\n", false, {}, {}}, "Content-Length"},
        {"EndlessHead", {head + "X: " + std::string(5000, 'x'), false, {}, {}}, "header limit"},
        {"EndlessBody", {head + "\r\n" + std::string(5000, 'x'), false, {}, {}}, "body limit"},
        {"EndlessChunks",
         {head + "Transfer-Encoding: chunked\r\n\r\n" + "bb8\r\n" + std::string(3000, 'x') + "\r\n", false, {}, {}},
         "body limit"},
        {"Silent", {"", false, 1s, {}}, "no answer: not in time"},
        {"DropByDrop", {good, false, {}, 20ms}, "no answer: not in time"},
        {"AnswersThatDoNotCount",
         {"HTTP/1.1 100 C\r\n\r\nHTTP/1.1 100 C\r\n\r\nHTTP/1.1 100 C\r\n\r\nHTTP/1.1 100 C\r\n\r\nHTTP/1.1 100 "
          "C\r\n\r\n",
          true,
          {},
          {}},
         "answered HTTP 100"},
    };
}

INSTANTIATE_TEST_SUITE_P(Listener, Misbehaving, testing::ValuesIn(misbehaviours()),
                         [](const auto& one) { return one.param.name; });

TEST_F(Listeners, ThatSayMoreThanTheAnswerAreBelievedAndLeft) {
    const Listener listener(always({good + good, false, {}, {}}));
    const auto delivery = openFor(listener);
    post(*delivery, 0, 5);
    ASSERT_TRUE(eventually([&] { return countersOf(*delivery).sent == 5; }));
    EXPECT_EQ(listener.numbers(), upTo(5));
    EXPECT_GT(listener.connections(), 1) << "the second answer was taken for that to the next request";
}

TEST_F(Listeners, MayCloseBehindEachAnswer) {
    const Listener listener(always({good, true, {}, {}}));
    const auto delivery = openFor(listener);
    post(*delivery, 0, 20);
    ASSERT_TRUE(eventually([&] { return countersOf(*delivery).sent == 20; }));
    EXPECT_EQ(listener.numbers(), upTo(20));
    EXPECT_EQ(countersOf(*delivery).retried, 0U) << "a connection that has been idle may be closed by then";
}

TEST_F(Listeners, MayAnswerWithoutABody) {
    const Listener listener(always(Listener::answer(200)));
    const auto delivery = openFor(listener);
    post(*delivery, 0, 3);
    ASSERT_TRUE(eventually([&] { return countersOf(*delivery).sent == 3; }));
    EXPECT_EQ(countersOf(*delivery).retried, 0U);
}

TEST_F(Listeners, AreFoundByName) {
    const Listener listener;
    const auto delivery = open();
    subscribe(*delivery, "a", listener.url("localhost"));
    delivery->start();
    post(*delivery, 0, 1);
    EXPECT_TRUE(listener.await(1));
}

TEST_F(Listeners, WithoutAnAddressAreTriedAgain) {
    const auto delivery = open();
    subscribe(*delivery, "a", "http://nobody.invalid/");
    delivery->start();
    post(*delivery, 0, 1);
    ASSERT_TRUE(eventually([&] { return countersOf(*delivery).retried >= 2; }));
    EXPECT_THAT(countersOf(*delivery).lastError, HasSubstr("no address of nobody.invalid"));
    EXPECT_EQ(countersOf(*delivery).queued, 1U);
    EXPECT_TRUE(countersOf(*delivery).oldestQueued.has_value());
}

TEST_F(Listeners, ThatGoAndComeBackMissNothing) {
    Listener listener;
    const auto delivery = openFor(listener);
    post(*delivery, 0, 10);
    ASSERT_TRUE(eventually([&] { return countersOf(*delivery).sent == 10; }));
    listener.stop();
    post(*delivery, 10, 10);
    ASSERT_TRUE(eventually([&] { return countersOf(*delivery).retried >= 2; }));
    EXPECT_TRUE(countersOf(*delivery).failingSince.has_value());
    EXPECT_EQ(countersOf(*delivery).queued, 10U);
    listener.start();
    ASSERT_TRUE(eventually([&] { return countersOf(*delivery).sent == 20; }));
    EXPECT_EQ(once(listener.numbers()), upTo(20));
}

TEST_F(Listeners, WithANewUrlGoOnWithTheirQueue) {
    const Listener refusing(Listener::refuse);
    const Listener listener;
    const auto delivery = openFor(refusing);
    post(*delivery, 0, 3);
    ASSERT_TRUE(refusing.await(1));
    subscribe(*delivery, "a", listener.url());
    ASSERT_TRUE(listener.await(3));
    EXPECT_EQ(listener.numbers(), upTo(3));
    EXPECT_EQ(listener.received().front().context, refusing.received().front().context);
}

TEST_F(Listeners, DoNotDelayOneAnother) {
    const Listener silent(always({"", false, 60s, {}}));
    std::vector<std::unique_ptr<Listener>> quick;
    const auto delivery = open();
    std::vector<std::string> keys{"silent", "dead", "nameless"};
    subscribe(*delivery, "silent", silent.url());
    subscribe(*delivery, "dead", "http://127.0.0.1:1/");
    subscribe(*delivery, "nameless", "http://nobody.invalid/");
    for (int count = 0; count < 10; ++count) {
        quick.push_back(std::make_unique<Listener>());
        keys.push_back(std::to_string(count));
        subscribe(*delivery, keys.back(), quick.back()->url());
    }
    delivery->start();
    post(*delivery, 0, 50, keys);
    for (const auto& listener : quick) {
        ASSERT_TRUE(listener->await(50));
        EXPECT_EQ(listener->numbers(), upTo(50));
    }
    EXPECT_LT(countersOf(*delivery, "0").latency99, 10s);
    EXPECT_EQ(countersOf(*delivery, "silent").queued, 50U);
    EXPECT_EQ(countersOf(*delivery, "dead").queued, 50U);
    delivery->stop(0ms);
}

TEST_F(Listeners, FailForAsLongAsTheSubscriptionBears) {
    const Listener listener(Listener::refuse);
    const auto delivery = openFor(listener);
    delivery->setSubscription({"patient", "a", OnFatalError::remove, std::chrono::hours(1)});
    delivery->setSubscription({"short", "a", OnFatalError::disable, 1s});
    delivery->setSubscription({"none", "a", OnFatalError::remove, 0s});
    post(*delivery, 0, 1);
    ASSERT_TRUE(eventually([&] { return fired().size() == 2; }));
    EXPECT_THAT(fired(), ElementsAre(Fired{"none", OnFatalError::remove}, Fired{"short", OnFatalError::disable}));
    const auto since = countersOf(*delivery).failingSince;
    ASSERT_TRUE(since.has_value());
    EXPECT_GE(std::chrono::system_clock::now() - *since, 1s);
    std::this_thread::sleep_for(100ms);
    EXPECT_EQ(fired().size(), 2U) << "told twice";
    EXPECT_EQ(countersOf(*delivery).queued, 1U);
}

TEST_F(Listeners, ThatRecoverAndFailAgainAreReportedAgain) {
    Listener listener(Listener::refuse);
    const auto delivery = open();
    subscribe(*delivery, "a", listener.url(), OnFatalError::disable);
    delivery->start();
    post(*delivery, 0, 1);
    ASSERT_TRUE(eventually([&] { return fired().size() == 1; }));
    listener.setReaction(Listener::accept);
    ASSERT_TRUE(eventually([&] { return countersOf(*delivery).sent == 1; }));
    listener.setReaction(Listener::refuse);
    post(*delivery, 1, 1);
    EXPECT_TRUE(eventually([&] { return fired().size() == 2; }));
}

TEST_F(Listeners, MayBeForgottenByThePolicyHandler) {
    const Listener listener(Listener::refuse);
    std::unique_ptr<Delivery> delivery;
    delivery = std::make_unique<Delivery>(
        file, options, [&](const std::string& key, OnFatalError /*policy*/) { delivery->removeSubscription(key); },
        [](const std::string& /*line*/) {});
    subscribe(*delivery, "a", listener.url(), OnFatalError::remove);
    delivery->start();
    post(*delivery, 0, 3);
    EXPECT_TRUE(eventually([&] { return countersOf(*delivery).queued == 0; }));
}

} // namespace
} // namespace marlo::delivery
