#include "host/server/Notify.h"

#include <cstddef>
#include <cstdint>
#include <cstdlib>
#include <ctime>
#include <string_view>

#include <sys/socket.h>
#include <sys/un.h>
#include <unistd.h>

namespace marlo::server {

void notifyManager(const std::string& state) {
    const char* const name = ::secure_getenv("NOTIFY_SOCKET");
    sockaddr_un address{};
    const std::string_view path(name == nullptr ? "" : name);
    if (path.empty() || path.size() >= sizeof address.sun_path) {
        return;
    }
    address.sun_family = AF_UNIX;
    path.copy(address.sun_path, path.size());
    if (path.front() == '@') {
        address.sun_path[0] = '\0'; // a name in the abstract name space
    }
    const int fd = ::socket(AF_UNIX, SOCK_DGRAM | SOCK_CLOEXEC, 0);
    if (fd < 0) {
        return;
    }
    const auto length = static_cast<socklen_t>(offsetof(sockaddr_un, sun_path) + path.size());
    ::sendto(fd, state.data(), state.size(), MSG_NOSIGNAL | MSG_DONTWAIT, reinterpret_cast<const sockaddr*>(&address),
             length);
    ::close(fd);
}

void notifyReloading() {
    timespec now{};
    ::clock_gettime(CLOCK_MONOTONIC, &now);
    constexpr std::uint64_t microsecondsPerSecond = 1'000'000;
    constexpr std::uint64_t nanosecondsPerMicrosecond = 1000;
    const std::uint64_t microseconds = static_cast<std::uint64_t>(now.tv_sec) * microsecondsPerSecond +
                                       static_cast<std::uint64_t>(now.tv_nsec) / nanosecondsPerMicrosecond;
    notifyManager("RELOADING=1\nMONOTONIC_USEC=" + std::to_string(microseconds));
}

} // namespace marlo::server
