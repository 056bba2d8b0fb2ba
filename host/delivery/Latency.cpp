#include "host/delivery/Latency.h"

#include <algorithm>
#include <bit>

namespace marlo::delivery {

/** Below 8 every number is a class; from there the three bits behind the highest one tell the step. */
std::size_t Latency::classOf(std::uint64_t time) {
    if (time < steps) {
        return static_cast<std::size_t>(time);
    }
    const auto exponent = static_cast<std::size_t>(std::bit_width(time)) - 4;
    const auto step = static_cast<std::size_t>(time >> exponent) - steps;
    return std::min((exponent + 1) * steps + step, steps * doublings - 1);
}

std::uint64_t Latency::endOf(std::size_t place) {
    if (place < steps) {
        return place;
    }
    const std::size_t exponent = place / steps - 1;
    return ((steps + place % steps + 1) << exponent) - 1;
}

void Latency::count(std::chrono::microseconds time) {
    ++_counts[classOf(static_cast<std::uint64_t>(std::max<std::int64_t>(time.count(), 0)))];
    ++_total;
}

std::chrono::microseconds Latency::quantile(double share) const {
    const double wanted = share * static_cast<double>(_total);
    std::uint64_t seen = 0;
    for (std::size_t place = 0; place < _counts.size(); ++place) {
        seen += _counts[place];
        if (seen > 0 && static_cast<double>(seen) >= wanted) {
            return std::chrono::microseconds(endOf(place));
        }
    }
    return std::chrono::microseconds(0);
}

} // namespace marlo::delivery
