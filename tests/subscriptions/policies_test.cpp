/** @file What becomes of subscriptions whose listener fails, by what they say about it. */
#include "tests/subscriptions/SubscribedServer.h"

#include <map>
#include <thread>

namespace marlo::test {
namespace {

using testing::ElementsAre;
using testing::HasSubstr;
using testing::Not;
using testing::Pair;

constexpr const char* filter = "CIM_IndicationFilter";
constexpr const char* destination = "CIM_ListenerDestinationCIMXML";

/** A destination "d", with a subscription to the events that take an adapter offline for each filter. */
class Policies : public SubscribedServer {
  protected:
    void SetUp() override {
        start();
        printed({"ci", interop(std::string(destination) + "." + keys(destination, "d")),
                 keys(destination, "d") + ",Destination=\"" + listener.url() + "\""});
    }

    [[nodiscard]] std::string path(const std::string& name) const {
        return interop("CIM_IndicationSubscription." + ends(name));
    }

    /** Makes the filter and the subscription. */
    void subscribe(const std::string& name, const std::string& properties) const {
        printed({"ci", interop(std::string(filter) + "." + keys(filter, name)),
                 keys(filter, name) + ",Query=\"SELECT * FROM MARLO_NetworkAdapterOfflineEvent\"," +
                     "QueryLanguage=\"WQL\",SourceNamespace=\"root/tavis\""});
        printed({"ci", path(name), properties + "," + ends(name)}); // wbemcli takes what follows for the reference's
    }

    /** Whether they are enabled, by the filter's name. */
    [[nodiscard]] std::map<std::string, bool> states() const {
        std::map<std::string, bool> found;
        for (const auto& each : json({"subscriptions"})) {
            found[each["filter"]] = each["enabled"];
        }
        return found;
    }

    /** Waits for a state of the subscriptions, whatever it is in the end. */
    [[nodiscard]] std::map<std::string, bool> statesOnce(const std::map<std::string, bool>& expected) const {
        const auto end = std::chrono::steady_clock::now() + Patience;
        while (states() != expected && std::chrono::steady_clock::now() < end) {
            std::this_thread::sleep_for(std::chrono::milliseconds(20));
        }
        return states();
    }

    [[nodiscard]] bool isSentOnce(unsigned count) const {
        const auto end = std::chrono::steady_clock::now() + Patience;
        while (counters()["sent"] != count && std::chrono::steady_clock::now() < end) {
            std::this_thread::sleep_for(std::chrono::milliseconds(20));
        }
        return counters()["sent"] == count;
    }

    [[nodiscard]] nlohmann::json counters() const { return json({"status"})["deliveries"][0]; }

    static delivery::Listener::Reaction fail(const delivery::Listener::Received& /*received*/) {
        return delivery::Listener::answer(500);
    }

  private:
    static std::string ends(const std::string& name) {
        return "Filter=" + reference("localhost", filter, name) +
               ",Handler=" + reference("localhost", destination, "d");
    }
};

TEST_F(Policies, EndTheSubscriptionsThatSaySoAndNoOthers) {
    listener.setReaction(fail);
    subscribe("ignoring", "OnFatalErrorPolicy=2");
    subscribe("disabling", "OnFatalErrorPolicy=3");
    subscribe("removing", "OnFatalErrorPolicy=4");
    subscribe("patient", "OnFatalErrorPolicy=4,FailureTriggerTimeInterval=36000");
    play("status eth2 12\n");
    const std::map<std::string, bool> expected{{"disabling", false}, {"ignoring", true}, {"patient", true}};
    EXPECT_EQ(statesOnce(expected), expected);
    EXPECT_THAT(log(), HasSubstr("subscription removed: nothing can be delivered"));
    EXPECT_THAT(log(), HasSubstr("subscription disabled: nothing can be delivered"));
    EXPECT_EQ(counters()["queued"], 2) << "what waited for those that have ended is gone";
    EXPECT_EQ(counters()["last_error"], "answered HTTP 500");
    EXPECT_THAT(printed({"gi", "-nl", path("disabling")}), HasSubstr("-SubscriptionState=4"));

    listener.setReaction(delivery::Listener::accept);
    EXPECT_TRUE(isSentOnce(2));
    EXPECT_EQ(states(), expected);
}

TEST_F(Policies, WaitForAsLongAsTheSubscriptionBears) {
    listener.setReaction(fail);
    subscribe("bearing", "OnFatalErrorPolicy=3,FailureTriggerTimeInterval=3");
    play("status eth2 12\n");
    ASSERT_TRUE(listener.await(2, Patience)) << "it is tried again";
    const std::map<std::string, bool> disabled{{"bearing", false}};
    EXPECT_EQ(statesOnce(disabled), disabled);
    EXPECT_GE(std::chrono::steady_clock::now() - listener.received().front().time, std::chrono::seconds(3));
}

TEST_F(Policies, AreOverWithTheFailure) {
    listener.setReaction(fail);
    subscribe("bearing", "OnFatalErrorPolicy=3,FailureTriggerTimeInterval=30");
    play("status eth2 12\n");
    ASSERT_TRUE(listener.await(2, Patience));
    listener.setReaction(delivery::Listener::accept);
    play("status eth2 1\nstatus eth2 12\n");
    EXPECT_TRUE(isSentOnce(2));
    EXPECT_THAT(states(), ElementsAre(Pair("bearing", true)));
    EXPECT_EQ(counters()["failing_since"], 0);
}

TEST_F(Policies, LeaveADisabledSubscriptionToBeEnabledAgain) {
    listener.setReaction(fail);
    subscribe("disabling", "OnFatalErrorPolicy=3");
    play("status eth2 12\n");
    const std::map<std::string, bool> disabled{{"disabling", false}};
    ASSERT_EQ(statesOnce(disabled), disabled);
    EXPECT_EQ(stop(), 0);
    start();
    EXPECT_EQ(states(), disabled) << "that is kept";
    listener.setReaction(delivery::Listener::accept);
    printed({"mi", path("disabling"), "SubscriptionState=2"});
    EXPECT_THAT(states(), ElementsAre(Pair("disabling", true)));
    const std::size_t before = listener.received().size();
    play("status eth2 1\nstatus eth2 12\n");
    ASSERT_TRUE(listener.await(before + 1, Patience));
    EXPECT_THAT(listener.received().back().number, testing::Gt(0)) << "the one that was given up is not sent";
}

} // namespace
} // namespace marlo::test
