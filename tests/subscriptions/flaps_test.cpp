/** @file Links of a real kernel that go and come, as a listener on another host is told of them. */
#include "tests/subscriptions/SubscribedServer.h"
#include "tests/support/Namespace.h"

#include <csignal>
#include <optional>
#include <thread>

namespace marlo::test {
namespace {

using testing::ElementsAreArray;

/** Of the child that becomes the server. */
const Orv::Test::Namespace* home = nullptr;

class Flaps : public SubscribedServer {
  protected:
    /** The events of an adapter, "Offline" and "Online", in the order in which they came. */
    [[nodiscard]] std::vector<std::string> eventsOf(const std::string& adapter) const {
        std::vector<std::string> events;
        for (const auto& each : station->received()) {
            if (each.property("AlertingManagedElement").find(adapter) != std::string::npos) {
                const bool isOffline = each.body.find("MARLO_NetworkAdapterOfflineEvent") != std::string::npos;
                events.emplace_back(isOffline ? "Offline" : "Online");
            }
        }
        return events;
    }

    void awaitEventsOf(const std::string& adapter, std::size_t count) const {
        const auto end = std::chrono::steady_clock::now() + Patience;
        while (eventsOf(adapter).size() < count && std::chrono::steady_clock::now() < end) {
            std::this_thread::sleep_for(std::chrono::milliseconds(5));
        }
    }

    std::optional<delivery::Listener> station;
};

TEST_F(Flaps, ArriveAtAListenerInAnotherNamespaceEachOnce) {
    REQUIRE_NAMESPACES();
    const Orv::Test::Namespace host;
    const Orv::Test::Namespace away;
    host.ip("link set lo up");
    host.ip("link add way0 type veth peer name way1");
    host.ip("link set way1 netns " + away.descriptorPath());
    host.ip("address add 192.0.2.1/24 dev way0");
    host.ip("link set way0 up");
    away.ip("address add 192.0.2.2/24 dev way1");
    away.ip("link set way1 up");
    host.ip("link add flap0 type veth peer name flap1");
    host.ip("link set flap0 up");
    host.ip("link set flap1 up");
    away.run([this] { station.emplace(delivery::Listener::accept, delivery::Listener::Identity{}, true); });
    home = &host;
    setUp([] { home->enter(); });
    setVariable("ORV_AGENT_TREE", "");
    setVariable("ORV_AGENT_CONTROL", "");
    start();
    const Outcome subscribed = command({"subscribe", station->url("192.0.2.2")});
    ASSERT_EQ(subscribed.exitCode, 0) << subscribed.err;

    constexpr std::size_t flaps = 5;
    std::vector<std::string> expected;
    for (std::size_t i = 0; i < flaps; ++i) {
        host.ip("link set flap1 down");
        expected.emplace_back("Offline");
        awaitEventsOf("flap0", expected.size());
        host.ip("link set flap1 up");
        expected.emplace_back("Online");
        awaitEventsOf("flap0", expected.size());
    }
    EXPECT_EQ(stop(), 0);
    EXPECT_THAT(eventsOf("flap0"), ElementsAreArray(expected));
    std::int64_t number = 0;
    for (const auto& each : station->received()) {
        EXPECT_EQ(each.number, number++);
    }
}

} // namespace
} // namespace marlo::test
