#include "agent/library/SystemName.h"

#include "agent/text/Text.h"

#include <array>
#include <system_error>
#include <thread>
#include <utility>

#include <netdb.h>
#include <unistd.h>

namespace Orv::Agent {

/** One look-up: under way, or answered. */
struct SystemName::Answer {
    explicit Answer(std::string name) : hostName(std::move(name)) {}

    const std::string hostName;
    const Clock::time_point asked = Clock::now();
    std::mutex mutex; ///< guards what follows
    std::condition_variable arrived;
    bool isThere = false;
    std::optional<std::string> canonicalName;

    void give(std::optional<std::string> name) {
        {
            const std::lock_guard lock(mutex);
            canonicalName = std::move(name);
            isThere = true;
        }
        arrived.notify_all();
    }
};

namespace {

/** A hosts file may list this host beside the loopback's own names; those name every host. */
bool namesThisHost(const std::string& canonicalName) {
    return canonicalName.find('.') != std::string::npos && !canonicalName.starts_with("localhost");
}

} // namespace

std::optional<std::string> lookUpCanonicalName(const std::string& hostName) {
    addrinfo hints{};
    hints.ai_family = AF_UNSPEC;
    hints.ai_socktype = SOCK_STREAM;
    hints.ai_flags = AI_CANONNAME;
    addrinfo* found = nullptr;
    if (::getaddrinfo(hostName.c_str(), nullptr, &hints, &found) != 0) {
        return std::nullopt;
    }
    const std::unique_ptr<addrinfo, decltype(&::freeaddrinfo)> owned(found, &::freeaddrinfo);
    return found->ai_canonname == nullptr ? std::nullopt : std::optional(cleanText(found->ai_canonname));
}

std::string readHostName() {
    std::array<char, 256> buffer{}; // longer than HOST_NAME_MAX and always terminated
    if (::gethostname(buffer.data(), buffer.size() - 1) != 0 || buffer[0] == '\0') {
        return "localhost";
    }
    return cleanText(buffer.data());
}

SystemName::SystemName(LookUp lookUp, Clock::duration patience, Clock::duration retryAfter)
    : _lookUp(std::move(lookUp)), _patience(patience), _retryAfter(retryAfter) {}

void SystemName::startLookUp(const LookUp& lookUp, const std::shared_ptr<Answer>& answer) {
    try {
        std::thread([lookUp, answer] { answer->give(lookUp(answer->hostName)); }).detach();
    } catch (const std::system_error&) { // no thread to be had: the host name has to do
        answer->give(std::nullopt);
    }
}

std::string SystemName::nameFrom(const Answer& answer) {
    return answer.canonicalName && namesThisHost(*answer.canonicalName) ? *answer.canonicalName : answer.hostName;
}

bool SystemName::isUsable(const std::string& hostName) const {
    if (_answer == nullptr || _answer->hostName != hostName) {
        return false;
    }
    const std::lock_guard lock(_answer->mutex);
    return !_answer->isThere || _answer->canonicalName || Clock::now() - _answer->asked < _retryAfter;
}

std::string SystemName::get(const std::string& hostName) {
    if (hostName.find('.') != std::string::npos) {
        return hostName;
    }
    std::shared_ptr<Answer> answer;
    {
        const std::lock_guard lock(_mutex);
        if (!isUsable(hostName)) {
            _answer = std::make_shared<Answer>(hostName);
            startLookUp(_lookUp, _answer);
        }
        answer = _answer;
    }
    std::unique_lock lock(answer->mutex);
    // The wait counts from the question: who asks later does not wait anew for a name server that does not answer.
    answer->arrived.wait_until(lock, answer->asked + _patience, [&] { return answer->isThere; });
    return nameFrom(*answer);
}

} // namespace Orv::Agent
