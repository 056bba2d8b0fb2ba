#include "agent/persistence/ProcessHandle.h"

#include <algorithm>
#include <cerrno>
#include <system_error>

#include <poll.h>

// The header of glibc 2.36 does not say that its functions are C's.
extern "C" {
#include <sys/pidfd.h>
}

namespace Orv::Agent::Persistence {

using Clock = std::chrono::steady_clock;
using std::chrono::milliseconds;

ProcessHandle::ProcessHandle(pid_t process) : _handle(pidfd_open(process, 0)) {
    if (!_handle && errno != ESRCH) {
        throw std::system_error(errno, std::generic_category(), "pidfd_open");
    }
}

bool ProcessHandle::awaitEnd(milliseconds patience) const {
    const auto deadline = Clock::now() + patience;
    for (;;) {
        const auto left = std::chrono::ceil<milliseconds>(deadline - Clock::now());
        pollfd ended{_handle.number(), POLLIN, 0};
        const int count = ::poll(&ended, 1, static_cast<int>(std::max(left, milliseconds(0)).count()));
        if (count < 0 && errno != EINTR) {
            throw std::system_error(errno, std::generic_category(), "poll");
        }
        if (count > 0 || (count == 0 && left <= milliseconds(0))) {
            return count > 0;
        }
    }
}

void ProcessHandle::send(int signal) const {
    if (pidfd_send_signal(_handle.number(), signal, nullptr, 0) != 0 && errno != ESRCH) {
        throw std::system_error(errno, std::generic_category(), "a process cannot be ended");
    }
}

} // namespace Orv::Agent::Persistence
