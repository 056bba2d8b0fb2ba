/** @file What providers were told is taken, after the server was killed in the middle of it. */
#include "tests/subscriptions/SubscribedServer.h"

#include <algorithm>
#include <csignal>
#include <cstdlib>
#include <map>
#include <random>
#include <thread>

namespace marlo::test {
namespace {

class KilledServer : public SubscribedServer {
  protected:
    /** MARLO_KILL_ROUNDS; a few where nobody says. */
    static unsigned rounds() {
        const char* text = std::getenv("MARLO_KILL_ROUNDS");
        return text == nullptr ? 4 : static_cast<unsigned>(std::strtoul(text, nullptr, 10));
    }

    /** What the torrent numbered them with, in the order of their sequence numbers; repeats must be the same. */
    std::map<std::int64_t, std::uint32_t> sequence() const {
        std::map<std::int64_t, std::uint32_t> numbers;
        for (const auto& each : listener.received()) {
            const auto number = static_cast<std::uint32_t>(std::stoul("0" + each.property("Number")));
            const auto [known, isNew] = numbers.emplace(each.number, number);
            EXPECT_EQ(known->second, number) << "another indication by the sequence number " << each.number;
        }
        return numbers;
    }
};

TEST_F(KilledServer, LosesNothingThatWasTakenAndKeepsTheOrder) {
    start();
    const Outcome subscribed = command({"subscribe", listener.url(), "TORRENT_Drop", "-n", "root/torrent"});
    ASSERT_EQ(subscribed.exitCode, 0) << subscribed.err;
    EXPECT_EQ(stop(), 0);
    std::mt19937 random(std::random_device{}());
    std::uniform_int_distribution<int> milliseconds(1, 150);
    setVariable("TORRENT_COUNT", "1000000000");
    for (unsigned round = 0; round < rounds(); ++round) {
        const std::size_t before = taken();
        start();
        const auto end = std::chrono::steady_clock::now() + Patience;
        while (taken() == before && std::chrono::steady_clock::now() < end) {
            std::this_thread::sleep_for(std::chrono::milliseconds(1));
        }
        std::this_thread::sleep_for(std::chrono::milliseconds(milliseconds(random)));
        kill();
        ASSERT_GT(taken(), before);
    }
    setVariable("TORRENT_COUNT", "0");
    start();
    const std::size_t count = taken();
    const auto end = std::chrono::steady_clock::now() + Patience;
    const auto isComplete = [&] {
        const auto received = listener.received();
        return std::any_of(received.begin(), received.end(), [count](const auto& each) {
            return std::stoul("0" + each.property("Number")) + 1 >= count;
        });
    };
    while (!isComplete() && std::chrono::steady_clock::now() < end) {
        std::this_thread::sleep_for(std::chrono::milliseconds(50));
    }
    EXPECT_EQ(stop(), 0);

    const auto numbers = sequence();
    const auto received = listener.received();
    std::vector<bool> hasCome(count + rounds() + 1);
    std::int64_t expected = 0;
    std::uint32_t last = 0;
    for (const auto& [place, number] : numbers) {
        EXPECT_EQ(place, expected++); // no gap
        EXPECT_GE(number, last);      // in order; one that was kept but not answered is delivered again
        last = number;
        hasCome.at(number) = true;
    }
    EXPECT_EQ(std::count(hasCome.begin(), hasCome.begin() + static_cast<std::ptrdiff_t>(count), false), 0);
    std::int64_t newest = -1;
    for (const auto& each : received) {
        EXPECT_EQ(each.context, received.front().context);
        EXPECT_LE(each.number, newest + 1); // whatever is new comes behind all that came before it
        newest = std::max(newest, each.number);
    }
    std::cout << count << " taken, " << received.size() << " received, " << received.size() - numbers.size()
              << " of them again\n";
    RecordProperty("taken", static_cast<int>(count));
}

} // namespace
} // namespace marlo::test
