#include "agent/events/WaitSet.h"

#include <cerrno>
#include <system_error>

#include <sys/epoll.h>

namespace Orv::Agent {

WaitSet::WaitSet() : _set(::epoll_create1(EPOLL_CLOEXEC)) {
    if (!_set) {
        throw std::system_error(errno, std::generic_category(), "epoll");
    }
}

void WaitSet::add(int descriptor) {
    epoll_event event{};
    event.events = EPOLLIN;
    if (::epoll_ctl(_set.number(), EPOLL_CTL_ADD, descriptor, &event) != 0) {
        throw std::system_error(errno, std::generic_category(), "epoll");
    }
}

} // namespace Orv::Agent
