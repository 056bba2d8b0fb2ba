/**
 * @file
 * How long things took, counted in classes of time.
 */
#pragma once

#include <array>
#include <chrono>
#include <cstddef>
#include <cstdint>

namespace marlo::delivery {

/** A histogram with eight classes to each doubling of the time, from 1 µs to three hours: right to within an eighth.
 */
class Latency {
  public:
    void count(std::chrono::microseconds time);

    /** The upper end of the class in which that share of all times ends; `share` in (0, 1]. 0 when there are none. */
    [[nodiscard]] std::chrono::microseconds quantile(double share) const;

  private:
    static constexpr std::size_t steps = 8; ///< of a doubling
    static constexpr std::size_t doublings = 32;

    static std::size_t classOf(std::uint64_t time);
    static std::uint64_t endOf(std::size_t place);

    std::array<std::uint32_t, steps * doublings> _counts{};
    std::uint64_t _total = 0;
};

} // namespace marlo::delivery
