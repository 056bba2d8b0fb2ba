#include "agent/events/WakeUp.h"

#include <cerrno>
#include <cstdint>
#include <system_error>

#include <sys/eventfd.h>
#include <unistd.h>

namespace Orv::Agent {

WakeUp::WakeUp() : _descriptor(::eventfd(0, EFD_CLOEXEC | EFD_NONBLOCK)) {
    if (_descriptor < 0) {
        throw std::system_error(errno, std::generic_category(), "making an eventfd");
    }
}

WakeUp::~WakeUp() {
    ::close(_descriptor);
}

void WakeUp::signal() const noexcept {
    const std::uint64_t one = 1;
    // The only failure is a counter that is full, which wakes as well.
    [[maybe_unused]] const ssize_t written = ::write(_descriptor, &one, sizeof one);
}

void WakeUp::clear() const noexcept {
    std::uint64_t count = 0;
    [[maybe_unused]] const ssize_t read = ::read(_descriptor, &count, sizeof count);
}

} // namespace Orv::Agent
