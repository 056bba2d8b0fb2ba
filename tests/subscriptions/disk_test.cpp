/** @file A burst of indications that the server's disk has no room for. */
#include "tests/subscriptions/SubscribedServer.h"
#include "tests/support/Namespace.h"

#include <algorithm>
#include <csignal>
#include <set>
#include <thread>

namespace marlo::test {
namespace {

using testing::HasSubstr;

class FullDisk : public SubscribedServer {
  protected:
    /** Numbers that the torrent gave its drops, in the order in which they came; repeats left out. */
    [[nodiscard]] std::vector<std::size_t> came() const {
        std::vector<std::size_t> numbers;
        std::int64_t newest = -1;
        for (const auto& each : listener.received()) {
            if (each.number > newest) {
                newest = each.number;
                numbers.push_back(std::stoul("0" + each.property("Number")));
            }
        }
        return numbers;
    }

    template <typename Predicate>
    static bool eventually(Predicate predicate) {
        const auto end = std::chrono::steady_clock::now() + Patience;
        while (!predicate() && std::chrono::steady_clock::now() < end) {
            std::this_thread::sleep_for(std::chrono::milliseconds(20));
        }
        return predicate();
    }
};

TEST_F(FullDisk, LosesNothingThatProvidersWereToldIsTaken) {
    REQUIRE_NAMESPACES();
    startBehind("mkdir state\nmount -t tmpfs -o size=6m none state");
    setVariable("TORRENT_COUNT", "1000000000");
    listener.setReaction(delivery::Listener::refuse);
    start();
    const Outcome subscribed = command({"subscribe", listener.url(), "TORRENT_Drop", "-n", "root/torrent"});
    ASSERT_EQ(subscribed.exitCode, 0) << subscribed.err;
    EXPECT_THAT(logWith("indications cannot be kept"), HasSubstr("full"));
    const std::size_t full = taken();
    EXPECT_GT(full, 100U);
    EXPECT_GT(json({"status"})["deliveries"][0]["dropped"], 0) << "it is counted";

    const std::string process = std::to_string(server().id());
    const Outcome grown = // with its root as well, which is not that of the namespace where it was changed
        runProgram({"nsenter", "-t", process, "-m", "-r", "mount", "-o", "remount,size=200m", path("state")});
    ASSERT_EQ(grown.exitCode, 0) << grown.err;
    ASSERT_TRUE(eventually([&] { return taken() > full + 100; })) << "it recovers by itself";
    EXPECT_THAT(log(), HasSubstr("indications are kept on disk again"));
    EXPECT_EQ(command({"status"}).exitCode, 0);
    listener.setReaction(delivery::Listener::accept);
    const std::size_t count = taken();
    ASSERT_TRUE(eventually([&] { return !came().empty() && came().back() >= count; }));
    const std::vector<std::size_t> numbers = came();
    EXPECT_TRUE(std::is_sorted(numbers.begin(), numbers.end()));
    const std::set<std::size_t> all(numbers.begin(), numbers.end());
    EXPECT_EQ(all.size(), numbers.back() + 1) << "every number from 0 on";
    server().signal(SIGKILL);
}

} // namespace
} // namespace marlo::test
