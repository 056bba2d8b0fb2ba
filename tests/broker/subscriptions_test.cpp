/** @file What providers are told of subscriptions. */
#include "tests/broker/Alerts.h"

#include <algorithm>

#include <gmock/gmock.h>

namespace marlo::test {
namespace {

using testing::ElementsAre;
using testing::HasSubstr;
using testing::IsEmpty;
using testing::SizeIs;
using testing::StartsWith;

constexpr const char* allAlerts = "SELECT * FROM Test_Alert";

class SubscriptionsTest : public AlertsTest {
  protected:
    void expectRefused(const std::string& filter, CMPIrc code, const std::string& message,
                       const std::string& language = "WQL", const std::string& nameSpace = "root/test") {
        SubscriptionId id = 1;
        const Status status = manager->subscribe(
            nameSpace, filter, language, [](Instance&&) {}, id);
        EXPECT_EQ(status.code, code) << filter;
        EXPECT_THAT(status.message, HasSubstr(message)) << filter;
        EXPECT_EQ(id, 0U);
        EXPECT_THAT(calls(), IsEmpty()) << filter;
    }

    /** Nothing is left of a subscription that failed: another one is the first again. */
    void expectNothingLeft() {
        Mailbox mailbox;
        const SubscriptionId id = subscribe(allAlerts, mailbox);
        const auto told = calls();
        EXPECT_EQ(std::count_if(told.begin(), told.end(),
                                [](const auto& line) { return line.find("first=1") != std::string::npos; }),
                  std::count_if(told.begin(), told.end(),
                                [](const auto& line) { return line.find("enable") != std::string::npos; }));
        EXPECT_TRUE(manager->unsubscribe(id).ok());
        calls();
    }
};

TEST_F(SubscriptionsTest, TellProvidersInTheOrderOfTheStandard) {
    provide("FirstAlerts", "\"Test_Alert\"");
    Mailbox mailbox;
    const SubscriptionId id = subscribe("SELECT * FROM test_alert WHERE Number > 2", mailbox);
    const std::string arguments = " [SELECT * FROM test_alert WHERE Number > 2] Test_Alert root/test:Test_Alert.0";
    const auto told = calls();
    ASSERT_THAT(told, SizeIs(4));
    EXPECT_THAT(told[0], StartsWith("FirstAlerts authorizeFilter" + arguments + " "));
    EXPECT_GT(told[0].size(), ("FirstAlerts authorizeFilter" + arguments + " ").size()); // the owner
    EXPECT_EQ(told[1], "FirstAlerts mustPoll" + arguments);
    EXPECT_EQ(told[2], "FirstAlerts activateFilter" + arguments + " first=1");
    EXPECT_EQ(told[3], "FirstAlerts enableIndications");
    EXPECT_TRUE(manager->unsubscribe(id).ok());
    EXPECT_THAT(calls(), ElementsAre("FirstAlerts deActivateFilter" + arguments + " last=1",
                                     "FirstAlerts disableIndications"));
}

TEST_F(SubscriptionsTest, MarkTheFirstAndTheLastOfAClassAndOfAProvider) {
    provide("FirstAlerts", "\"Test_Alert\", \"Test_Other\"");
    Mailbox mailbox;
    const auto lastWords = [this] {
        std::vector<std::string> words;
        for (const std::string& line : calls()) {
            if (line.find("ctivateFilter") != std::string::npos || line.find("able") != std::string::npos) {
                words.push_back(line.substr(line.rfind(' ') + 1));
            }
        }
        return words;
    };
    const SubscriptionId one = subscribe(allAlerts, mailbox);
    EXPECT_THAT(lastWords(), ElementsAre("first=1", "enableIndications"));
    const SubscriptionId two = subscribe(allAlerts, mailbox);
    EXPECT_THAT(lastWords(), ElementsAre("first=0"));
    const SubscriptionId other = subscribe("SELECT * FROM Test_Other", mailbox);
    EXPECT_THAT(lastWords(), ElementsAre("first=1"));
    EXPECT_TRUE(manager->unsubscribe(one).ok());
    EXPECT_THAT(lastWords(), ElementsAre("last=0"));
    EXPECT_TRUE(manager->unsubscribe(two).ok());
    EXPECT_THAT(lastWords(), ElementsAre("last=1"));
    EXPECT_TRUE(manager->unsubscribe(other).ok());
    EXPECT_THAT(lastWords(), ElementsAre("last=1", "disableIndications"));
    subscribe(allAlerts, mailbox);
    EXPECT_THAT(lastWords(), ElementsAre("first=1", "enableIndications"));
}

TEST_F(SubscriptionsTest, ReachTheProvidersOfSubclasses) {
    provide("FirstAlerts", "\"Test_LoudAlert\"");
    provide("SecondAlerts", "\"Test_QuietAlert\"");
    Mailbox mailbox;
    subscribe(allAlerts, mailbox);
    const auto told = calls();
    ASSERT_THAT(told, SizeIs(8));
    EXPECT_EQ(told[2], "FirstAlerts activateFilter [SELECT * FROM Test_Alert] Test_Alert root/test:Test_LoudAlert.0 "
                       "first=1");
    EXPECT_EQ(told[6],
              "SecondAlerts activateFilter [SELECT * FROM Test_Alert] Test_Alert root/test:Test_QuietAlert.0 "
              "first=1");
}

TEST_F(SubscriptionsTest, ReachTheProviderOfTheNearestSuperclass) {
    provide("FirstAlerts", "\"Test_Indication\"");
    provide("SecondAlerts", "\"Test_Alert\"");
    Mailbox mailbox;
    subscribe("SELECT * FROM Test_LoudAlert", mailbox);
    const auto told = calls();
    ASSERT_THAT(told, SizeIs(4));
    EXPECT_EQ(told[2], "SecondAlerts activateFilter [SELECT * FROM Test_LoudAlert] Test_LoudAlert "
                       "root/test:Test_LoudAlert.0 first=1");
}

TEST_F(SubscriptionsTest, AreUndoneWhenAProviderRefuses) {
    provide("FirstAlerts", "\"Test_Alert\"");
    for (const char* function : {"authorizeFilter", "activateFilter", "enableIndications"}) {
        letMisbehave("FirstAlerts", function, 1);
        SubscriptionId id = 1;
        Mailbox mailbox;
        const Status status = subscribe(allAlerts, mailbox, id);
        EXPECT_EQ(status.code, CMPI_RC_ERR_ACCESS_DENIED) << function;
        EXPECT_EQ(status.message, std::string(function) + " of provider FirstAlerts for Test_Alert: not for you");
        EXPECT_EQ(id, 0U);
        const std::string last = calls().back();
        const bool wasActive = std::string(function) == "enableIndications";
        EXPECT_THAT(last, HasSubstr(wasActive ? "deActivateFilter" : function));
        misbehave("FirstAlerts", function, 0);
        expectNothingLeft();
    }
}

TEST_F(SubscriptionsTest, AreUndoneWhenAProviderThrows) {
    provide("FirstAlerts", "\"Test_Alert\"");
    for (const char* function : {"authorizeFilter", "mustPoll", "activateFilter", "enableIndications"}) {
        letMisbehave("FirstAlerts", function, 2);
        SubscriptionId id = 1;
        Mailbox mailbox;
        const Status status = subscribe(allAlerts, mailbox, id);
        EXPECT_EQ(status.code, CMPI_RC_ERR_FAILED) << function;
        EXPECT_THAT(status.message, HasSubstr("provider FirstAlerts threw: the provider's text")) << function;
        misbehave("FirstAlerts", function, 0);
        calls();
        expectNothingLeft();
    }
}

TEST_F(SubscriptionsTest, GoOnWhenAProviderWouldNotPoll) {
    provide("FirstAlerts", "\"Test_Alert\"");
    letMisbehave("FirstAlerts", "mustPoll", 1);
    Mailbox mailbox;
    subscribe(allAlerts, mailbox);
    EXPECT_THAT(calls(), SizeIs(4));
}

TEST_F(SubscriptionsTest, AreUndoneAtAllProvidersWhenOneRefuses) {
    provide("FirstAlerts", "\"Test_LoudAlert\"");
    provide("SecondAlerts", "\"Test_QuietAlert\"");
    letMisbehave("SecondAlerts", "activateFilter", 1);
    SubscriptionId id = 1;
    Mailbox mailbox;
    EXPECT_EQ(subscribe(allAlerts, mailbox, id).code, CMPI_RC_ERR_ACCESS_DENIED);
    const auto told = calls();
    ASSERT_THAT(told, SizeIs(9));
    EXPECT_EQ(told[7],
              "FirstAlerts deActivateFilter [SELECT * FROM Test_Alert] Test_Alert root/test:Test_LoudAlert.0 last=1");
    EXPECT_EQ(told[8], "FirstAlerts disableIndications");
    ASSERT_EQ(deliver("root/test", "Test_LoudAlert", 1, ""), CMPI_RC_OK);
    EXPECT_THAT(mailbox.received(), IsEmpty());
    misbehave("SecondAlerts", "activateFilter", 0);
    expectNothingLeft();
}

TEST_F(SubscriptionsTest, EndWhateverTheProviderAnswers) {
    provide("FirstAlerts", "\"Test_Alert\"");
    for (const char* function : {"deActivateFilter", "disableIndications"}) {
        Mailbox mailbox;
        const SubscriptionId id = subscribe(allAlerts, mailbox);
        calls();
        letMisbehave("FirstAlerts", function, 1);
        const Status status = manager->unsubscribe(id);
        EXPECT_EQ(status.code, CMPI_RC_ERR_ACCESS_DENIED);
        EXPECT_THAT(status.message, StartsWith(function));
        EXPECT_THAT(calls(), SizeIs(2));
        EXPECT_EQ(manager->unsubscribe(id).code, CMPI_RC_ERR_NOT_FOUND);
        misbehave("FirstAlerts", function, 0);
        expectNothingLeft();
    }
}

TEST_F(SubscriptionsTest, EndWithTheObjectManager) {
    provide("FirstAlerts", "\"Test_Alert\"");
    Mailbox mailbox;
    subscribe(allAlerts, mailbox);
    subscribe(allAlerts, mailbox);
    calls();
    manager.reset();
    const auto told = calls();
    ASSERT_THAT(told, SizeIs(3));
    EXPECT_THAT(told[0], HasSubstr("last=0"));
    EXPECT_THAT(told[1], HasSubstr("last=1"));
    EXPECT_EQ(told[2], "FirstAlerts disableIndications");
}

TEST_F(SubscriptionsTest, AreRefusedWithTheReasonBeforeAnyProviderIsAsked) {
    provide("FirstAlerts", "\"Test_Alert\"");
    expectRefused("SELECT *", CMPI_RC_ERR_INVALID_QUERY,
                  "the filter is refused: line 1, column 9: expected FROM, found the end of the filter");
    expectRefused("SELECT * FROM Test_Alert WHERE Nowhere = 1", CMPI_RC_ERR_INVALID_QUERY,
                  "line 1, column 32: Test_Alert has no property 'Nowhere'");
    expectRefused("SELECT * FROM Test_Alert WHERE Text = 1", CMPI_RC_ERR_INVALID_QUERY,
                  "line 1, column 32: string and uint64 cannot be compared");
    expectRefused("SELECT * FROM Test_Nowhere", CMPI_RC_ERR_INVALID_CLASS,
                  "line 1, column 15: there is no class 'Test_Nowhere' in root/test");
    expectRefused("SELECT * FROM Test_Thing", CMPI_RC_ERR_INVALID_CLASS, "Test_Thing is not a class of indications");
    expectRefused("SELECT * FROM Test_Other", CMPI_RC_ERR_NOT_SUPPORTED,
                  "no provider gives the indications of Test_Other in root/test");
    expectRefused(allAlerts, CMPI_RC_ERR_QUERY_LANGUAGE_NOT_SUPPORTED, "unknown query language 'SQL'", "SQL");
    expectRefused(allAlerts, CMPI_RC_ERR_INVALID_NAMESPACE, "there is no namespace 'root/no'", "WQL", "root/no");
    expectRefused("SELECT * FROM Test_Alert ORDER BY Text", CMPI_RC_ERR_QUERY_FEATURE_NOT_SUPPORTED, "ORDER");
}

TEST_F(SubscriptionsTest, SayWhichFactoryIsMissing) {
    site.write("providers/bad.toml", "library = \"libthing_provider.so\"\n[[provider]]\nname = \"ThingProvider\"\n"
                                     "kinds = [\"indication\"]\nnamespaces = [\"root/test\"]\n"
                                     "classes = [\"Test_Other\"]\n");
    provide("FirstAlerts", "\"Test_Alert\"");
    expectRefused("SELECT * FROM Test_Other", CMPI_RC_ERR_FAILED, "no factory ThingProvider_Create_IndicationMI");
}

} // namespace
} // namespace marlo::test
