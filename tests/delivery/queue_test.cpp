#include "host/delivery/Queue.h"

#include <gmock/gmock.h>
#include <gtest/gtest.h>

namespace marlo::delivery {
namespace {

using testing::ElementsAre;
using testing::IsEmpty;

/** A queue whose items have ten bytes each and are all on disk. */
class Queues : public testing::Test {
  protected:
    void append(int count, std::int64_t subscription = 1) {
        for (int made = 0; made < count; ++made) {
            auto event = std::make_shared<Event>();
            event->bytes = 10;
            queue.append(event, subscription, 0);
        }
        queue.keptUpTo(queue.next());
    }

    std::vector<std::int64_t> numbers() const {
        std::vector<std::int64_t> all;
        for (const Item& item : queue.items()) {
            all.push_back(item.number);
        }
        return all;
    }

    Queue queue{7, "context", 100};
};

TEST_F(Queues, GoOnWithTheirNumbers) {
    append(3);
    EXPECT_THAT(numbers(), ElementsAre(100, 101, 102));
    EXPECT_EQ(queue.bytes(), 30U);
    auto event = std::make_shared<Event>();
    queue.restore({200, event, 1, 0});
    EXPECT_EQ(queue.next(), 201);
    EXPECT_EQ(event->waiting, 1U);
}

TEST_F(Queues, HandOutOnlyWhatIsOnDisk) {
    queue.append(std::make_shared<Event>(), 1, 0);
    EXPECT_EQ(queue.begin(), nullptr);
    queue.keptUpTo(101);
    ASSERT_NE(queue.begin(), nullptr);
    EXPECT_EQ(queue.begin(), nullptr) << "it is on its way already";
    queue.giveBack();
    EXPECT_EQ(queue.begin()->number, 100);
}

TEST_F(Queues, EndOnlyWhatIsOnItsWay) {
    append(2);
    EXPECT_FALSE(queue.end(100));
    queue.begin();
    EXPECT_FALSE(queue.end(101));
    EXPECT_EQ(queue.end(100)->number, 100);
    EXPECT_THAT(numbers(), ElementsAre(101));
    EXPECT_EQ(queue.bytes(), 10U);
}

TEST_F(Queues, DropTheOldestButNotWhatIsOnItsWay) {
    append(3);
    EXPECT_EQ(queue.takeOldest()->number, 100);
    queue.begin();
    EXPECT_EQ(queue.takeOldest()->number, 102);
    EXPECT_FALSE(queue.takeOldest());
    EXPECT_THAT(numbers(), ElementsAre(101));
}

TEST_F(Queues, LoseTheItemsOfOneSubscription) {
    append(1, 1);
    append(1, 2);
    append(1, 1);
    queue.begin();
    const auto taken = queue.takeOf(1);
    ASSERT_EQ(taken.size(), 2U);
    EXPECT_EQ(taken[1].number, 102);
    EXPECT_FALSE(queue.end(100)) << "what was on its way is not there any more";
    EXPECT_EQ(queue.begin()->number, 101);
    EXPECT_EQ(queue.bytes(), 10U);
}

TEST_F(Queues, LoseOneItem) {
    append(3);
    EXPECT_EQ(queue.take(101)->number, 101);
    EXPECT_FALSE(queue.take(101));
    EXPECT_FALSE(queue.take(103));
    EXPECT_THAT(numbers(), ElementsAre(100, 102));
    EXPECT_EQ(queue.takeAll().size(), 2U);
    EXPECT_EQ(queue.bytes(), 0U);
    EXPECT_THAT(numbers(), IsEmpty());
}

} // namespace
} // namespace marlo::delivery
