#include "agent/library/SystemName.h"

#include <atomic>
#include <chrono>
#include <thread>
#include <vector>

#include <gtest/gtest.h>

namespace {

using namespace std::chrono_literals;
using Orv::Agent::SystemName;

struct SystemNameTest : testing::Test {
    SystemName::LookUp answering(std::optional<std::string> answer) {
        return [this, answer](const std::string& hostName) {
            ++lookUps;
            lastAsked = hostName;
            return answer;
        };
    }

    std::atomic<int> lookUps{0};
    std::string lastAsked;
};

TEST_F(SystemNameTest, IsTheFullyQualifiedName) {
    SystemName name(answering("lab.example.org"), 10s, 1h);
    EXPECT_EQ(name.get("lab"), "lab.example.org");
    EXPECT_EQ(lastAsked, "lab");
}

TEST_F(SystemNameTest, IsTheHostNameWhenNothingIsKnown) {
    SystemName name(answering(std::nullopt), 10s, 1h);
    EXPECT_EQ(name.get("lab"), "lab");
}

TEST_F(SystemNameTest, IsTheHostNameWhenTheNameServicesKnowNoDomain) {
    SystemName name(answering("lab2"), 10s, 1h);
    EXPECT_EQ(name.get("lab"), "lab");
}

TEST_F(SystemNameTest, IsNotANameOfTheLoopback) {
    SystemName name(answering("localhost.localdomain"), 10s, 1h);
    EXPECT_EQ(name.get("lab"), "lab");
}

TEST_F(SystemNameTest, AsksNobodyAboutAHostNameThatIsQualifiedItself) {
    SystemName name(answering("other.example.org"), 10s, 1h);
    EXPECT_EQ(name.get("lab.example.net"), "lab.example.net");
    EXPECT_EQ(lookUps, 0);
}

TEST_F(SystemNameTest, IsLookedUpOnce) {
    SystemName name(answering("lab.example.org"), 10s, 0s);
    for (int i = 0; i < 100; ++i) {
        EXPECT_EQ(name.get("lab"), "lab.example.org");
    }
    EXPECT_EQ(lookUps, 1);
}

TEST_F(SystemNameTest, IsLookedUpAgainForAnotherHostName) {
    SystemName name([](const std::string& host) { return std::optional(host + ".example.org"); }, 10s, 1h);
    EXPECT_EQ(name.get("one"), "one.example.org");
    EXPECT_EQ(name.get("two"), "two.example.org");
}

TEST_F(SystemNameTest, RemembersForAWhileThatNothingIsKnown) {
    SystemName name(answering(std::nullopt), 10s, 1h);
    name.get("lab");
    name.get("lab");
    EXPECT_EQ(lookUps, 1);
}

TEST_F(SystemNameTest, AsksAgainAfterAWhileWhenNothingWasKnown) {
    SystemName name(answering(std::nullopt), 10s, 0s);
    name.get("lab");
    name.get("lab");
    EXPECT_EQ(lookUps, 2);
}

/** Answers when it is told to. */
struct SlowNameService {
    std::shared_ptr<std::atomic<bool>> mayAnswer = std::make_shared<std::atomic<bool>>(false);
    std::shared_ptr<std::atomic<int>> lookUps = std::make_shared<std::atomic<int>>(0);

    std::optional<std::string> operator()(const std::string&) const {
        ++*lookUps;
        while (!*mayAnswer) {
            std::this_thread::sleep_for(1ms);
        }
        return "lab.example.org";
    }
};

TEST(SystemNameOfSlowServices, IsTheHostNameUntilTheAnswerComes) {
    const SlowNameService service;
    SystemName name(service, 20ms, 0s);
    EXPECT_EQ(name.get("lab"), "lab");
    *service.mayAnswer = true;
    const auto patience = std::chrono::steady_clock::now() + 10s;
    while (name.get("lab") == "lab" && std::chrono::steady_clock::now() < patience) {
        std::this_thread::sleep_for(1ms);
    }
    EXPECT_EQ(name.get("lab"), "lab.example.org");
    EXPECT_EQ(*service.lookUps, 1);
}

TEST(SystemNameOfSlowServices, IsWaitedForOnceOnly) {
    const SlowNameService service;
    SystemName name(service, 200ms, 0s);
    name.get("lab");
    const auto start = std::chrono::steady_clock::now();
    for (int i = 0; i < 100; ++i) {
        name.get("lab");
    }
    EXPECT_LT(std::chrono::steady_clock::now() - start, 5s); // a hundred waits would be twenty seconds
    *service.mayAnswer = true;
}

TEST(SystemNameOfManyThreads, IsOneNameFromOneLookUp) {
    const SlowNameService service;
    SystemName name(service, 30s, 1h);
    std::vector<std::thread> threads;
    std::atomic<int> right{0};
    for (int i = 0; i < 8; ++i) {
        threads.emplace_back([&] { right += name.get("lab") == "lab.example.org" ? 1 : 0; });
    }
    std::this_thread::sleep_for(20ms);
    *service.mayAnswer = true;
    for (auto& thread : threads) {
        thread.join();
    }
    EXPECT_EQ(right, 8);
    EXPECT_EQ(*service.lookUps, 1);
}

TEST(HostName, IsWhatTheKernelSays) {
    EXPECT_FALSE(Orv::Agent::readHostName().empty());
}

TEST(CanonicalName, IsKnownForTheLoopback) {
    EXPECT_NE(Orv::Agent::lookUpCanonicalName("127.0.0.1"), std::nullopt);
}

} // namespace
