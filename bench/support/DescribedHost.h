/**
 * @file
 * A simulated host of any size for benchmarks.
 */
#pragma once

#include <string>

namespace marlo::bench {

/**
 * As long as it lives, the agent of this process reads a description of `adapters` adapters, each with every
 * property, its port and its card. The description is read once before the constructor returns. One at a time.
 */
class DescribedHost {
  public:
    explicit DescribedHost(int adapters);
    ~DescribedHost();
    DescribedHost(const DescribedHost&) = delete;
    DescribedHost& operator=(const DescribedHost&) = delete;

  private:
    std::string _path;
};

} // namespace marlo::bench
