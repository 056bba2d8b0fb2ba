#include "host/delivery/Lane.h"

namespace marlo::delivery {

Counters Lane::counters() const {
    Counters counters;
    counters.destination = setting.key;
    counters.url = setting.url;
    counters.sequenceContext = queue.context();
    counters.queued = queue.length();
    counters.queuedBytes = queue.bytes();
    counters.sent = sent;
    counters.retried = retried;
    counters.dropped = dropped;
    counters.lastError = lastError;
    counters.lastErrorTime = lastErrorTime;
    counters.failingSince = failingSince;
    if (!queue.items().empty()) {
        counters.oldestQueued = WallClock::time_point(std::chrono::microseconds(queue.items().front().posted));
    }
    counters.latencyMedian = latency.quantile(0.5);
    counters.latency99 = latency.quantile(0.99);
    return counters;
}

} // namespace marlo::delivery
