#include "host/server/Statistics.h"

#include <algorithm>
#include <cmath>

namespace marlo::server {

namespace {

/** Two buckets for each doubling of the time. */
constexpr double bucketsPerDoubling = 2.0;

std::size_t bucketOf(std::uint64_t microseconds, std::size_t buckets) {
    const double position = microseconds <= 1 ? 0 : bucketsPerDoubling * std::log2(static_cast<double>(microseconds));
    return std::min(static_cast<std::size_t>(std::ceil(position)), buckets - 1);
}

std::uint64_t upperEnd(std::size_t bucket) {
    return static_cast<std::uint64_t>(std::llround(std::exp2(static_cast<double>(bucket) / bucketsPerDoubling)));
}

} // namespace

void Statistics::countLocked(const std::string& operation, const std::string& result) {
    using Kind = std::pair<std::string, std::string>;
    auto found = _counts.find({operation, result});
    if (found == _counts.end()) {
        const bool isFull = _counts.size() >= MostKinds;
        found = _counts.try_emplace(isFull ? Kind("other", "other") : Kind(operation, result)).first;
    }
    ++found->second;
}

void Statistics::count(const std::string& operation, const std::string& result, std::chrono::microseconds time) {
    const auto microseconds = static_cast<std::uint64_t>(std::max<std::int64_t>(time.count(), 0));
    const std::lock_guard lock(_mutex);
    countLocked(operation, result);
    ++_times.at(bucketOf(microseconds, Buckets));
    ++_total;
    _highest = std::max(_highest, microseconds);
}

void Statistics::count(const std::string& operation, const std::string& result) {
    const std::lock_guard lock(_mutex);
    countLocked(operation, result);
}

std::vector<RequestCount> Statistics::requests() const {
    const std::lock_guard lock(_mutex);
    std::vector<RequestCount> all;
    all.reserve(_counts.size());
    for (const auto& [kind, count] : _counts) {
        all.push_back({kind.first, kind.second, count});
    }
    return all;
}

std::uint64_t Statistics::timeBelow(double share) const {
    const double wanted = share * static_cast<double>(_total);
    std::uint64_t seen = 0;
    for (std::size_t bucket = 0; bucket < Buckets; ++bucket) {
        seen += _times.at(bucket);
        if (seen > 0 && static_cast<double>(seen) >= wanted) {
            return std::min(upperEnd(bucket), _highest);
        }
    }
    return 0;
}

Latency Statistics::latency() const {
    constexpr double half = 0.5;
    constexpr double nearlyAll = 0.99;
    const std::lock_guard lock(_mutex);
    return {timeBelow(half), timeBelow(nearlyAll), _highest};
}

} // namespace marlo::server
