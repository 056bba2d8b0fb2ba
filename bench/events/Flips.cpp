#include "bench/events/Flips.h"

#include <array>
#include <cerrno>
#include <cstdlib>
#include <fstream>
#include <stdexcept>
#include <string>
#include <system_error>

#include <linux/if.h>
#include <linux/netlink.h>
#include <linux/rtnetlink.h>
#include <poll.h>
#include <pthread.h>
#include <sched.h>
#include <sys/socket.h>
#include <unistd.h>

extern "C" unsigned int if_nametoindex(const char* name); // its header and linux/if.h do not go together

namespace marlo::bench {

namespace {

using Clock = std::chrono::steady_clock;

[[noreturn]] void fail(const char* what) {
    throw std::system_error(errno, std::generic_category(), what);
}

int openSocket(unsigned groups) {
    const int socket = ::socket(AF_NETLINK, SOCK_RAW | SOCK_CLOEXEC, NETLINK_ROUTE);
    sockaddr_nl address{};
    address.nl_family = AF_NETLINK;
    address.nl_groups = groups;
    if (socket < 0 || ::bind(socket, reinterpret_cast<const sockaddr*>(&address), sizeof(address)) != 0) {
        fail("a netlink socket");
    }
    const int bytes = 8 << 20;
    (void)::setsockopt(socket, SOL_SOCKET, SO_RCVBUFFORCE, &bytes, sizeof(bytes));
    return socket;
}

/** Without it the witness is late where processors are few, and what it measures too short. */
void takeHighestPriority(std::thread& thread) {
    const sched_param parameters{50};
    const int error = pthread_setschedparam(thread.native_handle(), SCHED_FIFO, &parameters);
    if (error != 0) {
        throw std::system_error(error, std::generic_category(), "a real-time priority for the witness");
    }
}

} // namespace

void makeNamespace(int interfaces) {
    if (::unshare(CLONE_NEWNET) != 0) {
        fail("a network namespace, which needs root");
    }
    const std::string name = "/tmp/marlo-bench-links-" + std::to_string(::getpid());
    {
        std::ofstream batch(name);
        for (int pair = 0; pair < interfaces / 2; ++pair) {
            batch << "link add left" << pair << " type veth peer name right" << pair << '\n';
            if (pair > 0) {
                batch << "link set left" << pair << " up\nlink set right" << pair << " up\n";
            }
        }
    }
    const int status = std::system(("ip -batch " + name).c_str()); // NOLINT(cert-env33-c): nothing from outside
    ::unlink(name.c_str());
    if (status != 0) {
        throw std::runtime_error("ip cannot make the interfaces");
    }
}

Flips::Flips()
    : _index(static_cast<int>(if_nametoindex("left0"))),
      _requests(openSocket(0)),
      _notifications(openSocket(RTMGRP_LINK)),
      _witness([this] { witness(); }) {
    takeHighestPriority(_witness);
}

Flips::~Flips() {
    _stop = true;
    _witness.join();
    ::close(_requests);
    ::close(_notifications);
}

void Flips::witness() {
    std::array<char, 1 << 16> buffer{};
    while (!_stop) {
        pollfd waiting{_notifications, POLLIN, 0};
        if (::poll(&waiting, 1, 100) > 0) {
            const ssize_t length = ::recv(_notifications, buffer.data(), buffer.size(), 0);
            note(buffer.data(), length > 0 ? static_cast<std::size_t>(length) : 0);
        }
    }
}

void Flips::note(const char* bytes, std::size_t length) {
    const std::int64_t now = Clock::now().time_since_epoch().count();
    _last = now;
    const auto* header = reinterpret_cast<const nlmsghdr*>(bytes);
    for (auto left = static_cast<unsigned>(length); NLMSG_OK(header, left); header = NLMSG_NEXT(header, left)) {
        const auto* link = static_cast<const ifinfomsg*>(NLMSG_DATA(header));
        const int up = (link->ifi_flags & IFF_UP) != 0 ? 1 : 0;
        if (header->nlmsg_type == RTM_NEWLINK && link->ifi_index == _index && up == _wanted) {
            _wanted = -1;
            _seen = now;
        }
    }
}

Clock::time_point Flips::flip(bool up) {
    struct {
        nlmsghdr header;
        ifinfomsg link;
    } request{};

    request.header.nlmsg_len = sizeof(request);
    request.header.nlmsg_type = RTM_NEWLINK;
    request.header.nlmsg_flags = NLM_F_REQUEST;
    request.link.ifi_family = AF_UNSPEC;
    request.link.ifi_index = _index;
    request.link.ifi_change = IFF_UP;
    request.link.ifi_flags = up ? IFF_UP : 0;
    _seen = 0;
    _wanted = up ? 1 : 0;
    if (::send(_requests, &request, sizeof(request), 0) < 0) {
        fail("a request to the kernel");
    }
    const Clock::time_point end = Clock::now() + std::chrono::seconds(10);
    while (_seen == 0) {
        if (Clock::now() > end) {
            throw std::runtime_error("the kernel does not tell of the interface");
        }
        std::this_thread::sleep_for(std::chrono::microseconds(100));
    }
    return Clock::time_point(Clock::duration(_seen));
}

void Flips::waitUntilQuiet() const {
    const auto quiet = std::chrono::seconds(2);
    const Clock::time_point start = Clock::now();
    for (;;) {
        std::this_thread::sleep_for(std::chrono::milliseconds(100));
        const Clock::time_point now = Clock::now();
        if (now - start > quiet && now - Clock::time_point(Clock::duration(_last)) > quiet) {
            return;
        }
    }
}

} // namespace marlo::bench
