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

TEST(Concurrency, WritersOfSeveralAdaptersAndReadersDoNotDisturbEachOther) {
    scripted_agent::reset();
    scripted_agent::script().recording = false;
    BrokerSetup setup;
    addAdapters(setup);
    constexpr int ROUNDS = 30;
    std::atomic<int> wrong = 0;
    std::vector<std::thread> threads;
    const auto start = [&](auto work) {
        threads.emplace_back([&wrong, &setup, work] {
            ProviderCalls calls(setup, false);
            for (int i = 0; i < ROUNDS; ++i) {
                const Answer answer = work(calls, i);
                if (answer.code != CMPI_RC_OK || !answer.done) {
                    ++wrong;
                }
            }
        });
    };
    for (const char* adapter : {"eth0", "eth1", "eth2"}) {
        const marlo::ObjectPath path = pathOf(configurationProvider(), adapter);
        const std::string last(1, adapter[3]);
        start([path, last](ProviderCalls& calls, int i) {
            const std::string address = "192.0.2." + last + std::to_string(i % 10);
            return calls.invokeMethod(path, "EnableStatic", {{"IPAddress", strings({address})}});
        });
        start([path, last](ProviderCalls& calls, int) {
            marlo::Instance changed;
            changed.path = path;
            changed.properties = {{"DNSDomain", marlo::Value::string("example" + last + ".org")}};
            return calls.modifyInstance(path, changed);
        });
    }
    start([](ProviderCalls& calls, int) { return calls.enumInstances(configurationProvider()); });
    start([](ProviderCalls& calls, int) {
        return calls.invokeMethod(pathOf(configurationProvider(), "eth1"), "SetDNSServerSearchOrder",
                                  {{"DNSServerSearchOrder", strings({"192.0.2.54"})}});
    });
    for (std::thread& thread : threads) {
        thread.join();
    }
    EXPECT_EQ(wrong, 0);
    using namespace Orv::NodeLexicon;
    for (const std::size_t i : {0U, 1U, 2U}) {
        const scripted_agent::Node& node = scripted_agent::script().nodes[2 + 3 * i];
        // The mask's place is where the methods put the address.
        EXPECT_EQ(node.texts.at(PROP_IPV4_SUBNET_MASK), "192.0.2." + std::to_string(i) + "9");
        EXPECT_EQ(node.texts.at(PROP_DNS_DOMAIN), "example" + std::to_string(i) + ".org");
    }
    EXPECT_EQ(scripted_agent::script().nodes[2].lists.at(PROP_DNS_SERVERS), std::vector<std::string>{"192.0.2.54"});
}

} // namespace
