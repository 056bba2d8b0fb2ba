/** @file Who may subscribe, and what becomes of subscriptions whose owner may not read any more. */
#include "tests/subscriptions/SubscribedServer.h"
#include "tests/support/Namespace.h"

namespace marlo::test {
namespace {

using testing::AllOf;
using testing::HasSubstr;

constexpr const char* filter = "CIM_IndicationFilter";
constexpr const char* destination = "CIM_ListenerDestinationCIMXML";
constexpr const char* subscription = "CIM_IndicationSubscription";

/** A server with an account for each role. */
class Rights : public SubscribedServer {
  protected:
    void SetUp() override {
        REQUIRE_NAMESPACES();
        configure("access", "read = [\"reader\"]\nchange = [\"changer\"]\nsubscribe = [\"station\"]\n");
        serveAccountsNamed({"reader", "changer", "station"});
        start();
    }

    [[nodiscard]] std::string at(const std::string& user, const std::string& rest) const {
        return urlOf(user, "secret", "root/interop:" + rest);
    }

    static std::string ends() {
        return "Filter=" + reference("localhost", filter, "f") +
               ",Handler=" + reference("localhost", destination, "d");
    }

    static std::string path(const char* className) {
        return std::string(className) + "." +
               (className == subscription ? ends() : keys(className, className == filter ? "f" : "d"));
    }

    /** Arguments of wbemcli that create one of the three. */
    [[nodiscard]] std::vector<std::string> creation(const std::string& user, const char* className) const {
        const std::string url = at(user, path(className));
        if (className == filter) {
            return {"ci", url,
                    keys(filter, "f") +
                        ",Query=\"SELECT * FROM MARLO_NetworkAdapterOfflineEvent\",QueryLanguage=\"WQL\","
                        "SourceNamespace=\"root/tavis\""};
        }
        if (className == destination) {
            return {"ci", url, keys(destination, "d") + ",Destination=\"" + listener.url() + "\""};
        }
        return {"ci", url, ends()};
    }

    void subscribe(const std::string& user) const {
        for (const char* each : {filter, destination, subscription}) {
            printed(creation(user, each));
        }
    }

    /** Everything about subscribing, as a user sees it. */
    [[nodiscard]] std::string holdings(const std::string& user) const {
        std::string all;
        for (const char* each : {filter, destination, subscription}) {
            all += printed({"ei", "-nl", at(user, each)});
        }
        return all;
    }

    void expectRefused(const std::vector<std::string>& arguments) const {
        const Outcome outcome = wbemcli(arguments);
        EXPECT_NE(outcome.exitCode, 0) << testing::PrintToString(arguments);
        EXPECT_THAT(outcome.err,
                    AllOf(HasSubstr("(2) CIM_ERR_ACCESS_DENIED"), HasSubstr("takes the role 'subscribe'")))
            << testing::PrintToString(arguments);
    }

    /** Of the destination that was made by wbemcli. */
    [[nodiscard]] nlohmann::json counters() const {
        const nlohmann::json status = json({"status"});
        for (const auto& each : status["deliveries"]) {
            if (each["destination"] == "d") {
                return each;
            }
        }
        return {};
    }

    [[nodiscard]] bool isEnabled() const {
        for (const auto& each : json({"subscriptions"})) {
            if (each["listener"] == "d") {
                return each["enabled"];
            }
        }
        ADD_FAILURE() << "there is no such subscription";
        return false;
    }

    /** An event of eth2, which is on disk, or with its listeners, when root's own listener has it. */
    void play(const std::string& status) {
        const std::size_t before = own.received().size();
        SubscribedServer::play("status eth2 " + status + "\n");
        ASSERT_TRUE(own.await(before + 1, Patience));
    }

    delivery::Listener own;
};

TEST_F(Rights, ToReadOrToChangeAreNotEnoughToMakeThem) {
    const std::string before = holdings("reader");
    for (const char* user : {"reader", "changer"}) {
        expectRefused(creation(user, filter));
        expectRefused(creation(user, destination));
    }
    EXPECT_EQ(holdings("reader"), before);
    printed(creation("station", filter));
    printed(creation("station", destination));
    for (const char* user : {"reader", "changer"}) {
        expectRefused(creation(user, subscription));
    }
    EXPECT_EQ(printed({"ein", at("reader", subscription)}), "");
    printed(creation("station", subscription));
}

TEST_F(Rights, ToReadOrToChangeAreNotEnoughToChangeOrRemoveThem) {
    subscribe("station");
    const std::string before = holdings("reader");
    for (const char* user : {"reader", "changer"}) {
        expectRefused({"mi", at(user, path(filter)), "Query=\"SELECT * FROM MARLO_NetworkAdapterOnlineEvent\""});
        expectRefused({"mi", at(user, path(destination)), "Destination=\"http://192.0.2.66/\""});
        expectRefused({"mi", at(user, path(subscription)), "OnFatalErrorPolicy=4"});
        expectRefused({"sp", at(user, path(destination)), "Destination=http://192.0.2.66/"});
        for (const char* each : {subscription, filter, destination}) {
            expectRefused({"di", at(user, path(each))});
        }
    }
    EXPECT_EQ(holdings("reader"), before);
    for (const char* each : {subscription, filter, destination}) {
        printed({"di", at("station", path(each))});
    }
}

TEST_F(Rights, ToSubscribeGoWithoutThoseOfOthersAndLeaveWhatTheyMadeToTheReader) {
    subscribe("station");
    json({"subscribe", own.url()});
    readAnew("read = [\"reader\"]", "read = [\"station\"]");
    readAnew("subscribe = [\"station\"]", "subscribe = []");
    EXPECT_TRUE(isEnabled());
    play("12");
    ASSERT_TRUE(listener.await(1, Patience)) << "its owner may still read";
    expectRefused({"di", at("station", path(subscription))});
}

TEST_F(Rights, ToReadThatAreTakenAwayEndWhatIsSentUntilTheyAreBack) {
    listener.setReaction(delivery::Listener::refuse);
    subscribe("station");
    json({"subscribe", own.url()});
    play("12");
    ASSERT_TRUE(listener.await(1, Patience)); // and refused: it waits from now on
    EXPECT_EQ(counters()["queued"], 1);

    readAnew("subscribe = [\"station\"]", "subscribe = []");
    listener.setReaction(delivery::Listener::accept);
    EXPECT_FALSE(isEnabled());
    EXPECT_EQ(counters()["queued"], 0) << "what waits would still be sent";
    play("1");
    play("12");
    EXPECT_EQ(counters()["queued"], 0);
    EXPECT_EQ(counters()["sent"], 0);
    EXPECT_THAT(log(), HasSubstr("what waits for it is discarded: user 'station' may not read"));

    EXPECT_EQ(stop(), 0); // nor is it otherwise after a restart
    start();
    EXPECT_FALSE(isEnabled());
    play("1");
    EXPECT_EQ(counters()["queued"], 0);

    readAnew("subscribe = []", "subscribe = [\"station\"]");
    EXPECT_TRUE(isEnabled());
    const std::size_t before = listener.received().size();
    play("12");
    ASSERT_TRUE(listener.await(before + 1, Patience));
    EXPECT_EQ(listener.received().back().number, 1) << "the gap shows that something was lost";
    EXPECT_EQ(counters()["queued"], 0);
}

} // namespace
} // namespace marlo::test
