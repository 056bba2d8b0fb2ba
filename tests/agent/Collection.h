/**
 * @file
 * What happens on other threads, for a test to wait for.
 */
#pragma once

#include <chrono>
#include <condition_variable>
#include <mutex>
#include <utility>
#include <vector>

namespace Orv::Test {

/** What several threads add to and a test waits for. */
template <typename Value>
class Collection {
  public:
    void add(Value value) {
        const std::lock_guard lock(_mutex);
        _values.push_back(std::move(value));
        _changed.notify_all();
    }

    /** What there is as soon as there are so many, or half a minute has passed. */
    std::vector<Value> await(std::size_t count) {
        std::unique_lock lock(_mutex);
        _changed.wait_for(lock, std::chrono::seconds(30), [&] { return _values.size() >= count; });
        return _values;
    }

    std::vector<Value> now() {
        const std::lock_guard lock(_mutex);
        return _values;
    }

  private:
    std::mutex _mutex;
    std::condition_variable _changed;
    std::vector<Value> _values;
};

} // namespace Orv::Test
