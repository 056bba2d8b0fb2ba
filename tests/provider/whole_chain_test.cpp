/** Events of a described host through the agent, the provider, and the object manager to a subscriber. */
#include "host/cimom/ObjectManager.h"

#include <condition_variable>
#include <cstdlib>
#include <filesystem>
#include <fstream>
#include <memory>
#include <mutex>
#include <stdexcept>
#include <string>
#include <utility>
#include <vector>

#include <gmock/gmock.h>
#include <gtest/gtest.h>
#include <unistd.h>

namespace {

using marlo::Instance;

/** A described host, and an object manager that is subscribed to all four classes. */
class Chain {
  public:
    Chain() {
        std::filesystem::create_directory(_directory);
        std::ofstream(_directory / "host.toml") << "[[adapter]]\nidentity = \"eth0\"\nstatus = 1\n"
                                                   "[[adapter]]\nidentity = \"bond0\"\nstatus = 1\n";
        (void)::setenv("ORV_AGENT_TREE", (_directory / "host.toml").c_str(), 1);
        (void)::setenv("ORV_AGENT_CONTROL", (_directory / "control").c_str(), 1);
        _manager = std::make_unique<marlo::ObjectManager>(marlo::ObjectManagerOptions{
            MARLO_SHARE_DIRECTORY "/schema", MARLO_SHARE_DIRECTORY "/providers", MARLO_LIBRARY_DIRECTORY, {}, false});
        for (const char* event : {"Online", "Offline", "SwitchOver", "SwitchBack"}) {
            subscribe(std::string("SELECT * FROM MARLO_NetworkAdapter") + event + "Event");
        }
    }

    ~Chain() {
        _manager.reset();
        std::error_code ignored;
        std::filesystem::remove_all(_directory, ignored);
    }

    Chain(const Chain&) = delete;
    Chain& operator=(const Chain&) = delete;

    /** Has the agent play events. */
    void play(const std::string& line) const { std::ofstream(_directory / "control") << line << std::endl; }

    /**
     * Takes what has come when there are so many, or after a minute without any more. A little later, to meet events
     * that are too many.
     */
    std::vector<std::string> take(std::size_t count) {
        std::unique_lock lock(_mutex);
        for (std::size_t before = ~_received.size(); _received.size() < count && before != _received.size();) {
            before = _received.size();
            _changed.wait_for(lock, std::chrono::minutes(1), [&] { return _received.size() != before; });
        }
        _changed.wait_for(lock, std::chrono::milliseconds(300), [&] { return _received.size() > count; });
        return std::exchange(_received, {});
    }

  private:
    void subscribe(const std::string& filter) {
        marlo::SubscriptionId id = 0;
        const marlo::Status status = _manager->subscribe(
            "root/tavis", filter, "WQL", [this](Instance&& indication) { receive(indication); }, id);
        if (!status.ok()) {
            throw std::runtime_error(status.message);
        }
    }

    void receive(const Instance& indication) {
        const marlo::NamedValue* found = marlo::findName(indication.properties, "EventID");
        const std::lock_guard lock(_mutex);
        _received.push_back(found != nullptr ? std::get<std::string>(found->value.data) : "none");
        _changed.notify_all();
    }

    const std::filesystem::path _directory =
        std::filesystem::temp_directory_path() / ("marlo-chain-" + std::to_string(::getpid()));
    std::mutex _mutex; ///< guards what has been received
    std::condition_variable _changed;
    std::vector<std::string> _received;
    std::unique_ptr<marlo::ObjectManager> _manager;
};

/** One for all tests: the provider does not start monitoring again once its last subscriptions have gone. */
class WholeChain : public testing::Test {
  protected:
    static void SetUpTestSuite() { chain = std::make_unique<Chain>(); }

    static void TearDownTestSuite() { chain.reset(); }

    static inline std::unique_ptr<Chain> chain;
};

TEST_F(WholeChain, BurstOfTenThousandArrivesWholeOnceAndInOrder) {
    constexpr std::size_t COUNT = 10'000;
    chain->play("burst eth0 " + std::to_string(COUNT));
    const std::vector<std::string> events = chain->take(COUNT);
    ASSERT_EQ(events.size(), COUNT);
    for (std::size_t i = 0; i < COUNT; ++i) {
        ASSERT_EQ(events[i], i % 2 == 0 ? "NetworkPort:eth0Offline" : "NetworkPort:eth0Online") << "event " << i;
    }
}

TEST_F(WholeChain, EveryKindOfEventOfSeveralAdaptersArrivesInOrder) {
    for (const char* line :
         {"failover bond0", "flap eth0", "failback bond0", "status eth0 5", "status bond0 7", "status eth0 1"}) {
        chain->play(line);
    }
    EXPECT_THAT(chain->take(6), testing::ElementsAre("NetworkPort:bond0SwitchOver", "NetworkPort:eth0Offline",
                                                     "NetworkPort:eth0Online", "NetworkPort:bond0SwitchBack",
                                                     "NetworkPort:eth0Offline", "NetworkPort:eth0Online"));
}

} // namespace
