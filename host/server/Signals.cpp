#include "host/server/Signals.h"

#include <cerrno>
#include <system_error>

#include <sys/signalfd.h>
#include <unistd.h>

namespace marlo::server {

namespace {

sigset_t makeSet(std::initializer_list<int> numbers) {
    sigset_t set;
    sigemptyset(&set);
    for (const int number : numbers) {
        sigaddset(&set, number);
    }
    return set;
}

} // namespace

Signals::Signals(std::initializer_list<int> numbers) {
    const sigset_t set = makeSet(numbers);
    _descriptor = ::signalfd(-1, &set, SFD_CLOEXEC | SFD_NONBLOCK);
    if (_descriptor < 0) {
        throw std::system_error(errno, std::generic_category(), "cannot wait for signals");
    }
    ::pthread_sigmask(SIG_BLOCK, &set, &_before);
}

Signals::~Signals() {
    ::close(_descriptor);
    ::pthread_sigmask(SIG_SETMASK, &_before, nullptr);
}

std::optional<int> Signals::take() const {
    signalfd_siginfo info{};
    const auto size = ::read(_descriptor, &info, sizeof info);
    return size == static_cast<ssize_t>(sizeof info) ? std::optional(static_cast<int>(info.ssi_signo)) : std::nullopt;
}

} // namespace marlo::server
