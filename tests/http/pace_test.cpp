#include "host/http/Descriptor.h"
#include "host/http/Server.h"
#include "host/http/Uptake.h"

#include <array>
#include <string>

#include <gtest/gtest.h>
#include <sys/socket.h>

namespace {

using namespace marlo::http;
using namespace std::chrono_literals;

constexpr std::size_t rate = 1000;

TEST(Pace, EndsWhenNothingIsTakenForAsLongAsThePatience) {
    Pace pace(2s, rate);
    pace.went(2s - 1ns, 0);
    EXPECT_FALSE(pace.isTooSlow());
    EXPECT_EQ(pace.left(), 1ns);
    pace.went(1ns, 0);
    EXPECT_TRUE(pace.isTooSlow());
}

TEST(Pace, GoesOnForEverAtTheRate) {
    Pace pace(2s, rate);
    for (int second = 0; second < 10000; ++second) {
        pace.went(1s, rate);
    }
    EXPECT_EQ(pace.left(), 2s);
}

TEST(Pace, EndsSoonerOrLaterBelowTheRate) {
    Pace pace(2s, rate);
    for (int second = 0; second < 1999; ++second) { // each costs a millisecond
        pace.went(1s, rate - 1);
    }
    EXPECT_FALSE(pace.isTooSlow());
    pace.went(1s, rate - 1);
    EXPECT_TRUE(pace.isTooSlow());
}

TEST(Pace, CountsNothingOfWhatWasTakenTooEarly) {
    Pace pace(2s, rate);
    pace.went(0s, std::size_t{1} << 40U);
    EXPECT_EQ(pace.left(), 2s);
    pace.went(1s, 500);
    EXPECT_EQ(pace.left(), 1500ms);
}

TEST(Pace, OfTheServersLimitsLetsASlowLineHaveALargeAnswer) {
    const Limits limits;
    Pace pace(limits.sendTime, limits.sendRate);
    for (std::size_t taken = 0; taken < 15U << 20U; taken += 10 * limits.sendRate) { // it comes in bursts
        pace.went(10s, 10 * limits.sendRate);
        ASSERT_FALSE(pace.isTooSlow());
    }
}

class UptakeTest : public testing::Test {
  protected:
    UptakeTest() {
        std::array<int, 2> made{};
        EXPECT_EQ(::socketpair(AF_UNIX, SOCK_STREAM | SOCK_CLOEXEC, 0, made.data()), 0);
        near = Descriptor(made[0]);
        far = Descriptor(made[1]);
    }

    void send(std::size_t bytes) const {
        const std::string text(bytes, 'b');
        EXPECT_EQ(::send(near.get(), text.data(), bytes, 0), static_cast<ssize_t>(bytes));
    }

    void take(std::size_t bytes) const {
        std::string text(bytes, ' ');
        EXPECT_EQ(::recv(far.get(), text.data(), bytes, MSG_WAITALL), static_cast<ssize_t>(bytes));
    }

    Descriptor near;
    Descriptor far;
};

TEST_F(UptakeTest, CountsWhatIsTakenAndNotWhatIsSent) {
    Uptake uptake(near.get(), {2s, rate});
    send(1000);
    uptake.wrote(1000);
    uptake.waited(1s);
    EXPECT_EQ(uptake.left(), 1s);
    take(1000);
    uptake.waited(500ms);
    EXPECT_EQ(uptake.left(), 1500ms);
    uptake.waited(1500ms);
    EXPECT_TRUE(uptake.isTooSlow()) << "nothing is counted twice";
}

TEST_F(UptakeTest, CountsWhatWasSentBeforeOnceItIsTaken) {
    send(1000);
    Uptake uptake(near.get(), {2s, rate});
    uptake.waited(1s);
    EXPECT_EQ(uptake.left(), 1s);
    take(1000); // with the kernel's overhead it is worth no less than its bytes
    uptake.waited(1s);
    EXPECT_GE(uptake.left(), 1s);
}

TEST_F(UptakeTest, OfAClientThatIsGoneTakesNothing) {
    Uptake uptake(near.get(), {2s, rate});
    far = Descriptor();
    uptake.waited(2s);
    EXPECT_TRUE(uptake.isTooSlow());
}

} // namespace
