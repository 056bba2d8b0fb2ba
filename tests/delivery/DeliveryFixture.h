/**
 * @file
 * A delivery with a database of its own, and quick about trying again.
 */
#pragma once

#include "host/delivery/Delivery.h"
#include "tests/delivery/Listener.h"
#include "tests/security/TemporaryDirectory.h"

#include <algorithm>
#include <chrono>
#include <condition_variable>
#include <memory>
#include <mutex>
#include <optional>
#include <string>
#include <utility>
#include <vector>

#include <gmock/gmock.h>
#include <gtest/gtest.h>

namespace marlo::delivery {

/** An alert with a text of its own. */
inline Instance alert(const std::string& text) {
    Instance instance;
    instance.path.className = "LAB_Alert";
    instance.properties = {{"Description", Value::string(text)}, {"AlertType", Value::uint(CMPI_uint16, 2)}};
    return instance;
}

class DeliveryFixture : public testing::Test {
  protected:
    using Fired = std::pair<std::string, OnFatalError>;

    static Options quick() {
        Options options;
        options.firstRetry = std::chrono::milliseconds(10);
        options.lastRetry = std::chrono::milliseconds(40);
        options.deletionTime = std::chrono::milliseconds(20);
        options.shrinkTime = std::chrono::milliseconds(20);
        return options;
    }

    std::unique_ptr<Delivery> open() {
        return std::make_unique<Delivery>(
            file, options,
            [this](const std::string& key, OnFatalError policy) {
                tell({key, policy});
            },
            [this](const std::string& line) { tell(line); });
    }

    /** The destination and the subscription have the name for a key. */
    static void subscribe(Delivery& delivery, const std::string& name, const std::string& url,
                          OnFatalError policy = OnFatalError::ignore, std::chrono::seconds trigger = {}) {
        delivery.setDestination({name, url, true, {}});
        delivery.setSubscription({name, name, policy, trigger});
    }

    /** A delivery that has begun, with one subscription "a". */
    std::unique_ptr<Delivery> openFor(const Listener& listener) {
        auto delivery = open();
        subscribe(*delivery, "a", listener.url());
        delivery->start();
        return delivery;
    }

    /** Posts alerts with the numbers from `first` on, each waited for. */
    static void post(Delivery& delivery, int first, int count, const std::vector<std::string>& keys = {"a"}) {
        for (int number = first; number < first + count; ++number) {
            delivery.wait(delivery.post(keys, alert(std::to_string(number))));
        }
    }

    static std::vector<std::int64_t> upTo(std::int64_t count) {
        std::vector<std::int64_t> numbers;
        for (std::int64_t number = 0; number < count; ++number) {
            numbers.push_back(number);
        }
        return numbers;
    }

    /** The numbers that came, repeats left out. */
    static std::vector<std::int64_t> once(std::vector<std::int64_t> numbers) {
        numbers.erase(std::unique(numbers.begin(), numbers.end()), numbers.end());
        return numbers;
    }

    static Counters countersOf(const Delivery& delivery, const std::string& key = "a") {
        const std::vector<Counters> all = delivery.counters();
        const auto found = std::ranges::find(all, key, &Counters::destination);
        return found == all.end() ? Counters() : *found;
    }

    /** Whether it comes to be true within 20 s. */
    template <typename Predicate>
    static bool eventually(Predicate predicate) {
        const auto end = std::chrono::steady_clock::now() + std::chrono::seconds(20);
        while (!predicate()) {
            if (std::chrono::steady_clock::now() > end) {
                return false;
            }
            std::this_thread::sleep_for(std::chrono::milliseconds(2));
        }
        return true;
    }

    bool isLogged(const std::string& part) const {
        const std::lock_guard lock(_mutex);
        return std::ranges::any_of(_lines, [&](const std::string& line) { return line.find(part) != line.npos; });
    }

    std::vector<Fired> fired() const {
        const std::lock_guard lock(_mutex);
        return _fired;
    }

    marlo::test::TemporaryDirectory directory;
    const std::string file = directory.file("marlo.db");
    Options options = quick();

  private:
    void tell(const std::string& line) {
        const std::lock_guard lock(_mutex);
        _lines.push_back(line);
    }

    void tell(const Fired& one) {
        const std::lock_guard lock(_mutex);
        _fired.push_back(one);
    }

    mutable std::mutex _mutex; ///< guards the next two
    std::vector<std::string> _lines;
    std::vector<Fired> _fired;
};

} // namespace marlo::delivery
