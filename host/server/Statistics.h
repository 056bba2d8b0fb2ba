/**
 * @file
 * What the server has answered so far, in numbers.
 */
#pragma once

#include <array>
#include <chrono>
#include <cstdint>
#include <map>
#include <mutex>
#include <string>
#include <vector>

namespace marlo::server {

/** Requests of one operation that ended in one way. */
struct RequestCount {
    std::string operation;
    std::string result; ///< "ok", "CIM_ERR_NOT_FOUND", "HTTP 401"
    std::uint64_t count = 0;
};

struct Latency {
    std::uint64_t median = 0; ///< microseconds, like the others; to the next power of the square root of two
    std::uint64_t high = 0;   ///< that 99 of 100 requests stay below
    std::uint64_t highest = 0;
};

/** Any thread. Memory is bounded, whatever clients call their operations. */
class Statistics {
  public:
    static constexpr std::size_t MostKinds = 200; ///< of operation and result; further ones count as "other"

    void count(const std::string& operation, const std::string& result, std::chrono::microseconds time);
    /** One whose time says nothing about the server. */
    void count(const std::string& operation, const std::string& result);

    [[nodiscard]] std::vector<RequestCount> requests() const;
    [[nodiscard]] Latency latency() const;

  private:
    static constexpr std::size_t Buckets = 80;

    void countLocked(const std::string& operation, const std::string& result);
    [[nodiscard]] std::uint64_t timeBelow(double share) const;

    mutable std::mutex _mutex; ///< guards all below
    std::map<std::pair<std::string, std::string>, std::uint64_t> _counts;
    std::array<std::uint64_t, Buckets> _times{}; ///< by the logarithm of the time
    std::uint64_t _total = 0;
    std::uint64_t _highest = 0;
};

} // namespace marlo::server
