// Fail-over of a real bond and a real team, from the pulled plug to the indication that marlo prints.
#include "tests/vm/FailOver.h"

#include <cstdio>
#include <nlohmann/json.hpp>
#include <utility>

#include <gmock/gmock.h>

namespace Orv::Test {
namespace {

using testing::ElementsAre;

/** marlo watch in the background. */
class MarloWatch {
  public:
    explicit MarloWatch(const std::string& arguments) : _process(start(arguments)) {
        // A new adapter that is up is an indication, as soon as there is somebody watching.
        for (int probe = 0; probe < 30 && firstLine(_output).empty(); ++probe) {
            const std::string name = "probe" + std::to_string(probe);
            ip("link add " + name + " type dummy");
            ip("link set " + name + " up");
            for (int wait = 0; wait < 100 && firstLine(_output).empty(); ++wait) {
                std::this_thread::sleep_for(std::chrono::milliseconds(20));
            }
            _probes.push_back(name);
        }
    }

    ~MarloWatch() {
        if (_process != nullptr) {
            pclose(_process);
        }
    }

    MarloWatch(const MarloWatch&) = delete;
    MarloWatch& operator=(const MarloWatch&) = delete;

    /** Waits for its end and returns its exit status. */
    int wait() {
        const int status = pclose(std::exchange(_process, nullptr));
        for (const std::string& probe : _probes) {
            ip("link del " + probe);
        }
        _probes.clear();
        return status;
    }

    /** "CLASS ADAPTER" of each indication but the first, which was for the watching itself. */
    [[nodiscard]] std::vector<std::string> indications() const {
        std::ifstream file(_output);
        std::string line;
        std::getline(file, line);
        std::vector<std::string> seen;
        while (std::getline(file, line)) {
            const auto indication = nlohmann::json::parse(line);
            const auto element = indication.at("properties").at("AlertingManagedElement").get<std::string>();
            const auto tag = element.find("Tag=\"") + 5;
            seen.push_back(indication.at("class").get<std::string>() + ' ' +
                           element.substr(tag, element.find('"', tag) - tag));
        }
        return seen;
    }

  private:
    /** What an earlier one has written must not be taken for its. */
    [[nodiscard]] std::FILE* start(const std::string& arguments) const {
        std::remove(_output.c_str());
        return popen((MARLO_EXECUTABLE " watch " + arguments + " >" + _output).c_str(), "r");
    }

    const std::string _output = "/tmp/watch.json";
    std::FILE* _process;
    std::vector<std::string> _probes;
};

TYPED_TEST_SUITE(FailOverTest, FailOvers, FailOverNames);

TYPED_TEST(FailOverTest, isIndicated) {
    MarloWatch watch("--json --count 5 --timeout 120");
    this->switchOverAndBack();
    EXPECT_EQ(watch.wait(), 0);
    EXPECT_THAT(watch.indications(), ElementsAre("MARLO_NetworkAdapterOfflineEvent eth0",
                                                 "MARLO_NetworkAdapterSwitchOverEvent " + this->device,
                                                 "MARLO_NetworkAdapterOnlineEvent eth0",
                                                 "MARLO_NetworkAdapterSwitchBackEvent " + this->device));
}

} // namespace
} // namespace Orv::Test
