/**
 * @file
 * The name of this host, cheap to ask for.
 */
#pragma once

#include <chrono>
#include <condition_variable>
#include <functional>
#include <memory>
#include <mutex>
#include <optional>
#include <string>

namespace Orv::Agent {

/** The canonical name that the system's name services know for a host name; none when they know none. May block. */
std::optional<std::string> lookUpCanonicalName(const std::string& hostName);

/** The host name of the kernel; "localhost" when it has none. */
std::string readHostName();

/**
 * The host's fully qualified name, remembered for as long as the host name stays the same.
 *
 * A look-up runs on a thread of its own and is waited for only so long: a management request must be answered on a
 * host whose name servers are out of reach, too. Until an answer is there the name is the host name. A look-up that
 * found nothing is repeated after some minutes.
 */
class SystemName {
  public:
    using LookUp = std::function<std::optional<std::string>(const std::string&)>;
    using Clock = std::chrono::steady_clock;

    /** `lookUp` is called on a thread that may outlive this object. */
    SystemName(LookUp lookUp, Clock::duration patience, Clock::duration retryAfter);

    /** The name for a host name. Any thread. */
    std::string get(const std::string& hostName);

  private:
    struct Answer;

    static void startLookUp(const LookUp& lookUp, const std::shared_ptr<Answer>& answer);
    static std::string nameFrom(const Answer& answer);
    bool isUsable(const std::string& hostName) const;

    const LookUp _lookUp;
    const Clock::duration _patience;
    const Clock::duration _retryAfter;
    std::mutex _mutex; ///< guards _answer
    std::shared_ptr<Answer> _answer;
};

} // namespace Orv::Agent
