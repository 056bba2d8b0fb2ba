// record_links FILE < STEPS: writes the kernel's link messages down, step by step, as fixtures for tests elsewhere.
//
// A step is a line for the shell, or "cable eth0 off" or "on" (tests/vm/boot). The file is text: "# " and what the
// system is, then a part per step, the first of them a dump of the links there are: "== " and the step, then a line
// per message: its bytes in hexadecimal digits, header first.
#include "tests/vm/Cable.h"

#include <array>
#include <chrono>
#include <cstdint>
#include <cstdio>
#include <cstdlib>
#include <fstream>
#include <iostream>
#include <memory>
#include <stdexcept>
#include <string>

#include <libmnl/libmnl.h>
#include <linux/rtnetlink.h>
#include <poll.h>
#include <sys/utsname.h>

namespace {

/** How long nothing must come for a step to be over: longer than any timer of the kernel's between two messages. */
constexpr std::chrono::milliseconds quiet(1500);

struct SocketCloser {
    void operator()(mnl_socket* socket) const { mnl_socket_close(socket); }
};

using Socket = std::unique_ptr<mnl_socket, SocketCloser>;

Socket openSocket(unsigned groups) {
    Socket socket(mnl_socket_open(NETLINK_ROUTE));
    if (socket == nullptr || mnl_socket_bind(socket.get(), groups, MNL_SOCKET_AUTOPID) < 0) {
        throw std::runtime_error("no netlink socket");
    }
    return socket;
}

void write(std::ostream& out, const nlmsghdr& message) {
    const auto* bytes = reinterpret_cast<const std::uint8_t*>(&message);
    std::array<char, 3> digits{};
    for (std::size_t i = 0; i < message.nlmsg_len; ++i) {
        std::snprintf(digits.data(), digits.size(), "%02x", bytes[i]);
        out << digits.data();
    }
    out << '\n';
}

/** Writes down the messages that are there. False at the end of a dump. */
bool receive(mnl_socket& socket, std::ostream& out) {
    alignas(nlmsghdr) std::array<char, 65536> buffer{};
    int length = static_cast<int>(mnl_socket_recvfrom(&socket, buffer.data(), buffer.size()));
    if (length < 0) {
        throw std::runtime_error("messages were lost");
    }
    const auto* message = reinterpret_cast<const nlmsghdr*>(buffer.data());
    for (; mnl_nlmsg_ok(message, length); message = mnl_nlmsg_next(message, &length)) {
        if (message->nlmsg_type == NLMSG_DONE) {
            return false;
        }
        if (message->nlmsg_type == RTM_NEWLINK || message->nlmsg_type == RTM_DELLINK) {
            write(out, *message);
        }
    }
    return true;
}

void dump(std::ostream& out) {
    const Socket socket = openSocket(0);
    std::array<char, 128> buffer{};
    nlmsghdr* request = mnl_nlmsg_put_header(buffer.data());
    request->nlmsg_type = RTM_GETLINK;
    request->nlmsg_flags = NLM_F_REQUEST | NLM_F_DUMP;
    mnl_nlmsg_put_extra_header(request, sizeof(ifinfomsg));
    if (mnl_socket_sendto(socket.get(), request, request->nlmsg_len) < 0) {
        throw std::runtime_error("no dump");
    }
    while (receive(*socket, out)) {
    }
}

void perform(const std::string& step) {
    if (step.rfind("cable ", 0) == 0) {
        Orv::Test::askMachine(step);
    } else if (std::system(step.c_str()) != 0) {
        throw std::runtime_error(step);
    }
}

void record(std::istream& steps, std::ostream& out) {
    utsname system{};
    uname(&system);
    out << "# " << system.sysname << ' ' << system.release << ' ' << system.version << ' ' << system.machine << '\n';
    const Socket socket = openSocket(RTMGRP_LINK);
    out << "== dump\n";
    dump(out);
    for (std::string step; std::getline(steps, step);) {
        std::cout << step << std::endl;
        out << "== " << step << '\n';
        perform(step);
        pollfd waiting{mnl_socket_get_fd(socket.get()), POLLIN, 0};
        while (poll(&waiting, 1, static_cast<int>(quiet.count())) > 0) {
            receive(*socket, out);
        }
    }
}

} // namespace

int main(int argc, char** argv) {
    try {
        std::ofstream out(argc == 2 ? argv[1] : "");
        record(std::cin, out);
        return out.flush() ? 0 : 1;
    } catch (const std::exception& failure) {
        std::cerr << "record_links: " << failure.what() << '\n';
        return 1;
    }
}
