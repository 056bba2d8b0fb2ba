/**
 * @file
 * A destination with its queue and what has become of it.
 */
#pragma once

#include "host/delivery/Delivery.h"
#include "host/delivery/Latency.h"
#include "host/delivery/Queue.h"

#include <chrono>
#include <memory>
#include <optional>
#include <string>

namespace marlo::delivery {

struct Lane {
    using Clock = std::chrono::steady_clock;
    using WallClock = std::chrono::system_clock;

    /** What was lost to a full queue and has not been announced. */
    struct Loss {
        std::uint64_t count = 0;
        std::int64_t first = 0;
        std::int64_t last = 0;
    };

    explicit Lane(Queue&& itsQueue) : queue(std::move(itsQueue)) {}

    Destination setting;
    bool isSet = false; ///< since the start
    Queue queue;
    Loss loss;

    std::uint64_t sent = 0;
    std::uint64_t retried = 0;
    std::uint64_t dropped = 0;
    std::string lastError;
    std::optional<WallClock::time_point> lastErrorTime;
    std::optional<WallClock::time_point> failingSince;
    Clock::time_point failingFrom; ///< the same by the clock that is never set
    Latency latency;

    [[nodiscard]] Counters counters() const;
};

/** A subscription. */
struct Bearer {
    std::int64_t id = 0;
    Subscription setting;
    std::shared_ptr<Lane> lane; ///< null: not set since the start
    bool hasFired = false;
};

} // namespace marlo::delivery
