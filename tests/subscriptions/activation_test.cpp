/** @file What subscriptions do: whom they tell, what they queue, and when they end. */
#include "tests/subscriptions/Site.h"

#include <thread>

namespace marlo::test {
namespace {

using subscriptions::numberOf;
using testing::Contains;
using testing::ElementsAre;
using testing::HasSubstr;
using testing::IsEmpty;
using testing::SizeIs;

class ActivationTest : public SubscribingTest {
  protected:
    /** Waits until a subscription is gone. */
    void waitForTheEndOf(const ObjectPath& path) {
        for (int i = 0; i < 3000 && codeOfGet(path) == CMPI_RC_OK; ++i) {
            std::this_thread::sleep_for(std::chrono::milliseconds(10));
        }
        EXPECT_EQ(codeOfGet(path), CMPI_RC_ERR_NOT_FOUND);
    }

    /** The number that delivery knows the only subscription by. */
    static std::string onlyKey() {
        ScriptedDelivery& script = ScriptedDelivery::latest();
        const std::lock_guard lock(script.mutex);
        return script.subscriptions.size() == 1 ? script.subscriptions.begin()->first : "";
    }
};

TEST_F(ActivationTest, QueuesWhatTheFilterChooses) {
    subscribe(makeFilter("many", "SELECT Number FROM Test_Alert WHERE Number >= 2"), makeDestination());
    for (unsigned i = 1; i <= 3; ++i) {
        EXPECT_EQ(deliver("root/test", "Test_Alert", i, ""), CMPI_RC_OK);
    }
    EXPECT_THAT(postedNumbers(), ElementsAre(2, 3));
    const auto posts = ScriptedDelivery::latest().posted();
    EXPECT_EQ(posts[0].first, onlyKey());
    EXPECT_EQ(posts[0].second.path.className, "Test_Alert");
    EXPECT_THAT(posts[0].second.properties, SizeIs(1));
}

TEST_F(ActivationTest, WaitsOnceForAllSubscriptionsOfAnIndication) {
    const ObjectPath filter = makeFilter();
    for (unsigned i = 0; i < 5; ++i) {
        subscribe(filter, makeDestination("listener " + std::to_string(i)));
    }
    EXPECT_EQ(deliver("root/test", "Test_Alert", 1, ""), CMPI_RC_OK);
    EXPECT_THAT(postedNumbers(), SizeIs(5));
    EXPECT_EQ(ScriptedDelivery::latest().waits, 1U);
}

TEST_F(ActivationTest, TellsTheProviderThatAnIndicationIsNotKept) {
    subscribe(makeFilter(), makeDestination());
    ScriptedDelivery::latest().diskIsFull = true;
    EXPECT_EQ(deliver("root/test", "Test_Alert", 1, ""), CMPI_RC_ERR_FAILED);
    ScriptedDelivery::latest().diskIsFull = false;
    EXPECT_EQ(deliver("root/test", "Test_Alert", 2, ""), CMPI_RC_OK);
}

TEST_F(ActivationTest, TellsDeliveryWhatASubscriptionSays) {
    const ObjectPath destination = makeDestination();
    subscribe(makeFilter(), destination, {number("OnFatalErrorPolicy", 4), number("FailureTriggerTimeInterval", 90)});
    ScriptedDelivery& script = ScriptedDelivery::latest();
    ASSERT_THAT(script.subscriptions, SizeIs(1));
    const delivery::Subscription& known = script.subscriptions.begin()->second;
    EXPECT_EQ(known.onFatalError, delivery::OnFatalError::remove);
    EXPECT_EQ(known.failureTrigger, std::chrono::seconds(90));
    EXPECT_EQ(script.destinations.at(known.destination).url, "http://127.0.0.1:5990/sink");
    EXPECT_TRUE(set(destination, text("Destination", "http://127.0.0.1:5999/")).ok());
    EXPECT_EQ(script.destinations.at(known.destination).url, "http://127.0.0.1:5999/");
    EXPECT_EQ(set(destination, text("Destination", "nowhere")).code, CMPI_RC_ERR_INVALID_PARAMETER);
    EXPECT_EQ(script.destinations.at(known.destination).url, "http://127.0.0.1:5999/");
}

TEST_F(ActivationTest, EndsAndBeginsWithTheState) {
    const ObjectPath subscription = subscribe(makeFilter(), makeDestination());
    const Instance before = get(subscription);
    EXPECT_TRUE(set(subscription, number("SubscriptionState", 4)).ok());
    EXPECT_EQ(stateOf(get(subscription)), 4U);
    EXPECT_FALSE(*findName(get(subscription).properties, "TimeOfLastStateChange") ==
                 *findName(before.properties, "TimeOfLastStateChange"));
    deliver("root/test", "Test_Alert", 1, "");
    EXPECT_TRUE(set(subscription, number("SubscriptionState", 2)).ok());
    deliver("root/test", "Test_Alert", 2, "");
    EXPECT_THAT(postedNumbers(), ElementsAre(2));
    EXPECT_EQ(set(subscription, number("SubscriptionState", 3)).code, CMPI_RC_ERR_INVALID_PARAMETER);
    EXPECT_EQ(stateOf(get(subscription)), 2U);
}

TEST_F(ActivationTest, StaysDisabledOverARestart) {
    const ObjectPath subscription = subscribe(makeFilter(), makeDestination(), {number("SubscriptionState", 4)});
    subscribe(makeFilter("enabled", "SELECT * FROM Test_Alert"), parse(names("CIM_ListenerDestination").front()));
    reopen();
    EXPECT_EQ(stateOf(get(subscription)), 4U);
    deliver("root/test", "Test_Alert", 1, "");
    EXPECT_THAT(postedNumbers(), ElementsAre(1));                     // for the enabled one alone
    EXPECT_THAT(ScriptedDelivery::latest().subscriptions, SizeIs(2)); // so that what waits for the other stays
}

TEST_F(ActivationTest, IsRestoredBeforeDeliveryStarts) {
    subscribe(makeFilter(), makeDestination());
    const std::string key = onlyKey();
    reopen();
    EXPECT_TRUE(ScriptedDelivery::latest().isStarted);
    EXPECT_EQ(onlyKey(), key);
    deliver("root/test", "Test_Alert", 7, "");
    EXPECT_THAT(postedNumbers(), ElementsAre(7));
}

TEST_F(ActivationTest, OfAClassThatIsGoneIsTriedAgainAtEachStart) {
    const ObjectPath subscription = subscribe(makeFilter("loud", "SELECT * FROM Test_LoudAlert"), makeDestination());
    const ObjectPath other = subscribe(makeFilter(), parse(names("CIM_ListenerDestination").front()));
    writeAlerts(false);
    reopen();
    EXPECT_EQ(stateOf(get(subscription)), 4U);
    EXPECT_EQ(stateOf(get(other)), 2U);
    EXPECT_THAT(lines(), Contains(HasSubstr("Test_LoudAlert")));
    EXPECT_FALSE(set(subscription, number("SubscriptionState", 2)).ok());
    writeAlerts(true);
    reopen();
    EXPECT_EQ(stateOf(get(subscription)), 2U);
}

TEST_F(ActivationTest, LeavesNothingOfWhatAProviderRefuses) {
    const ObjectPath filter = makeFilter();
    const ObjectPath destination = makeDestination();
    misbehave("FirstAlerts", "authorizeFilter", 1);
    EXPECT_EQ(
        tryToMake("CIM_IndicationSubscription", {reference("Filter", filter), reference("Handler", destination)})
            .code,
        CMPI_RC_ERR_ACCESS_DENIED);
    EXPECT_THAT(names("CIM_IndicationSubscription"), IsEmpty());
    EXPECT_EQ(onlyKey(), "");
    misbehave("FirstAlerts", "authorizeFilter", 0);
    subscribe(filter, destination);
}

TEST_F(ActivationTest, IsRefusedWhereNobodyGivesTheIndications) {
    const ObjectPath filter = make(
        "CIM_IndicationFilter", {text("Query", "SELECT * FROM CIM_AlertIndication"), text("QueryLanguage", "WQL")});
    const Status status = tryToMake("CIM_IndicationSubscription",
                                    {reference("Filter", filter), reference("Handler", makeDestination())});
    EXPECT_EQ(status.code, CMPI_RC_ERR_NOT_SUPPORTED);
    EXPECT_THAT(status.message, HasSubstr("root/interop"));
}

TEST_F(ActivationTest, FollowsAFilterThatChanges) {
    const ObjectPath filter = makeFilter();
    subscribe(filter, makeDestination());
    EXPECT_TRUE(set(filter, text("Query", "SELECT * FROM Test_Alert WHERE Number = 2")).ok());
    deliver("root/test", "Test_Alert", 1, "");
    deliver("root/test", "Test_Alert", 2, "");
    EXPECT_EQ(set(filter, text("Query", "SELECT * FROM")).code, CMPI_RC_ERR_INVALID_QUERY);
    EXPECT_EQ(set(filter, text("SourceNamespace", "root/nowhere")).code, CMPI_RC_ERR_INVALID_NAMESPACE);
    EXPECT_EQ(set(filter, text("SourceNamespace", "root/interop")).code, CMPI_RC_ERR_INVALID_CLASS);
    deliver("root/test", "Test_Alert", 3, "");
    deliver("root/test", "Test_Alert", 2, "");
    EXPECT_THAT(postedNumbers(), ElementsAre(2, 2));
}

TEST_F(ActivationTest, IsOfNothingThatTheOwnerCouldNotRead) {
    {
        const ActingFor acting("somebody");
        subscribe(makeFilter(), makeDestination());
    }
    const ObjectPath subscription = parse(names("CIM_IndicationSubscription").front());
    strangers.insert("somebody");
    service->review();
    EXPECT_EQ(stateOf(get(subscription)), 4U);
    EXPECT_EQ(onlyKey(), "") << "what waits for it must go";
    deliver("root/test", "Test_Alert", 1, "");
    reopen();
    EXPECT_EQ(stateOf(get(subscription)), 4U);
    EXPECT_EQ(onlyKey(), "");
    deliver("root/test", "Test_Alert", 2, "");
    EXPECT_THAT(postedNumbers(), IsEmpty());
    strangers.clear();
    service->review();
    EXPECT_EQ(stateOf(get(subscription)), 2U);
    EXPECT_NE(onlyKey(), "");
    deliver("root/test", "Test_Alert", 3, "");
    EXPECT_THAT(postedNumbers(), ElementsAre(3));
}

TEST_F(ActivationTest, IsRefusedToWhoMayNotRead) {
    const ObjectPath filter = makeFilter();
    const ObjectPath destination = makeDestination();
    strangers.insert("somebody");
    const ActingFor acting("somebody");
    const Status status =
        tryToMake("CIM_IndicationSubscription", {reference("Filter", filter), reference("Handler", destination)});
    EXPECT_EQ(status.code, CMPI_RC_ERR_ACCESS_DENIED);
    EXPECT_THAT(status.message, HasSubstr("user 'somebody', whose subscription it is, may not read"));
    EXPECT_THAT(names("CIM_IndicationSubscription"), IsEmpty());
    EXPECT_EQ(onlyKey(), "");
}

TEST_F(ActivationTest, OfAnOwnerWhoMayNotReadIsForgottenByDeliveryThoughItIsDisabled) {
    {
        const ActingFor acting("somebody");
        subscribe(makeFilter(), makeDestination(), {number("SubscriptionState", 4)});
    }
    EXPECT_NE(onlyKey(), "") << "what waits is still delivered";
    strangers.insert("somebody");
    service->review();
    EXPECT_EQ(onlyKey(), "");
}

TEST_F(ActivationTest, EndsByThePolicyToDisable) {
    const ObjectPath subscription = subscribe(makeFilter(), makeDestination(), {number("OnFatalErrorPolicy", 3)});
    ScriptedDelivery::latest().onPolicy(onlyKey(), delivery::OnFatalError::disable);
    EXPECT_EQ(stateOf(get(subscription)), 4U);
    EXPECT_EQ(onlyKey(), "");
    EXPECT_TRUE(set(subscription, number("SubscriptionState", 2)).ok());
    EXPECT_NE(onlyKey(), "");
    deliver("root/test", "Test_Alert", 1, "");
    EXPECT_THAT(postedNumbers(), ElementsAre(1));
}

TEST_F(ActivationTest, EndsByThePolicyToRemove) {
    const ObjectPath subscription = subscribe(makeFilter(), makeDestination(), {number("OnFatalErrorPolicy", 4)});
    ScriptedDelivery::latest().onPolicy(onlyKey(), delivery::OnFatalError::remove);
    EXPECT_EQ(codeOfGet(subscription), CMPI_RC_ERR_NOT_FOUND);
    EXPECT_THAT(lines(), Contains(HasSubstr("subscription removed")));
    reopen();
    EXPECT_THAT(names("CIM_IndicationSubscription"), IsEmpty());
}

TEST_F(ActivationTest, EndsWithItsTime) {
    const ObjectPath subscription =
        subscribe(makeFilter(), makeDestination(), {number("SubscriptionDuration", 1000)});
    const auto left = numberOf(get(subscription), "SubscriptionTimeRemaining");
    EXPECT_LE(left, 1000U);
    EXPECT_GT(left, 900U);
    EXPECT_TRUE(set(subscription, number("SubscriptionDuration", 1)).ok());
    waitForTheEndOf(subscription);
    EXPECT_THAT(lines(), Contains(HasSubstr("its time is over")));
    EXPECT_EQ(onlyKey(), "");
}

TEST_F(ActivationTest, IsNotRestoredAfterItsTime) {
    subscribe(makeFilter(), makeDestination(), {number("SubscriptionDuration", 1)});
    close();
    std::this_thread::sleep_for(std::chrono::milliseconds(1100));
    open();
    EXPECT_THAT(names("CIM_IndicationSubscription"), IsEmpty());
    EXPECT_THAT(ScriptedDelivery::latest().subscriptions, IsEmpty());
}

TEST_F(ActivationTest, KeepsAQueueWhoseAuthoritiesCannotBeRead) {
    makeDestination("secure", "https://127.0.0.1:5990/");
    const std::string key = ScriptedDelivery::latest().destinations.begin()->first;
    authorities = "/nowhere.pem";
    EXPECT_EQ(ScriptedDelivery::latest().destinations.at(key).authorityFile, "");
    service->review();
    EXPECT_EQ(ScriptedDelivery::latest().destinations.at(key).authorityFile, "/nowhere.pem");
}

TEST_F(ActivationTest, IsDoneAThousandTimes) {
    const ObjectPath filter = makeFilter();
    for (unsigned i = 0; i < 1000; ++i) {
        subscribe(filter, makeDestination("listener " + std::to_string(i)));
    }
    EXPECT_EQ(tryToMake("CIM_ListenerDestinationCIMXML", {text("Destination", "http://h/")}).code,
              CMPI_RC_ERR_FAILED);
    EXPECT_EQ(deliver("root/test", "Test_Alert", 1, ""), CMPI_RC_OK);
    EXPECT_THAT(postedNumbers(), SizeIs(1000));
    reopen();
    EXPECT_THAT(names("CIM_IndicationSubscription"), SizeIs(1000));
    EXPECT_EQ(deliver("root/test", "Test_Alert", 2, ""), CMPI_RC_OK);
    EXPECT_THAT(postedNumbers(), SizeIs(1000));
}

TEST_F(ActivationTest, GoesOnWhileOthersComeAndGo) {
    const ObjectPath filter = makeFilter();
    subscribe(filter, makeDestination());
    std::thread deliverer([this] {
        for (unsigned i = 0; i < 200; ++i) {
            EXPECT_EQ(deliver("root/test", "Test_Alert", i, ""), CMPI_RC_OK);
        }
    });
    std::thread reader([this] {
        for (unsigned i = 0; i < 50; ++i) {
            names("CIM_IndicationSubscription");
        }
    });
    const ObjectPath other = makeDestination("other");
    for (unsigned i = 0; i < 20; ++i) {
        EXPECT_TRUE(manager->deleteInstance(subscribe(filter, other)).ok());
    }
    deliverer.join();
    reader.join();
    EXPECT_GE(postedNumbers().size(), 200U);
}

TEST_F(ActivationTest, IsRefusedAfterTheStop) {
    const ObjectPath filter = makeFilter();
    service->stop(std::chrono::milliseconds(0));
    EXPECT_TRUE(ScriptedDelivery::latest().isStopped);
    EXPECT_EQ(manager->deleteInstance(filter).code, CMPI_RC_ERR_FAILED);
    EXPECT_EQ(tryToMake("CIM_ListenerDestinationCIMXML", {text("Destination", "http://h/")}).code,
              CMPI_RC_ERR_FAILED);
}

} // namespace
} // namespace marlo::test
