/** Object managers call providers on any thread, and several at once. */
#include "tests/provider/Scene.h"

#include <atomic>
#include <thread>

#include <gtest/gtest.h>

namespace {

using namespace provider_test;

TEST(Concurrency, CallsOnManyThreadsAreEachAnsweredInFull) {
    scripted_agent::reset();
    scripted_agent::script().recording = false;
    BrokerSetup setup;
    addAdapters(setup);
    constexpr int THREADS = 8;
    constexpr int ROUNDS = 20;
    std::atomic<int> wrong = 0;
    std::atomic<int> answered = 0;
    const auto work = [&](int number) {
        ProviderCalls calls(setup, false);
        const std::vector<ReadCall> all = allReadCalls();
        for (int i = 0; i < ROUNDS; ++i) {
            const ReadCall& call = all[static_cast<std::size_t>(number + i) % all.size()];
            const Answer answer = call.run(calls);
            const std::size_t size = answer.instances.size() + answer.paths.size();
            const std::size_t expected = call.operation == "GetInstance" ? 1 : 3;
            if (answer.code != CMPI_RC_OK || !answer.done || size != expected) {
                ++wrong;
            }
            ++answered;
        }
    };
    std::vector<std::thread> threads;
    for (int i = 0; i < THREADS; ++i) {
        threads.emplace_back(work, i);
    }
    for (std::thread& thread : threads) {
        thread.join();
    }
    EXPECT_EQ(wrong, 0);
    EXPECT_EQ(answered, THREADS * ROUNDS);
}

TEST(Concurrency, FactoriesAndCleanupsRunBesideCalls) {
    scripted_agent::reset();
    scripted_agent::script().recording = false;
    BrokerSetup setup;
    addAdapters(setup);
    std::atomic<bool> stop = false;
    std::thread other([&] {
        while (!stop) {
            for (const Subject& subject : allProviders()) {
                CMPIInstanceMI* mi = createInstanceMI(subject.unit(), setup.real.handle());
                (void)mi->ft->cleanup(mi, nullptr, 0);
            }
            (void)createMethodMI(setup.real.handle());
            (void)createIndicationMI(setup.real.handle());
        }
    });
    ProviderCalls calls(setup, false);
    for (int i = 0; i < 50; ++i) {
        for (const Subject& subject : allProviders()) {
            EXPECT_EQ(calls.enumInstances(subject).instances.size(), 3U);
        }
    }
    stop = true;
    other.join();
}

} // namespace
