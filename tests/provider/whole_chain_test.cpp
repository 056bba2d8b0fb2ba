/** Events of a described host through the agent, the provider, and the object manager to a subscriber. */
#include "tests/provider/WholeChain.h"

#include <cstdlib>
#include <filesystem>
#include <fstream>

#include <gmock/gmock.h>
#include <gtest/gtest.h>
#include <unistd.h>

namespace {

using namespace provider_test;

/** A host that can be told what happens to it. */
class PlayedHost {
  public:
    PlayedHost() {
        std::filesystem::create_directory(_directory);
        std::ofstream(_directory / "host.toml") << "[[adapter]]\nidentity = \"eth0\"\nstatus = 1\n"
                                                   "[[adapter]]\nidentity = \"bond0\"\nstatus = 1\n";
        (void)::setenv("ORV_AGENT_TREE", (_directory / "host.toml").c_str(), 1);
        (void)::setenv("ORV_AGENT_CONTROL", (_directory / "control").c_str(), 1);
    }

    ~PlayedHost() {
        std::error_code ignored;
        std::filesystem::remove_all(_directory, ignored);
    }

    PlayedHost(const PlayedHost&) = delete;
    PlayedHost& operator=(const PlayedHost&) = delete;

    void play(const std::string& line) const { std::ofstream(_directory / "control") << line << std::endl; }

  private:
    const std::filesystem::path _directory =
        std::filesystem::temp_directory_path() / ("marlo-chain-" + std::to_string(::getpid()));
};

class PlayedEvents : public testing::Test {
  protected:
    static void SetUpTestSuite() {
        host = std::make_unique<PlayedHost>();
        chain = std::make_unique<WholeChain>();
    }

    static void TearDownTestSuite() {
        chain.reset();
        host.reset();
    }

    static inline std::unique_ptr<PlayedHost> host;
    static inline std::unique_ptr<WholeChain> chain;
};

TEST_F(PlayedEvents, BurstOfTenThousandArrivesWholeOnceAndInOrder) {
    constexpr std::size_t COUNT = 10'000;
    host->play("burst eth0 " + std::to_string(COUNT));
    const std::vector<std::string> events = textsOf(chain->take(COUNT), "EventID");
    ASSERT_EQ(events.size(), COUNT);
    for (std::size_t i = 0; i < COUNT; ++i) {
        ASSERT_EQ(events[i], i % 2 == 0 ? "NetworkPort:eth0Offline" : "NetworkPort:eth0Online") << "event " << i;
    }
}

TEST_F(PlayedEvents, EveryKindOfEventOfSeveralAdaptersArrivesInOrder) {
    for (const char* line :
         {"failover bond0", "flap eth0", "failback bond0", "status eth0 5", "status bond0 7", "status eth0 1"}) {
        host->play(line);
    }
    EXPECT_THAT(textsOf(chain->take(6), "EventID"),
                testing::ElementsAre("NetworkPort:bond0SwitchOver", "NetworkPort:eth0Offline",
                                     "NetworkPort:eth0Online", "NetworkPort:bond0SwitchBack",
                                     "NetworkPort:eth0Offline", "NetworkPort:eth0Online"));
}

} // namespace
