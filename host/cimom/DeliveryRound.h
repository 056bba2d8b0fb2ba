/**
 * @file
 * One indication on its way through the sinks of its subscriptions.
 */
#pragma once

#include <functional>
#include <string>
#include <utility>
#include <vector>

namespace marlo {

/**
 * What the sinks leave to be done together once all of them have been called, on the delivering thread: waiting for
 * one disk, for instance, instead of once in each sink.
 */
class DeliveryRound {
  public:
    /** Of each owner the last work is done, and no other. What it throws is the deliverer's failure. */
    void afterwards(const void* owner, std::function<void()> work) {
        for (auto& [known, former] : _works) {
            if (known == owner) {
                former = std::move(work);
                return;
            }
        }
        _works.emplace_back(owner, std::move(work));
    }

  private:
    friend class Subscriptions;

    std::vector<std::pair<const void*, std::function<void()>>> _works;
};

} // namespace marlo
