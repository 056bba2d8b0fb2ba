// Accounts that take their time, and many who wait for them.
#include "tests/security/GatekeeperFixture.h"

#include <chrono>
#include <condition_variable>
#include <mutex>
#include <optional>
#include <string>
#include <thread>
#include <vector>

#include <gmock/gmock.h>

namespace {

using namespace std::chrono_literals;
using namespace marlo::test;
using marlo::security::Admission;
using testing::ElementsAre;

/** Holds up those who ask the accounts. */
class Gate {
  public:
    void pass() {
        std::unique_lock<std::mutex> lock(_mutex);
        ++_come;
        _changed.notify_all();
        _changed.wait(lock, [this] { return _isOpen; });
    }

    bool awaitOne() {
        std::unique_lock<std::mutex> lock(_mutex);
        return _changed.wait_for(lock, 20s, [this] { return _come > 0; });
    }

    void open() {
        const std::lock_guard<std::mutex> lock(_mutex);
        _isOpen = true;
        _changed.notify_all();
    }

  private:
    std::mutex _mutex;
    std::condition_variable _changed;
    int _come = 0;
    bool _isOpen = false;
};

/** Accounts that take their time. */
class BusyAccounts : public GatekeeperTest {
  protected:
    /** With so many who may wait for them. */
    void become(std::size_t mostWaiting) {
        _options.mostWaiting = mostWaiting;
        EXPECT_EQ(outcome({basic("root:good")}), "root");
        _accounts->onAsked = [this] { _gate.pass(); };
    }

    ~BusyAccounts() override { letThemAnswer(); }

    /** Somebody who asks in a thread of its own. */
    void ask(const std::string& credentials, const std::string& address) {
        _asking.emplace_back([this, credentials, address] {
            const std::string result = outcome({basic(credentials)}, tcpPeer(address));
            const std::lock_guard<std::mutex> lock(_outcomesMutex);
            _outcomes.push_back(result);
        });
    }

    /** What became of those who asked, once it is known of so many. */
    std::vector<std::string> outcomes(std::size_t count) {
        for (int looks = 0; looks < 4000; ++looks) {
            {
                const std::lock_guard<std::mutex> lock(_outcomesMutex);
                if (_outcomes.size() >= count) {
                    return _outcomes;
                }
            }
            std::this_thread::sleep_for(5ms);
        }
        return {};
    }

    void letThemAnswer() {
        _gate.open();
        for (std::thread& each : _asking) {
            each.join();
        }
        _asking.clear();
    }

    Gate _gate;

  private:
    std::mutex _outcomesMutex;
    std::vector<std::string> _outcomes;
    std::vector<std::thread> _asking;
};

TEST_F(BusyAccounts, KeepNobodyWaitingWhoDoesNotNeedThem) {
    become(1);
    ask("daemon:wrong", "192.0.2.7");
    ASSERT_TRUE(_gate.awaitOne());
    const Admission late = admit({basic("daemon:good")});
    ASSERT_TRUE(late.refusal.has_value());
    EXPECT_EQ(late.refusal->status, 503U);
    EXPECT_TRUE(late.refusal->isForNow);
    EXPECT_EQ(fieldOf(*late.refusal, "Retry-After"), "1");
    EXPECT_EQ(outcome({basic("nobody:x")}), "503") << "else it would tell who has a role";
    EXPECT_EQ(outcome({basic("root:good")}), "root") << "who was good a moment ago";
    EXPECT_EQ(outcome({basic("trial:p")}), "trial");
    EXPECT_EQ(outcome({}, {marlo::http::Transport::local, "local", 0, 0U, std::nullopt}), "root");
    letThemAnswer();
    EXPECT_THAT(outcomes(1), ElementsAre("401"));
    EXPECT_EQ(outcome({basic("daemon:good")}), "daemon");
}

TEST_F(BusyAccounts, HoldUpAsManyAsMayWait) {
    constexpr std::size_t all = 12;
    become(3);
    for (std::size_t count = 0; count < all; ++count) {
        ask("daemon:wrong", "192.0.2." + std::to_string(10 + count));
    }
    EXPECT_THAT(outcomes(all - 3), testing::AllOf(testing::SizeIs(all - 3), testing::Each("503")));
    letThemAnswer();
    EXPECT_THAT(outcomes(all), testing::AllOf(testing::SizeIs(all), testing::Contains("401").Times(3)));
}

TEST_F(BusyAccounts, AreAskedOnceForWhatManyBring) {
    become(3);
    const int before = _accounts->asked;
    for (const char* address : {"192.0.2.7", "192.0.2.8", "192.0.2.9"}) {
        ask("daemon:good", address);
    }
    ASSERT_TRUE(_gate.awaitOne());
    std::this_thread::sleep_for(50ms); // so that the others come as well
    letThemAnswer();
    EXPECT_THAT(outcomes(3), ElementsAre("daemon", "daemon", "daemon"));
    EXPECT_EQ(_accounts->asked, before + 1);
}

TEST_F(BusyAccounts, AreAskedOneQuestionAtATime) {
    become(3);
    std::atomic<int> inside{0};
    std::atomic<bool> isCrowded{false};
    _accounts->onAsked = [&] {
        isCrowded = isCrowded || ++inside > 1;
        std::this_thread::sleep_for(20ms);
        --inside;
    };
    for (const char* password : {"a", "b", "c"}) {
        ask(std::string("daemon:") + password, "192.0.2.7");
    }
    letThemAnswer();
    EXPECT_FALSE(isCrowded);
}

} // namespace
