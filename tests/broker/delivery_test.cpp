/** @file Indications on their way from providers to subscribers. */
#include "tests/broker/Alerts.h"

#include <algorithm>
#include <atomic>
#include <chrono>
#include <numeric>
#include <thread>

#include <gmock/gmock.h>
#include <malloc.h>

namespace marlo::test {
namespace {

using testing::ElementsAre;
using testing::HasSubstr;
using testing::IsEmpty;
using testing::SizeIs;

constexpr const char* allAlerts = "SELECT * FROM Test_Alert";

std::string textOf(const Instance& instance) {
    std::string text = instance.path.toString();
    for (const NamedValue& property : instance.properties) {
        text += " " + property.name + "=" + toText(property.value);
    }
    return text;
}

class DeliveryTest : public AlertsTest {
  protected:
    void SetUp() override { provide("FirstAlerts", "\"Test_Alert\", \"Test_LoudAlert\", \"Test_QuietAlert\""); }

    void waitForBurst(unsigned count) {
        const auto end = std::chrono::steady_clock::now() + std::chrono::seconds(120);
        while (ended() < count && std::chrono::steady_clock::now() < end) {
            std::this_thread::sleep_for(std::chrono::milliseconds(1));
        }
        ASSERT_EQ(ended(), count);
    }
};

TEST_F(DeliveryTest, ReachesEverySubscriptionThatWantsItOnce) {
    Mailbox all;
    Mailbox many;
    Mailbox loud;
    Mailbox selected;
    subscribe(allAlerts, all);
    subscribe("SELECT * FROM Test_Alert WHERE Number >= 2 AND Text = 'text'", many);
    subscribe("SELECT * FROM Test_LoudAlert", loud);
    subscribe("SELECT number FROM Test_Alert WHERE __this ISA Test_LoudAlert", selected);
    EXPECT_EQ(deliver("root/test", "Test_QuietAlert", 1, ""), CMPI_RC_OK);
    EXPECT_EQ(deliver("ROOT/test", "test_loudalert", 2, ""), CMPI_RC_OK);
    ASSERT_THAT(all.received(), SizeIs(2));
    EXPECT_EQ(textOf(all.received()[0]), "root/test:Test_QuietAlert Number=1 Text=\"text\"");
    EXPECT_EQ(textOf(all.received()[1]), "root/test:Test_LoudAlert Number=2 Text=\"text\"");
    EXPECT_THAT(many.numbers(), ElementsAre(2));
    EXPECT_THAT(loud.numbers(), ElementsAre(2));
    ASSERT_THAT(selected.received(), SizeIs(1));
    EXPECT_EQ(textOf(selected.received()[0]), "root/test:Test_LoudAlert Number=2");
}

TEST_F(DeliveryTest, DropsPropertiesThatTheClassHasNot) {
    Mailbox mailbox;
    subscribe(allAlerts, mailbox);
    EXPECT_EQ(deliver("root/test", "Test_Alert", 1, "Nowhere=x"), CMPI_RC_OK);
    EXPECT_EQ(deliver("root/test", "Test_Alert", 2, "Severity=high"), CMPI_RC_OK);
    EXPECT_EQ(deliver("root/test", "Test_Alert", 3, "List=no array"), CMPI_RC_OK);
    ASSERT_THAT(mailbox.received(), SizeIs(3));
    EXPECT_EQ(textOf(mailbox.received()[0]), "root/test:Test_Alert Number=1 Text=\"text\"");
    EXPECT_EQ(textOf(mailbox.received()[1]), "root/test:Test_Alert Number=2 Text=\"text\"");
    EXPECT_EQ(textOf(mailbox.received()[2]), "root/test:Test_Alert Number=3 Text=\"text\"");
    EXPECT_THAT(
        site.lines(),
        ElementsAre("provider FirstAlerts: left out the property 'Nowhere', which Test_Alert does not have",
                    "provider FirstAlerts: left out the value of Test_Alert.Severity, which is of type string "
                    "and not uint16",
                    "provider FirstAlerts: left out the value of Test_Alert.List, which is of type string and "
                    "not string[]"));
}

TEST_F(DeliveryTest, RefusesWhatIsNoIndication) {
    Mailbox mailbox;
    subscribe(allAlerts, mailbox);
    EXPECT_EQ(deliver("root/test", "Test_Nowhere", 1, ""), CMPI_RC_ERR_INVALID_CLASS);
    EXPECT_EQ(deliver("root/test", "Test_Base", 1, ""), CMPI_RC_ERR_INVALID_CLASS);
    EXPECT_EQ(deliver("root/test", "Test_Indication", 1, ""), CMPI_RC_ERR_INVALID_CLASS);
    EXPECT_EQ(deliver("root/nowhere", "Test_Alert", 1, ""), CMPI_RC_ERR_INVALID_NAMESPACE);
    EXPECT_EQ(deliver("root/other", "Test_Alert", 1, ""), CMPI_RC_ERR_INVALID_CLASS);
    EXPECT_THAT(mailbox.received(), IsEmpty());
    EXPECT_THAT(site.lines(), SizeIs(5));
    EXPECT_THAT(site.lines()[1], HasSubstr("an indication is dropped: Test_Base is not a class of indications"));
}

TEST_F(DeliveryTest, IsFineWithoutSubscribers) {
    Mailbox mailbox;
    const SubscriptionId id = subscribe(allAlerts, mailbox);
    EXPECT_TRUE(manager->unsubscribe(id).ok());
    EXPECT_EQ(deliver("root/test", "Test_Alert", 1, ""), CMPI_RC_OK);
    EXPECT_THAT(mailbox.received(), IsEmpty());
}

TEST_F(DeliveryTest, MayHappenWhileTheProviderIsBeingTold) {
    letMisbehave("FirstAlerts", "deliver", 1);
    Mailbox mailbox;
    subscribe("SELECT * FROM Test_LoudAlert", mailbox);
    EXPECT_THAT(mailbox.numbers(), ElementsAre(1));
}

TEST_F(DeliveryTest, RefusesASinkThatSubscribesWhileItsProviderIsBeingTold) {
    letMisbehave("FirstAlerts", "deliver", 1);
    Status inner;
    SubscriptionId id = 0;
    const auto sink = [&](Instance&&) {
        SubscriptionId innerId = 0;
        inner = manager->subscribe(
            "root/test", allAlerts, "WQL", [](Instance&&) {}, innerId);
    };
    EXPECT_TRUE(manager->subscribe("root/test", "SELECT * FROM Test_LoudAlert", "WQL", sink, id).ok());
    EXPECT_EQ(inner.code, CMPI_RC_ERR_FAILED);
    EXPECT_THAT(inner.message, HasSubstr("being told"));
}

TEST_F(DeliveryTest, TellsTheProviderWhenASubscriberThrowsAndServesTheOthers) {
    Mailbox before;
    Mailbox after;
    SubscriptionId id = 0;
    subscribe(allAlerts, before);
    const auto sink = [](Instance&&) { throw std::runtime_error("full"); };
    ASSERT_TRUE(manager->subscribe("root/test", allAlerts, "WQL", sink, id).ok());
    subscribe(allAlerts, after);
    EXPECT_EQ(deliver("root/test", "Test_Alert", 1, ""), CMPI_RC_ERR_FAILED);
    EXPECT_THAT(before.numbers(), ElementsAre(1));
    EXPECT_THAT(after.numbers(), ElementsAre(1));
    EXPECT_THAT(site.lines(), ElementsAre("a subscriber threw: full"));
}

TEST_F(DeliveryTest, DoesWhatSinksLeaveOnceBehindThemAll) {
    std::vector<std::string> steps;
    const auto sinkOf = [&steps](const std::string& name, const void* owner) {
        return [&steps, name, owner](Instance&&, DeliveryRound& round) {
            steps.push_back(name);
            round.afterwards(owner, [&steps, name] { steps.push_back("after " + name); });
        };
    };
    const int one = 0;
    const int other = 0;
    SubscriptionId id = 0;
    ASSERT_TRUE(manager->subscribe("root/test", allAlerts, "WQL", sinkOf("first", &one), id).ok());
    ASSERT_TRUE(manager->subscribe("root/test", allAlerts, "WQL", sinkOf("second", &other), id).ok());
    ASSERT_TRUE(manager->subscribe("root/test", allAlerts, "WQL", sinkOf("third", &one), id).ok());
    EXPECT_EQ(deliver("root/test", "Test_Alert", 1, ""), CMPI_RC_OK);
    EXPECT_THAT(steps, ElementsAre("first", "second", "third", "after third", "after second"));
}

TEST_F(DeliveryTest, TellsTheProviderWhenWhatWasLeftFails) {
    SubscriptionId id = 0;
    int done = 0;
    const auto full = [](Instance&&, DeliveryRound& round) {
        round.afterwards(&round, [] { throw std::runtime_error("no room"); });
    };
    const auto fine = [&done](Instance&&, DeliveryRound& round) { round.afterwards(&done, [&done] { ++done; }); };
    ASSERT_TRUE(manager->subscribe("root/test", allAlerts, "WQL", full, id).ok());
    ASSERT_TRUE(manager->subscribe("root/test", allAlerts, "WQL", fine, id).ok());
    EXPECT_EQ(deliver("root/test", "Test_Alert", 1, ""), CMPI_RC_ERR_FAILED);
    EXPECT_EQ(done, 1);
    EXPECT_THAT(site.lines(), ElementsAre("a subscriber threw: no room"));
}

TEST_F(DeliveryTest, EndsBeforeUnsubscribingReturns) {
    std::atomic<bool> entered{false};
    std::atomic<bool> left{false};
    SubscriptionId id = 0;
    const auto sink = [&](Instance&&) {
        entered = true;
        std::this_thread::sleep_for(std::chrono::milliseconds(50));
        left = true;
    };
    ASSERT_TRUE(manager->subscribe("root/test", allAlerts, "WQL", sink, id).ok());
    std::thread deliverer([this] { deliver("root/test", "Test_Alert", 1, ""); });
    while (!entered) {
        std::this_thread::yield();
    }
    EXPECT_TRUE(manager->unsubscribe(id).ok());
    EXPECT_TRUE(left);
    deliverer.join();
}

TEST_F(DeliveryTest, MayUnsubscribeFromWithinTheSink) {
    SubscriptionId id = 0;
    int received = 0;
    const auto sink = [&](Instance&&) {
        ++received;
        EXPECT_TRUE(manager->unsubscribe(id).ok());
    };
    ASSERT_TRUE(manager->subscribe("root/test", allAlerts, "WQL", sink, id).ok());
    EXPECT_EQ(deliver("root/test", "Test_Alert", 1, ""), CMPI_RC_OK);
    EXPECT_EQ(deliver("root/test", "Test_Alert", 2, ""), CMPI_RC_OK);
    EXPECT_EQ(received, 1);
}

TEST_F(DeliveryTest, KeepsTheOrderOfEachThread) {
    Mailbox mailbox;
    subscribe(allAlerts, mailbox);
    constexpr unsigned each = 500;
    std::vector<std::thread> threads;
    for (unsigned t = 0; t < 4; ++t) {
        threads.emplace_back([this, t] {
            for (unsigned i = 0; i < each; ++i) {
                deliver("root/test", "Test_Alert", t * each + i, "");
            }
        });
    }
    for (std::thread& thread : threads) {
        thread.join();
    }
    const auto numbers = mailbox.numbers();
    ASSERT_THAT(numbers, SizeIs(4 * each));
    for (unsigned t = 0; t < 4; ++t) {
        std::vector<unsigned> ofThread;
        std::copy_if(numbers.begin(), numbers.end(), std::back_inserter(ofThread),
                     [t](unsigned number) { return number / each == t; });
        EXPECT_THAT(ofThread, SizeIs(each));
        EXPECT_TRUE(std::is_sorted(ofThread.begin(), ofThread.end()));
    }
}

TEST_F(DeliveryTest, ServesADetachedThreadPerEvent) {
    constexpr unsigned count = 10'000;
    Mailbox mailbox;
    subscribe(allAlerts, mailbox);
    burst("Test_Alert", count);
    waitForBurst(count);
    EXPECT_EQ(failed(), 0U);
    auto numbers = mailbox.numbers();
    std::sort(numbers.begin(), numbers.end());
    std::vector<unsigned> expected(count);
    std::iota(expected.begin(), expected.end(), 0U);
    EXPECT_EQ(numbers, expected);
}

/** Contexts that are prepared and detached for each event are released, as is what each thread created. */
TEST_F(DeliveryTest, LeavesNothingOfAnEventBehind) {
    SubscriptionId id = 0;
    std::atomic<unsigned> received{0};
    ASSERT_TRUE(manager
                    ->subscribe(
                        "root/test", allAlerts, "WQL", [&](Instance&&) { ++received; }, id)
                    .ok());
    burst("Test_Alert", 1000);
    waitForBurst(1000);
    const std::size_t before = mallinfo2().uordblks;
    for (unsigned i = 0; i < 10'000; ++i) {
        ASSERT_EQ(deliver("root/test", "Test_Alert", i, ""), CMPI_RC_OK);
    }
    burst("Test_Alert", 5000);
    waitForBurst(5000);
    const std::size_t after = mallinfo2().uordblks;
    EXPECT_EQ(received, 16'000U);
    EXPECT_LT(after, before + 100'000) << before << " bytes before"; // a context alone takes several hundred
}

TEST_F(DeliveryTest, GoesOnWhileOthersSubscribeAndUnsubscribe) {
    Mailbox steady;
    subscribe(allAlerts, steady);
    std::atomic<bool> over{false};
    std::vector<std::thread> threads;
    for (int t = 0; t < 2; ++t) {
        threads.emplace_back([this, &over] {
            while (!over) {
                Mailbox passing;
                const SubscriptionId id = subscribe(allAlerts, passing);
                EXPECT_TRUE(manager->unsubscribe(id).ok());
            }
        });
    }
    for (unsigned i = 0; i < 500; ++i) {
        EXPECT_EQ(deliver("root/test", "Test_Alert", i, ""), CMPI_RC_OK);
    }
    over = true;
    for (std::thread& thread : threads) {
        thread.join();
    }
    EXPECT_THAT(steady.received(), SizeIs(500));
}

TEST_F(DeliveryTest, OfRunningThreadsIsWaitedForAtTheEndOfTheObjectManager) {
    Mailbox mailbox;
    subscribe(allAlerts, mailbox);
    burst("Test_Alert", 50);
    manager.reset();
    EXPECT_EQ(ended(), 50U);
}

TEST_F(DeliveryTest, IsRefusedAfterTheEndOfTheObjectManager) {
    Mailbox mailbox;
    subscribe(allAlerts, mailbox);
    hold(1);
    burst("Test_Alert", 3);
    const auto before = std::chrono::steady_clock::now();
    manager.reset();
    EXPECT_LT(std::chrono::steady_clock::now() - before, std::chrono::seconds(20));
    EXPECT_EQ(ended(), 0U);
    hold(0);
    waitForBurst(3);
    EXPECT_EQ(failed(), 3U);
    EXPECT_THAT(mailbox.received(), IsEmpty());
}

} // namespace
} // namespace marlo::test
