#include "host/security/Throttle.h"

#include <chrono>
#include <string>

#include <gtest/gtest.h>

namespace {

using namespace std::chrono_literals;
using marlo::security::Clock;
using marlo::security::peerKey;
using marlo::security::Throttle;
using marlo::security::ThrottleLimits;

const Clock::time_point start{1h};

TEST(PeerKeys, AreTheAddressInIPv4) {
    EXPECT_EQ(peerKey("192.0.2.1"), "192.0.2.1");
    EXPECT_EQ(peerKey("::ffff:192.0.2.1"), "192.0.2.1");
}

TEST(PeerKeys, AreTheFirstHalfInIPv6) {
    EXPECT_EQ(peerKey("2001:db8:1:2:3:4:5:6"), peerKey("2001:db8:1:2::1"));
    EXPECT_NE(peerKey("2001:db8:1:2::1"), peerKey("2001:db8:1:3::1"));
    EXPECT_NE(peerKey("fe80::1%eth0"), peerKey("fe80::1%eth1"));
    EXPECT_NE(peerKey("::1"), peerKey("::ffff:0.0.0.1"));
}

TEST(PeerKeys, TakeAnythingElseAsItIs) {
    EXPECT_EQ(peerKey("local"), "local");
    EXPECT_EQ(peerKey(""), "");
    EXPECT_EQ(peerKey("%"), "%");
}

TEST(Throttling, DelaysEachFailureLongerUpToALimit) {
    Throttle throttle(500ms);
    Clock::time_point now = start;
    for (const auto delay : {500ms, 1000ms, 2000ms, 4000ms, 4000ms}) {
        const Clock::time_point answered = throttle.fail("a", now);
        EXPECT_EQ(answered - now, delay);
        now = answered;
    }
}

TEST(Throttling, AnswersFailuresOfOnePeerOneAfterTheOther) {
    Throttle throttle(500ms);
    EXPECT_EQ(throttle.fail("a", start) - start, 500ms);
    EXPECT_EQ(throttle.fail("a", start) - start, 1500ms);
    EXPECT_EQ(throttle.fail("a", start + 100ms) - start, 3500ms);
}

TEST(Throttling, KeepsPeersApart) {
    Throttle throttle(500ms);
    throttle.fail("a", start);
    throttle.fail("a", start);
    EXPECT_EQ(throttle.fail("b", start) - start, 500ms);
}

TEST(Throttling, ForgivesOneFailureAfterTheOther) {
    Throttle throttle(500ms);
    throttle.fail("a", start);
    throttle.fail("a", start);
    throttle.fail("a", start);
    const auto forgiving = ThrottleLimits().forgiving;
    EXPECT_EQ(throttle.failures("a", start + forgiving - 1ms), 3U);
    EXPECT_EQ(throttle.failures("a", start + forgiving), 2U);
    EXPECT_EQ(throttle.failures("a", start + 3 * forgiving), 0U);
    EXPECT_EQ(throttle.fail("a", start + 2 * forgiving) - (start + 2 * forgiving), 1000ms);
}

TEST(Throttling, CountsNoMoreFailuresThanDelayLonger) {
    Throttle throttle(1ms);
    for (int count = 0; count < 100; ++count) {
        throttle.fail("a", start);
    }
    EXPECT_EQ(throttle.failures("a", start), ThrottleLimits().doublings + 1);
}

TEST(Throttling, ShutsOutAPeerWhoseAnswersPileUp) {
    ThrottleLimits limits;
    limits.held = 7s;
    Throttle throttle(1s, limits);
    EXPECT_EQ(throttle.shutOut("a", start), 0s);
    throttle.fail("a", start);
    throttle.fail("a", start);
    throttle.fail("a", start); // answered after 1 + 2 + 4 seconds
    EXPECT_EQ(throttle.shutOut("a", start), 0s);
    EXPECT_EQ(throttle.shutOut("a", start - 1ms), 1ms);
    throttle.fail("a", start);
    EXPECT_EQ(throttle.shutOut("a", start), 8s);
    EXPECT_EQ(throttle.shutOut("b", start), 0s);
    EXPECT_EQ(throttle.shutOut("a", start + 8s), 0s);
}

TEST(Throttling, RemembersALimitedNumberOfPeers) {
    ThrottleLimits limits;
    limits.peers = 3;
    Throttle throttle(500ms, limits);
    throttle.fail("a", start);
    throttle.fail("b", start + 1ms);
    throttle.fail("c", start + 2ms);
    throttle.fail("a", start + 3ms);
    EXPECT_EQ(throttle.peers(), 3U);
    EXPECT_EQ(throttle.failures("b", start + 4ms), 1U);
    throttle.fail("d", start + 4ms);
    EXPECT_EQ(throttle.peers(), 3U);
    EXPECT_EQ(throttle.failures("b", start + 4ms), 0U) << "the one whose failure was longest ago";
    EXPECT_EQ(throttle.failures("a", start + 4ms), 2U);
}

TEST(Throttling, ForgetsThoseFirstWhoHaveBeenForgiven) {
    ThrottleLimits limits;
    limits.peers = 2;
    Throttle throttle(500ms, limits);
    for (int count = 0; count < 3; ++count) {
        throttle.fail("often", start);
    }
    throttle.fail("once", start + 1s);
    throttle.fail("new", start + limits.forgiving + 1s);
    EXPECT_EQ(throttle.failures("often", start + limits.forgiving + 1s), 2U);
    EXPECT_EQ(throttle.peers(), 2U);
}

} // namespace
