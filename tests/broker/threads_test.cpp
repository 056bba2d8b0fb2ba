/** @file The threads and locks that providers get from the broker. */
#include "tests/support/BrokerFixture.h"

#include <atomic>
#include <cerrno>
#include <chrono>
#include <cstdint>
#include <stdexcept>
#include <thread>

#include <pthread.h>
#include <time.h>

namespace marlo::test {
namespace {

class Threads : public BrokerFixture {
  protected:
    const CMPIBrokerExtFT* xft = mb->xft;
};

TEST_F(Threads, RunAndGiveTheirValueToWhoJoins) {
    int number = 20;
    void* thread = xft->newThread(
        [](void* argument) -> void* {
            *static_cast<int*>(argument) += 1;
            return argument;
        },
        &number, 0);
    ASSERT_NE(thread, nullptr);
    void* value = nullptr;
    EXPECT_EQ(xft->joinThread(thread, &value), 0);
    EXPECT_EQ(value, &number);
    EXPECT_EQ(number, 21);
}

TEST_F(Threads, RunDetached) {
    static std::atomic<bool> ran;
    ran = false;
    ASSERT_NE(xft->newThread(
                  [](void*) -> void* {
                      ran = true;
                      return nullptr;
                  },
                  nullptr, 1),
              nullptr);
    for (int i = 0; i < 2000 && !ran; ++i) {
        xft->threadSleep(5);
    }
    EXPECT_TRUE(ran);
}

TEST_F(Threads, EndByExitAndByException) {
    void* value = nullptr;
    const CMPIThreadFunc exits = [](void* argument) -> void* {
        static_cast<CMPIBrokerExtFT*>(argument)->exitThread(argument);
        return nullptr;
    };
    auto* table = const_cast<CMPIBrokerExtFT*>(xft);
    EXPECT_EQ(xft->joinThread(xft->newThread(exits, table, 0), &value), 0);
    EXPECT_EQ(value, table);
    testing::internal::CaptureStderr();
    void* thrown = xft->newThread([](void*) -> void* { throw std::runtime_error("the cause"); }, nullptr, 0);
    EXPECT_EQ(xft->joinThread(thrown, &value), 0);
    void* odd = xft->newThread([](void*) -> void* { throw 1; }, nullptr, 0);
    EXPECT_EQ(xft->joinThread(odd, nullptr), 0);
    const std::string said = testing::internal::GetCapturedStderr();
    EXPECT_EQ(value, nullptr);
    EXPECT_NE(said.find("the cause"), std::string::npos) << said;
    EXPECT_NE(said.find("unknown type"), std::string::npos) << said;
}

TEST_F(Threads, EndWhenCancelled) {
    void* thread = xft->newThread(
        [](void* argument) -> void* {
            for (;;) {
                static_cast<CMPIBrokerExtFT*>(argument)->threadSleep(1000);
            }
        },
        const_cast<CMPIBrokerExtFT*>(xft), 0);
    EXPECT_EQ(xft->cancelThread(thread), 0);
    void* value = nullptr;
    EXPECT_EQ(xft->joinThread(thread, &value), 0);
    EXPECT_EQ(value, PTHREAD_CANCELED);
}

TEST_F(Threads, SleepAsLongAsAsked) {
    const auto before = std::chrono::steady_clock::now();
    EXPECT_EQ(xft->threadSleep(30), 0);
    EXPECT_GE(std::chrono::steady_clock::now() - before, std::chrono::milliseconds(30));
}

TEST_F(Threads, DoOnceWhatIsDoneOnce) {
    static int once;
    static std::atomic<int> count;
    once = 0;
    count = 0;
    std::vector<std::thread> threads;
    for (int i = 0; i < 4; ++i) {
        threads.emplace_back([this] { xft->threadOnce(&once, [] { ++count; }); });
    }
    for (std::thread& thread : threads) {
        thread.join();
    }
    EXPECT_EQ(count, 1);
    EXPECT_EQ(xft->threadOnce(nullptr, nullptr), EINVAL);
}

TEST_F(Threads, HaveValuesOfTheirOwn) {
    static std::atomic<int> cleaned;
    cleaned = 0;
    unsigned key = 0;
    ASSERT_EQ(xft->createThreadKey(&key, [](void*) { ++cleaned; }), 0);
    EXPECT_EQ(xft->getThreadSpecific(key), nullptr);
    std::thread([this, key] {
        int mine = 0;
        EXPECT_EQ(xft->setThreadSpecific(key, &mine), 0);
        EXPECT_EQ(xft->getThreadSpecific(key), &mine);
    }).join();
    EXPECT_EQ(cleaned, 1);
    EXPECT_EQ(xft->getThreadSpecific(key), nullptr);
    EXPECT_EQ(xft->destroyThreadKey(key), 0);
    EXPECT_EQ(xft->createThreadKey(nullptr, nullptr), EINVAL);
}

TEST_F(Threads, ExcludeEachOtherByMutexes) {
    void* mutex = xft->newMutex(0);
    ASSERT_NE(mutex, nullptr);
    int counter = 0;
    std::vector<std::thread> threads;
    for (int t = 0; t < 4; ++t) {
        threads.emplace_back([&] {
            for (int i = 0; i < 1000; ++i) {
                xft->lockMutex(mutex);
                ++counter;
                xft->unlockMutex(mutex);
            }
        });
    }
    for (std::thread& thread : threads) {
        thread.join();
    }
    EXPECT_EQ(counter, 4000);
    xft->destroyMutex(mutex);
}

TEST_F(Threads, WakeEachOtherByConditions) {
    void* mutex = xft->newMutex(0);
    void* condition = xft->newCondition(0);
    bool ready = false;
    std::thread other([&] {
        xft->lockMutex(mutex);
        ready = true;
        EXPECT_EQ(xft->signalCondition(condition), 0);
        xft->unlockMutex(mutex);
    });
    xft->lockMutex(mutex);
    while (!ready) {
        ASSERT_EQ(xft->condWait(condition, mutex), 0);
    }
    timespec end{};
    clock_gettime(CLOCK_REALTIME, &end);
    EXPECT_EQ(xft->timedCondWait(condition, mutex, &end), ETIMEDOUT);
    xft->unlockMutex(mutex);
    other.join();
    xft->destroyCondition(condition);
    xft->destroyMutex(mutex);
}

TEST_F(Threads, RefuseNull) {
    EXPECT_EQ(xft->newThread(nullptr, nullptr, 0), nullptr);
    EXPECT_EQ(xft->joinThread(nullptr, nullptr), ESRCH);
    EXPECT_EQ(xft->cancelThread(nullptr), ESRCH);
    EXPECT_EQ(xft->condWait(nullptr, nullptr), EINVAL);
    EXPECT_EQ(xft->timedCondWait(nullptr, nullptr, nullptr), EINVAL);
    EXPECT_EQ(xft->signalCondition(nullptr), EINVAL);
    xft->lockMutex(nullptr);
    xft->unlockMutex(nullptr);
    xft->destroyMutex(nullptr);
    xft->destroyCondition(nullptr);
}

} // namespace
} // namespace marlo::test
