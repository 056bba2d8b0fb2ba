// Handing over by a clock that the test turns.
#include "agent/events/Handover.h"
#include "agent/tree/Cursor.h"
#include "tests/agent/EventReader.h"
#include "tests/agent/EventfulBackEnd.h"

#include <thread>

#include <gmock/gmock.h>
#include <gtest/gtest.h>
#include <poll.h>

namespace {

using namespace Orv::Agent;
using namespace std::chrono_literals;
using Orv::Test::EventfulBackEnd;
using Orv::Test::readEvent;
using testing::ElementsAre;
using testing::SizeIs;

struct HandoverTest : testing::Test {
    /** The path of what is handed over now; empty when nothing is. */
    std::string next() {
        const auto delivery = handover.next(now);
        return delivery ? delivery->path : std::string();
    }

    void add(const std::string& name, unsigned int status = 1, EventCode code = EventCode::status) {
        handover.add(EventfulBackEnd::eventOf(name, status, code));
    }

    /** On a thread that ends, as the threads of receivers do. */
    std::string pickUp(const std::string& path) {
        std::string name;
        std::thread([&] { name = readEvent(backEnd, EventCode::status, path).name; }).join();
        return name;
    }

    EventfulBackEnd backEnd;
    std::shared_ptr<const WakeUp> wakeUp = std::make_shared<const WakeUp>();
    HandoverTimes times{4s, 100ms, 250ms};
    std::vector<std::string> reports;
    Handover handover{backEnd.events(), wakeUp, times, [this](int level, const std::string& text) {
                          reports.push_back(std::to_string(level) + ' ' + text);
                      }};
    Handover::Clock::time_point now = Handover::Clock::now();
};

TEST_F(HandoverTest, HandsTheNextOverWhenTheLastHasBeenPickedUp) {
    add("eth0");
    add("eth1");
    const std::string first = next();
    EXPECT_EQ(next(), "");
    now += 3s;
    EXPECT_EQ(next(), "");
    EXPECT_EQ(pickUp(first), "eth0");
    const std::string second = next();
    EXPECT_EQ(pickUp(second), "eth1");
    EXPECT_EQ(next(), "");
    EXPECT_EQ(handover.deadline(), std::nullopt);
    EXPECT_THAT(reports, ElementsAre());
}

TEST_F(HandoverTest, WaitsForTheThreadThatPickedUpToEnd) {
    add("eth0");
    add("eth1");
    const std::string first = next();
    std::string second;
    std::thread([&] {
        readEvent(backEnd, EventCode::status, first);
        std::thread([&] { second = next(); }).join(); // the monitor is another thread
        EXPECT_EQ(second, "") << "the work on the first may not be done";
    }).join();
    EXPECT_NE(next(), "");
}

TEST_F(HandoverTest, WaitsForAThreadThatWasLateToo) {
    add("eth0");
    add("eth1");
    const std::string first = next();
    now += 1s;
    EXPECT_EQ(next(), "");
    std::thread([&] {
        readEvent(backEnd, EventCode::status, first);
        std::string second;
        std::thread([&] { second = next(); }).join();
        EXPECT_EQ(second, "");
        EXPECT_EQ(handover.deadline(), now + times.work);
    }).join();
    EXPECT_NE(next(), "");
}

TEST_F(HandoverTest, IsWokenByAPickUpWhereNoThreadsEndIsAwaited) {
    const auto isAwake = [&] {
        pollfd file{wakeUp->descriptor(), POLLIN, 0};
        return ::poll(&file, 1, 0) == 1;
    };
    add("eth0");
    const std::string first = next();
    std::thread([&] {
        readEvent(backEnd, EventCode::status, first);
        EXPECT_FALSE(isAwake()) << "the thread's end will do";
    }).join();
    EXPECT_TRUE(isAwake());
    wakeUp->clear();
    add("eth1");
    const std::string second = next();
    now += 1s;
    next();
    readEvent(backEnd, EventCode::status, second);
    EXPECT_TRUE(isAwake()) << "it was late";
}

TEST_F(HandoverTest, LearnsThatAReceiversThreadsDoNotEnd) {
    std::string handed;
    const auto onMonitor = [&] { std::thread([&] { handed = next(); }).join(); };
    for (int i = 0; i < 4; ++i) {
        add("eth0");
    }
    onMonitor();
    readEvent(backEnd, EventCode::status, handed);
    onMonitor();
    EXPECT_EQ(handed, "");
    EXPECT_EQ(handover.deadline(), now + 250ms);
    now += 250ms;
    onMonitor();
    EXPECT_NE(handed, "");
    wakeUp->clear();
    readEvent(backEnd, EventCode::status, handed);
    onMonitor();
    EXPECT_NE(handed, "") << "not waited for again";
    pickUp(handed);
    onMonitor();
    EXPECT_NE(handed, "");
    readEvent(backEnd, EventCode::status, handed);
    add("eth0");
    onMonitor();
    EXPECT_EQ(handed, "") << "one has ended";
}

TEST_F(HandoverTest, DoesNotWaitForTheThreadThatHandsOver) {
    add("eth0");
    add("eth1");
    readEvent(backEnd, EventCode::status, next());
    EXPECT_NE(next(), "");
}

TEST_F(HandoverTest, GivesUpAnEventThatIsNotPickedUpAndSaysSo) {
    add("eth0");
    add("eth1");
    const std::string first = next();
    now += 4s - 1ns;
    EXPECT_EQ(next(), "");
    now += 1ns;
    EXPECT_NE(next(), "");
    EXPECT_THAT(reports, ElementsAre("6000 an event of eth0 was handed over and not picked up"));
    EXPECT_EQ(pickUp(first), "eth0") << "late is better than never";
}

TEST_F(HandoverTest, WaitsLessAndLessForAReceiverThatPicksNothingUp) {
    const auto waitFor = [&] {
        add("eth0");
        EXPECT_NE(next(), "");
        const auto start = now;
        while (handover.deadline()) {
            now = *handover.deadline();
            next();
        }
        return now - start;
    };
    EXPECT_EQ(waitFor(), 4s);
    EXPECT_EQ(waitFor(), 1s);
    EXPECT_EQ(waitFor(), 250ms);
    EXPECT_EQ(waitFor(), 100ms);
    EXPECT_EQ(waitFor(), 100ms) << "enough for one that has just been switched on, with nothing else waiting";
    EXPECT_THAT(reports, SizeIs(5));
    EXPECT_TRUE(reports[1].starts_with("4000 ")) << "said aloud once";
}

TEST_F(HandoverTest, BuildsNoBacklogForAReceiverThatPicksNothingUp) {
    for (int i = 0; i < 10000; ++i) {
        add("eth0");
    }
    const auto start = now;
    int handed = 0;
    while (handed < 10000) {
        if (next().empty()) {
            now = *handover.deadline();
        } else {
            ++handed;
        }
    }
    EXPECT_LT(now - start, 7s);
}

TEST_F(HandoverTest, WaitsTheWholeTimeAgainAfterAPickUp) {
    for (int i = 0; i < 5; ++i) {
        add("eth0");
        next();
        while (handover.deadline()) {
            now = *handover.deadline();
            next();
        }
    }
    add("eth0");
    pickUp(next());
    add("eth1");
    EXPECT_NE(next(), "");
    now += 3s;
    add("eth2");
    EXPECT_EQ(next(), "");
}

TEST_F(HandoverTest, WaitsTheWholeTimeAgainAfterAPickUpThatCameTooLate) {
    add("eth0");
    const std::string first = next();
    now += 4s;
    EXPECT_EQ(next(), "");
    pickUp(first);
    add("eth1");
    EXPECT_NE(next(), "");
    now += 3s;
    add("eth2");
    EXPECT_EQ(next(), "");
}

TEST_F(HandoverTest, WaitsForNoPickUpOfOtherEvents) {
    add("eth0", 1, EventCode::address);
    add("eth1", 1, EventCode::name);
    add("eth2");
    const std::string address = next();
    EXPECT_NE(next(), "");
    EXPECT_NE(next(), "");
    EXPECT_EQ(pickUp(address), "eth0") << "but they can be picked up";
}

TEST_F(HandoverTest, KeepsTheOrderOfAllEvents) {
    add("eth0");
    add("eth1", 1, EventCode::address);
    const std::string first = next();
    EXPECT_EQ(next(), "");
    pickUp(first);
    EXPECT_EQ(handover.next(now)->code, EventCode::address);
}

TEST(EventRecords, KeepsTheLatestOnly) {
    EventfulBackEnd backEnd;
    EventRecords& records = backEnd.events();
    const auto receiver = std::make_shared<PickUps>(std::make_shared<const WakeUp>());
    std::vector<std::string> paths;
    for (std::size_t i = 0; i <= EventRecords::keptRecords; ++i) {
        const auto ticket = records.open(EventfulBackEnd::eventOf("eth0", 33), receiver);
        paths.push_back(ticket.path);
        records.close(ticket.number);
    }
    EXPECT_FALSE(records.pickUp(paths[0]));
    EXPECT_TRUE(records.pickUp(paths[1]));
    EXPECT_TRUE(records.pickUp(paths[1])) << "again";
    EXPECT_EQ(receiver->count(), 1U);
}

TEST(EventRecords, KeepsAnOpenOneHoweverManyFollow) {
    EventfulBackEnd backEnd;
    EventRecords& records = backEnd.events();
    const auto receiver = std::make_shared<PickUps>(std::make_shared<const WakeUp>());
    const auto open = records.open(EventfulBackEnd::eventOf("eth0", 33), receiver);
    for (std::size_t i = 0; i < 2 * EventRecords::keptRecords; ++i) {
        records.close(records.open(EventfulBackEnd::eventOf("eth1", 1), receiver).number);
    }
    EXPECT_TRUE(records.pickUp(open.path));
}

TEST(EventRecords, LeadToNoNodeButTheirOwn) {
    EventfulBackEnd backEnd;
    const auto receiver = std::make_shared<PickUps>(std::make_shared<const WakeUp>());
    const auto ticket = backEnd.events().open(EventfulBackEnd::eventOf("eth0", 33), receiver);
    const std::string number = std::to_string(ticket.number);
    EXPECT_EQ(ticket.path, "event/" + number + ":a:eth0");
    const std::vector<std::string> strangers{"event/" + number + ":a:eth1",
                                             "event/" + number,
                                             "event/" + number + ":",
                                             "event/99:a:eth0",
                                             "event/x:a:eth0",
                                             ""};
    for (const std::string& path : strangers) {
        EXPECT_FALSE(backEnd.events().pickUp(path)) << path;
    }
    EXPECT_EQ(EventRecords::livePath(ticket.path), "a:eth0");
    EXPECT_EQ(EventRecords::livePath("a:eth0"), "a:eth0");
}

} // namespace
