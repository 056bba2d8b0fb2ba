#include "host/store/Database.h"
#include "tests/delivery/DeliveryFixture.h"
#include "tests/support/Namespace.h"

#include <fstream>
#include <thread>

namespace marlo::delivery {
namespace {

using namespace std::chrono_literals;
using testing::ElementsAre;
using testing::HasSubstr;

class Kept : public DeliveryFixture {
  protected:
    std::int64_t rows(const std::string& table) const {
        store::Database database(file);
        return database.query("SELECT count(*) FROM " + table).firstInteger();
    }

    /** Of the database without its log, in KiB. */
    std::uintmax_t sizeOnDisk() const { return std::filesystem::file_size(file) / 1024; }

    void expectEmptyTables() const {
        EXPECT_TRUE(eventually([this] { return rows("delivery_item") == 0 && rows("delivery_event") == 0; }));
    }
};

TEST_F(Kept, IndicationsSurviveARestart) {
    const Listener listener;
    {
        const auto delivery = open();
        subscribe(*delivery, "a", listener.url());
        post(*delivery, 0, 50);
    }
    const auto delivery = openFor(listener);
    post(*delivery, 50, 50);
    ASSERT_TRUE(listener.await(100));
    EXPECT_EQ(listener.numbers(), upTo(100));
    const auto received = listener.received();
    EXPECT_EQ(received.front().context, received.back().context);
    expectEmptyTables();
}

TEST_F(Kept, NumbersGoOnWhenNothingWaited) {
    const Listener listener;
    for (int run = 0; run < 3; ++run) {
        const auto delivery = openFor(listener);
        post(*delivery, run, 1);
        ASSERT_TRUE(listener.await(static_cast<std::size_t>(run) + 1));
        ASSERT_TRUE(eventually([&] { return countersOf(*delivery).sent == 1; }));
    }
    EXPECT_EQ(listener.numbers(), upTo(3));
}

TEST_F(Kept, PostsAreOnDiskWhenTheWaitIsOver) {
    const Listener listener(Listener::refuse);
    const auto delivery = openFor(listener);
    for (int count = 1; count <= 20; ++count) {
        post(*delivery, count, 1);
        EXPECT_EQ(rows("delivery_item"), count);
        EXPECT_EQ(rows("delivery_event"), count);
    }
}

TEST_F(Kept, PostsThatNobodyWaitsForAreDeliveredAsWell) {
    const Listener listener;
    const auto delivery = openFor(listener);
    delivery->post(std::vector<std::string>{"a"}, alert("x"));
    EXPECT_TRUE(listener.await(1));
}

TEST_F(Kept, PostsOfManyThreadsAreInOrderForEachOfThem) {
    const Listener listener;
    const auto delivery = openFor(listener);
    std::vector<std::thread> threads;
    for (int thread = 0; thread < 8; ++thread) {
        threads.emplace_back([&, thread] { post(*delivery, thread * 1000, 100); });
    }
    for (std::thread& thread : threads) {
        thread.join();
    }
    ASSERT_TRUE(listener.await(800));
    EXPECT_EQ(listener.numbers(), upTo(800));
    std::vector<int> next(8, 0);
    for (const auto& received : listener.received()) {
        const int number = std::stoi(received.property("Description"));
        EXPECT_EQ(number % 1000, next.at(static_cast<std::size_t>(number / 1000))++);
    }
}

TEST_F(Kept, WhatWasAnsweredLeavesTheDisk) {
    const Listener listener;
    const auto delivery = openFor(listener);
    post(*delivery, 0, 300);
    ASSERT_TRUE(listener.await(300));
    expectEmptyTables();
}

TEST_F(Kept, OneEventForManyIsWrittenOnce) {
    const auto delivery = open();
    std::vector<std::string> keys;
    for (int count = 0; count < 1000; ++count) {
        keys.push_back(std::to_string(count));
        subscribe(*delivery, keys.back(), "http://127.0.0.1:1/");
    }
    post(*delivery, 0, 2, keys);
    EXPECT_EQ(rows("delivery_event"), 2);
    EXPECT_EQ(rows("delivery_item"), 2000);
}

TEST_F(Kept, AThousandSubscriptionsOfOneDestinationAreServed) {
    const Listener listener;
    const auto delivery = openFor(listener);
    std::vector<std::string> keys;
    for (int count = 0; count < 1000; ++count) {
        keys.push_back("s" + std::to_string(count));
        delivery->setSubscription({keys.back(), "a", OnFatalError::ignore, {}});
    }
    post(*delivery, 0, 3, keys);
    ASSERT_TRUE(listener.await(3000, 60s));
    EXPECT_EQ(listener.numbers(), upTo(3000));
    expectEmptyTables();
}

TEST_F(Kept, ARemovedDestinationComesBackToAnotherLife) {
    const Listener listener(Listener::refuse);
    const auto delivery = openFor(listener);
    post(*delivery, 0, 5);
    const std::string former = countersOf(*delivery).sequenceContext;
    delivery->removeDestination("a");
    EXPECT_TRUE(delivery->counters().empty());
    post(*delivery, 5, 1); // for nobody
    expectEmptyTables();
    Listener other;
    subscribe(*delivery, "a", other.url());
    post(*delivery, 6, 1);
    ASSERT_TRUE(other.await(1));
    EXPECT_EQ(other.received().front().number, 0);
    EXPECT_NE(other.received().front().context, former);
    EXPECT_EQ(other.received().front().property("Description"), "6");
}

TEST_F(Kept, ARemovedSubscriptionTakesItsIndicationsAlong) {
    Listener listener(Listener::refuse);
    const auto delivery = openFor(listener);
    delivery->setSubscription({"b", "a", OnFatalError::ignore, {}});
    for (int number = 0; number < 6; ++number) {
        post(*delivery, number, 1, {number % 2 == 0 ? "a" : "b"});
    }
    delivery->removeSubscription("b");
    EXPECT_EQ(countersOf(*delivery).queued, 3U);
    listener.setReaction(Listener::accept);
    ASSERT_TRUE(eventually([&] { return countersOf(*delivery).sent == 3; }));
    EXPECT_THAT(once(listener.numbers()), ElementsAre(0, 2, 4));
    expectEmptyTables();
}

TEST_F(Kept, WhatIsNotSetBeforeTheStartIsForgotten) {
    const Listener listener;
    {
        const auto delivery = open();
        subscribe(*delivery, "a", listener.url());
        subscribe(*delivery, "gone", listener.url());
        delivery->setSubscription({"ended", "a", OnFatalError::ignore, {}});
        post(*delivery, 0, 3, {"gone"});
        post(*delivery, 3, 1, {"ended"});
        post(*delivery, 4, 1, {"a"});
    }
    const auto delivery = openFor(listener);
    ASSERT_TRUE(listener.await(1));
    expectEmptyTables();
    EXPECT_EQ(listener.received().size(), 1U);
    EXPECT_EQ(listener.received().front().property("Description"), "4");
    EXPECT_EQ(rows("delivery_destination"), 1);
    EXPECT_EQ(rows("delivery_subscription"), 1);
}

TEST_F(Kept, WhatARemovedDestinationLeftBehindIsRemovedAtTheNextStart) {
    const Listener listener(Listener::refuse);
    {
        const auto delivery = open();
        subscribe(*delivery, "a", listener.url());
        post(*delivery, 0, 5);
    }
    store::Database(file).run("DELETE FROM delivery_destination");
    const auto delivery = openFor(listener);
    expectEmptyTables();
    EXPECT_EQ(countersOf(*delivery).queued, 0U);
}

TEST_F(Kept, AFullQueueDropsTheOldestAndSaysSo) {
    options.queueLength = 10;
    Listener listener(Listener::refuse);
    const auto delivery = openFor(listener);
    post(*delivery, 0, 1);
    ASSERT_TRUE(listener.await(1));
    post(*delivery, 1, 24);
    EXPECT_EQ(countersOf(*delivery).queued, 10U);
    EXPECT_EQ(countersOf(*delivery).dropped, 15U);
    EXPECT_TRUE(isLogged("the queue is full with 10 indications"));
    listener.setReaction(Listener::accept);
    ASSERT_TRUE(eventually([&] { return countersOf(*delivery).sent == 11; }));
    EXPECT_TRUE(isLogged("15 indications were dropped"));
    const auto received = listener.received();
    EXPECT_EQ(received.back().number, 25);
    EXPECT_THAT(received.back().body, HasSubstr("CIM_AlertIndication"));
    EXPECT_THAT(received.back().property("Message"), HasSubstr("15 indications for this listener were lost"));
    EXPECT_EQ(received[received.size() - 2].property("Description"), "24");
    expectEmptyTables();
}

TEST_F(Kept, AQueueIsBoundedInBytesAsWell) {
    options.queueBytes = 20000;
    const Listener listener(Listener::refuse);
    const auto delivery = openFor(listener);
    for (int number = 0; number < 20; ++number) {
        delivery->wait(delivery->post(std::vector<std::string>{"a"}, alert(std::string(4000, 'x'))));
    }
    EXPECT_EQ(countersOf(*delivery).queued, 4U);
    EXPECT_LE(countersOf(*delivery).queuedBytes, 20000U);
    EXPECT_EQ(countersOf(*delivery).dropped, 16U);
}

TEST_F(Kept, QueuesLongerThanTheMemoryAreReadBackInOrder) {
    options.memoryBytes = 3000;
    Listener listener(Listener::refuse);
    const auto delivery = openFor(listener);
    post(*delivery, 0, 200);
    listener.setReaction(Listener::accept);
    ASSERT_TRUE(eventually([&] { return countersOf(*delivery).sent == 200; }));
    EXPECT_EQ(once(listener.numbers()), upTo(200));
    EXPECT_EQ(listener.received().back().property("Description"), "199");
}

TEST_F(Kept, ARecordThatCannotBeReadIsCountedAndPassed) {
    options.memoryBytes = 0;
    Listener listener(Listener::refuse);
    const auto delivery = openFor(listener);
    post(*delivery, 0, 3);
    store::Database(file).run("DELETE FROM delivery_event WHERE id = 2");
    listener.setReaction(Listener::accept);
    ASSERT_TRUE(eventually([&] { return countersOf(*delivery).sent == 2; }));
    EXPECT_THAT(once(listener.numbers()), ElementsAre(0, 2));
    EXPECT_EQ(countersOf(*delivery).dropped, 1U);
    EXPECT_TRUE(isLogged("SequenceNumber 1 is lost"));
}

TEST_F(Kept, AStopSendsWhatItCanAndKeepsTheRest) {
    const Listener listener([](const Listener::Received& received) {
        Listener::Reaction reaction = Listener::accept(received);
        reaction.delay = 30ms;
        return reaction;
    });
    auto delivery = openFor(listener);
    post(*delivery, 0, 5);
    delivery->stop(20s);
    EXPECT_EQ(countersOf(*delivery).sent, 5U);
    EXPECT_THROW(post(*delivery, 5, 1), NotKept);
    delivery.reset();
    delivery = openFor(listener);
    post(*delivery, 5, 50);
    delivery->stop(0ms);
    EXPECT_GT(countersOf(*delivery).queued, 0U);
    delivery.reset();
    delivery = openFor(listener);
    ASSERT_TRUE(eventually([&] { return listener.numbers().back() == 54; }));
    EXPECT_EQ(once(listener.numbers()), upTo(55));
}

/** Made smaller in the middle of it, or at its end: less than 4 MiB that are free stay. */
TEST_F(Kept, ABacklogThatIsDeliveredLeavesASmallFile) {
    Listener listener(Listener::refuse);
    auto delivery = openFor(listener);
    for (int number = 0; number < 400; ++number) {
        delivery->post(std::vector<std::string>{"a"}, alert(std::to_string(number) + std::string(40000, 'x')));
    }
    post(*delivery, 400, 1);
    store::Database(file).script("PRAGMA wal_checkpoint(RESTART)");
    EXPECT_GT(sizeOnDisk(), 15000U);
    listener.setReaction(Listener::accept);
    ASSERT_TRUE(eventually([&] { return countersOf(*delivery).sent == 401; }));
    EXPECT_TRUE(eventually([&] { return sizeOnDisk() < 5000; })) << sizeOnDisk();
    post(*delivery, 401, 20); // what was made smaller goes on being written
    delivery.reset();
    delivery = openFor(listener);
    post(*delivery, 421, 1);
    ASSERT_TRUE(eventually([&] { return listener.numbers().back() == 421; }));
    EXPECT_EQ(once(listener.numbers()), upTo(422));
    EXPECT_FALSE(isLogged("stays as large as it is"));
}

/** As a process leaves it that ends right behind a backlog, or that never gave anything back. */
TEST_F(Kept, AFileThatIsLargeForNothingIsMadeSmallAfterTheStart) {
    {
        open();
        store::Database database(file);
        database.script("CREATE TABLE ballast (bytes BLOB); INSERT INTO ballast VALUES (zeroblob(10000000))");
        database.script("DROP TABLE ballast; PRAGMA wal_checkpoint(RESTART)");
    }
    EXPECT_GT(sizeOnDisk(), 9000U);
    const Listener listener;
    const auto delivery = openFor(listener);
    EXPECT_TRUE(eventually([&] { return sizeOnDisk() < 1000; })) << sizeOnDisk();
    post(*delivery, 0, 1);
    EXPECT_TRUE(listener.await(1));
}

TEST_F(Kept, TwoProcessesCannotDeliverFromOneDatabase) {
    const auto delivery = open();
    try {
        open();
        FAIL();
    } catch (const std::runtime_error& error) {
        EXPECT_THAT(error.what(), HasSubstr(file + ": another process delivers"));
    }
}

TEST_F(Kept, WrongSettingsAreRefused) {
    const auto delivery = open();
    EXPECT_THROW(delivery->setDestination({"a", "ftp://x/", true, {}}), std::invalid_argument);
    EXPECT_THROW(delivery->setDestination({"a", "https://x/", true, "/none.pem"}), std::invalid_argument);
    EXPECT_THROW(delivery->setSubscription({"s", "a", OnFatalError::ignore, {}}), std::invalid_argument);
    EXPECT_TRUE(delivery->counters().empty());
}

/** What is posted in a thread that is in a namespace with a small disk of its own. */
TEST_F(Kept, AFullDiskIsSaidAndGetsOverIt) {
    REQUIRE_NAMESPACES();
    const Orv::Test::Namespace space;
    space.run([this] {
        ASSERT_EQ(std::system("ip link set lo up && mount -t tmpfs -o size=6m none /mnt"), 0); // seen in there alone
        Listener listener(Listener::refuse);
        Delivery delivery(
            "/mnt/marlo.db", options, [](const std::string& /*key*/, OnFatalError /*policy*/) {},
            [](const std::string& /*line*/) {});
        subscribe(delivery, "a", listener.url());
        delivery.start();
        std::vector<std::string> kept;
        int refused = 0;
        for (int number = 0; number < 400; ++number) {
            const std::string text = std::to_string(number) + std::string(20000, 'x');
            try {
                delivery.wait(delivery.post(std::vector<std::string>{"a"}, alert(text)));
                kept.push_back(text);
            } catch (const NotKept& error) {
                EXPECT_THAT(error.what(), HasSubstr("full"));
                ++refused;
            }
        }
        EXPECT_GT(kept.size(), 10U);
        EXPECT_GT(refused, 10);
        EXPECT_EQ(countersOf(delivery).queued, kept.size());
        EXPECT_EQ(countersOf(delivery).dropped, static_cast<std::uint64_t>(refused));
        listener.setReaction(Listener::accept);
        ASSERT_TRUE(eventually([&] { return countersOf(delivery).sent == kept.size(); }));
        std::vector<std::string> came;
        for (const auto& received : listener.received()) {
            if (came.empty() || came.back() != received.property("Description")) {
                came.push_back(received.property("Description"));
            }
        }
        EXPECT_EQ(came == kept, true) << came.size() << " " << kept.size();
        ASSERT_EQ(std::system("mount -o remount,size=40m /mnt"), 0);
        EXPECT_TRUE(eventually([&] {
            try {
                delivery.wait(delivery.post(std::vector<std::string>{"a"}, alert("after")));
                return true;
            } catch (const NotKept&) {
                return false;
            }
        }));
        ASSERT_TRUE(eventually([&] { return listener.received().back().property("Description") == "after"; }));
        delivery.stop(0ms);
    });
}

} // namespace
} // namespace marlo::delivery
