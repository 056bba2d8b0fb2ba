/** @file Enumerations that wait to be pulled from: who may, how many, how long. */
#include "host/wbem/Enumerations.h"

#include <atomic>
#include <thread>

#include <gmock/gmock.h>
#include <gtest/gtest.h>

namespace marlo::test {
namespace {

using namespace std::chrono_literals;
using testing::HasSubstr;
using wbem::EnumerationOwner;
using wbem::Enumerations;
using wbem::Pulled;

const EnumerationOwner alice{"alice", "root/test", Pulled::instancesWithPath};

Instance makeInstance(const std::string& name, std::size_t size = 0) {
    return {{"", "root/test", "C", {{"Name", Value::string(name)}}},
            {{"Filling", Value::string(std::string(size, 'x'))}}};
}

std::string open(Enumerations& enumerations, const EnumerationOwner& owner, int count,
                 std::chrono::seconds timeout = 60s) {
    auto held = enumerations.begin(owner, false);
    for (int i = 0; i < count; ++i) {
        held->add(makeInstance(std::to_string(i)));
    }
    std::string context = enumerations.keep(std::move(held), timeout);
    enumerations.await(context);
    return context;
}

/** The status of what refuses, and nothing of what does not. */
template <typename Operation>
CMPIrc refusal(const Operation& operation, std::string* reason = nullptr) {
    try {
        operation();
    } catch (const RequestError& error) {
        if (reason != nullptr) {
            *reason = error.what();
        }
        return error.code();
    }
    return CMPI_RC_OK;
}

std::vector<std::string> namesOf(const Enumerations::Batch& batch) {
    std::vector<std::string> names;
    for (const Instance& object : batch.objects) {
        names.push_back(std::get<std::string>(object.path.keys.at(0).value.data));
    }
    return names;
}

TEST(Enumerations, GiveEachObjectOnceInOrder) {
    Enumerations enumerations({});
    const std::string context = open(enumerations, alice, 5);
    EXPECT_THAT(namesOf(enumerations.pull(context, alice, 2)), testing::ElementsAre("0", "1"));
    EXPECT_THAT(namesOf(enumerations.pull(context, alice, 0)), testing::ElementsAre());
    const auto batch = enumerations.pull(context, alice, 3);
    EXPECT_THAT(namesOf(batch), testing::ElementsAre("2", "3", "4"));
    EXPECT_TRUE(batch.last);
    EXPECT_EQ(refusal([&] { static_cast<void>(enumerations.pull(context, alice, 1)); }),
              wbem::invalidEnumerationContext);
    EXPECT_EQ(enumerations.size(), 0U);
}

TEST(Enumerations, HaveContextsThatNobodyCanGuess) {
    Enumerations enumerations({});
    const std::string first = open(enumerations, alice, 1);
    const std::string second = open(enumerations, alice, 1);
    EXPECT_EQ(first.size(), 32U);
    EXPECT_NE(first, second);
    EXPECT_EQ(first.find_first_not_of("0123456789abcdef"), std::string::npos);
}

TEST(Enumerations, AreTheirOwnersAlone) {
    Enumerations enumerations({});
    const std::string context = open(enumerations, alice, 1);
    for (const EnumerationOwner& other : {EnumerationOwner{"bob", "root/test", Pulled::instancesWithPath},
                                          EnumerationOwner{"alice", "root/other", Pulled::instancesWithPath},
                                          EnumerationOwner{"alice", "root/test", Pulled::paths}}) {
        EXPECT_EQ(refusal([&] { static_cast<void>(enumerations.pull(context, other, 1)); }),
                  wbem::invalidEnumerationContext);
    }
    EXPECT_EQ(refusal([&] {
                  enumerations.close(context, {"bob", "root/test", {}});
              }),
              wbem::invalidEnumerationContext);
    EXPECT_EQ(refusal([&] { enumerations.close(context, {"alice", "ROOT/test", Pulled::paths}); }), CMPI_RC_OK);
}

TEST(Enumerations, AreLimitedPerUser) {
    wbem::Limits limits;
    limits.enumerationsPerUser = 2;
    Enumerations enumerations(limits);
    open(enumerations, alice, 1);
    const std::string second = open(enumerations, alice, 1);
    std::string reason;
    EXPECT_EQ(refusal([&] { open(enumerations, alice, 1); }, &reason), CMPI_RC_ERR_SERVER_LIMITS_EXCEEDED);
    EXPECT_THAT(reason, HasSubstr("'alice' has 2 open"));
    open(enumerations, {"bob", "root/test", {}}, 1);
    enumerations.close(second, alice);
    EXPECT_EQ(refusal([&] { open(enumerations, alice, 1); }), CMPI_RC_OK);
}

TEST(Enumerations, AreLimitedInAll) {
    wbem::Limits limits;
    limits.enumerations = 2;
    Enumerations enumerations(limits);
    const auto filling = enumerations.begin(alice, false); // counts from its first moment
    open(enumerations, {"bob", "root/test", {}}, 1);
    EXPECT_EQ(refusal([&] { open(enumerations, {"eve", "root/test", {}}, 1); }), CMPI_RC_ERR_SERVER_LIMITS_EXCEEDED);
}

TEST(Enumerations, AreLimitedInWhatTheyHold) {
    wbem::Limits limits;
    limits.heldBytes = 100000;
    Enumerations enumerations(limits);
    auto held = enumerations.begin(alice, false);
    for (int i = 0; i < 9; ++i) {
        held->add(makeInstance("x", 10000));
    }
    EXPECT_EQ(refusal([&] { held->add(makeInstance("x", 10000)); }), CMPI_RC_ERR_SERVER_LIMITS_EXCEEDED);
    const std::string context = enumerations.keep(std::move(held), 60s);
    const auto batch = enumerations.pull(context, alice, 5); // what has been pulled makes room
    EXPECT_EQ(batch.objects.size(), 5U);
    auto other = enumerations.begin(alice, false);
    for (int i = 0; i < 5; ++i) {
        EXPECT_EQ(refusal([&] { other->add(makeInstance("x", 10000)); }), CMPI_RC_OK);
    }
    enumerations.drop(context);
    for (int i = 0; i < 4; ++i) {
        EXPECT_EQ(refusal([&] { other->add(makeInstance("x", 10000)); }), CMPI_RC_OK);
    }
}

TEST(Enumerations, EndWhenTheirTimeIsOver) {
    Enumerations enumerations({});
    const std::string short1 = open(enumerations, alice, 2, 1s);
    const std::string long1 = open(enumerations, alice, 2, 60s);
    std::this_thread::sleep_for(500ms);
    static_cast<void>(enumerations.pull(short1, alice, 1)); // begins the second anew, once it is answered
    enumerations.await(short1);
    std::this_thread::sleep_for(700ms);
    EXPECT_EQ(enumerations.size(), 2U);
    std::this_thread::sleep_for(600ms);
    EXPECT_EQ(enumerations.size(), 1U); // and nobody had to ask
    EXPECT_EQ(refusal([&] { static_cast<void>(enumerations.pull(short1, alice, 1)); }),
              wbem::invalidEnumerationContext);
    EXPECT_EQ(refusal([&] { static_cast<void>(enumerations.pull(long1, alice, 1)); }), CMPI_RC_OK);
}

TEST(Enumerations, WaitForAnAnswerThatIsStillBeingSent) {
    Enumerations enumerations({});
    auto held = enumerations.begin(alice, false);
    held->add(makeInstance("x"));
    const std::string context = enumerations.keep(std::move(held), 1s);
    std::this_thread::sleep_for(1300ms);
    EXPECT_EQ(enumerations.size(), 1U);
    enumerations.await(context);
    std::this_thread::sleep_for(1300ms);
    EXPECT_EQ(enumerations.size(), 0U);
}

TEST(Enumerations, GiveConcurrentPullsDifferentObjects) {
    Enumerations enumerations({});
    const std::string context = open(enumerations, alice, 1000);
    std::atomic<int> pulled{0};
    std::vector<std::thread> threads;
    for (int i = 0; i < 4; ++i) {
        threads.emplace_back([&] {
            try {
                while (true) {
                    const auto batch = enumerations.pull(context, alice, 7);
                    pulled += static_cast<int>(batch.objects.size());
                    enumerations.await(context);
                }
            } catch (const RequestError&) { // pulled to its end
            }
        });
    }
    for (std::thread& thread : threads) {
        thread.join();
    }
    EXPECT_EQ(pulled, 1000);
}

} // namespace
} // namespace marlo::test
