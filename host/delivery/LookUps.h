/**
 * @file
 * Names of hosts and their addresses.
 */
#pragma once

#include <functional>
#include <memory>
#include <string>
#include <vector>

namespace marlo::delivery {

/**
 * Looks names up as the system does it (getaddrinfo), each on a thread of its own: such a look-up cannot be
 * interrupted, and one that takes its time must hold up neither another one nor the end of the process.
 */
class LookUps {
  public:
    /** Numeric addresses in the order in which they are to be tried, or the reason why there are none. */
    using Done = std::function<void(std::vector<std::string> addresses, const std::string& problem)>;
    using Post = std::function<void(std::function<void()>)>;

    /** Answers are given by way of `post`. */
    explicit LookUps(Post post);
    ~LookUps(); ///< what is still being looked up is never answered
    LookUps(const LookUps&) = delete;
    LookUps& operator=(const LookUps&) = delete;

    /** A name or a numeric address. Any thread. */
    void find(const std::string& host, Done done);

  private:
    struct State;

    static void begin(const std::shared_ptr<State>& state, std::string host, Done done);
    static void work(const std::shared_ptr<State>& state, std::string host, Done done);

    std::shared_ptr<State> _state;
};

} // namespace marlo::delivery
