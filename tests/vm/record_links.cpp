// record_links FILE < STEPS: writes the kernel's messages about links and teams down, step by step, as fixtures for
// tests elsewhere.
//
// A step is a line for the shell, or "cable eth0 off" or "on" (tests/vm/boot); "family" asks for the generic netlink
// family of teams and subscribes to what it announces, "options team0" asks for the options of a team. The file is
// text:
// "# " and what the system is, then a part per step, the first of them a dump of the links there are: "== " and the
// step, then a line per message: its bytes in hexadecimal digits, header first; "generic " in front of those that did
// not come through rtnetlink.
#include "agent/hardware/GenericFamily.h"
#include "agent/linux/TeamMessages.h"
#include "tests/vm/Cable.h"

#include <array>
#include <chrono>
#include <cstdint>
#include <cstdio>
#include <cstdlib>
#include <fstream>
#include <functional>
#include <iostream>
#include <memory>
#include <sstream>
#include <stdexcept>
#include <string>

#include <libmnl/libmnl.h>
#include <linux/if_team.h>
#include <linux/rtnetlink.h>
#include <net/if.h>
#include <poll.h>
#include <sys/utsname.h>

namespace {

namespace Hardware = Orv::Agent::Hardware;
using Hardware::NetlinkRequest;

/** How long nothing must come for a step to be over: longer than any timer of the kernel's between two messages. */
constexpr std::chrono::milliseconds quiet(1500);

struct SocketCloser {
    void operator()(mnl_socket* socket) const { mnl_socket_close(socket); }
};

using Socket = std::unique_ptr<mnl_socket, SocketCloser>;
using Handler = std::function<void(const nlmsghdr&)>;

Socket openSocket(int protocol, unsigned groups = 0) {
    Socket socket(mnl_socket_open(protocol));
    if (socket == nullptr || mnl_socket_bind(socket.get(), groups, MNL_SOCKET_AUTOPID) < 0) {
        throw std::runtime_error("no netlink socket");
    }
    return socket;
}

std::string digitsOf(const nlmsghdr& message) {
    const auto* bytes = reinterpret_cast<const std::uint8_t*>(&message);
    std::array<char, 3> digits{};
    std::string text;
    for (std::size_t i = 0; i < message.nlmsg_len; ++i) {
        std::snprintf(digits.data(), digits.size(), "%02x", bytes[i]);
        text += digits.data();
    }
    return text;
}

/** One datagram. False at the end of an answer. */
bool receive(mnl_socket& socket, const Handler& handler) {
    alignas(nlmsghdr) std::array<char, 65536> buffer{};
    int length = static_cast<int>(mnl_socket_recvfrom(&socket, buffer.data(), buffer.size()));
    if (length < 0) {
        throw std::runtime_error("messages were lost");
    }
    const auto* message = reinterpret_cast<const nlmsghdr*>(buffer.data());
    for (; mnl_nlmsg_ok(message, length); message = mnl_nlmsg_next(message, &length)) {
        if (message->nlmsg_type == NLMSG_ERROR || (message->nlmsg_type == NLMSG_DONE && message->nlmsg_seq != 0)) {
            return false;
        }
        if (message->nlmsg_type >= NLMSG_MIN_TYPE) {
            handler(*message);
        }
    }
    return true;
}

bool isWaiting(const Socket& socket, std::chrono::milliseconds time = {}) {
    pollfd waiting{mnl_socket_get_fd(socket.get()), POLLIN, 0};
    return poll(&waiting, 1, static_cast<int>(time.count())) > 0;
}

/** What answers a request. */
void ask(int protocol, NetlinkRequest request, const Handler& handler) {
    const Socket socket = openSocket(protocol);
    request.message().nlmsg_seq = 1;
    if (mnl_socket_sendto(socket.get(), &request.message(), request.message().nlmsg_len) < 0) {
        throw std::runtime_error("no answer");
    }
    while (receive(*socket, handler)) {
    }
}

Hardware::Bytes payloadOf(const nlmsghdr& message) {
    return {static_cast<const std::byte*>(mnl_nlmsg_get_payload(&message)), mnl_nlmsg_get_payload_len(&message)};
}

/** Plays the steps and writes down what comes of each. */
class Recorder {
  public:
    explicit Recorder(std::ostream& out) : _out(out) {}

    void dumpLinks() {
        NetlinkRequest request(RTM_GETLINK, NLM_F_DUMP);
        request.put<ifinfomsg>();
        ask(NETLINK_ROUTE, request, [this](const nlmsghdr& message) { writeLink(message); });
    }

    void perform(const std::string& step) {
        if (step.rfind("cable ", 0) == 0) {
            Orv::Test::askMachine(step);
        } else if (step == "family") {
            findFamily();
        } else if (step.rfind("options ", 0) == 0) {
            readOptions(step.substr(8));
        } else if (std::system(step.c_str()) != 0) {
            throw std::runtime_error(step);
        }
    }

    /** Until nothing has come for a while. What teams say comes behind what links said before. */
    void listen() {
        std::array<pollfd, 2> sockets{
            {{mnl_socket_get_fd(_links.get()), POLLIN, 0}, {mnl_socket_get_fd(_teams.get()), POLLIN, 0}}};
        while (poll(sockets.data(), sockets.size(), static_cast<int>(quiet.count())) > 0) {
            std::ostringstream ofTeams;
            while (isWaiting(_teams)) {
                receive(*_teams, [&](const nlmsghdr& message) { writeGeneric(ofTeams, message); });
            }
            while (isWaiting(_links)) {
                receive(*_links, [this](const nlmsghdr& message) { writeLink(message); });
            }
            _out << ofTeams.str();
        }
    }

  private:
    void writeLink(const nlmsghdr& message) {
        if (message.nlmsg_type == RTM_NEWLINK || message.nlmsg_type == RTM_DELLINK) {
            _out << digitsOf(message) << '\n';
        }
    }

    static void writeGeneric(std::ostream& out, const nlmsghdr& message) {
        out << "generic " << digitsOf(message) << '\n';
    }

    void findFamily() {
        ask(NETLINK_GENERIC, Hardware::familyRequest(TEAM_GENL_NAME), [this](const nlmsghdr& message) {
            writeGeneric(_out, message);
            const auto family = Hardware::parseFamily(payloadOf(message)).value();
            _family = family.type;
            int group = family.groups.at(TEAM_GENL_CHANGE_EVENT_MC_GRP_NAME);
            mnl_socket_setsockopt(_teams.get(), NETLINK_ADD_MEMBERSHIP, &group, sizeof group);
        });
    }

    void readOptions(const std::string& team) {
        const auto index = static_cast<int>(if_nametoindex(team.c_str()));
        ask(NETLINK_GENERIC, Orv::Agent::Linux::teamOptionsRequest(_family, index),
            [this](const nlmsghdr& message) { writeGeneric(_out, message); });
    }

    std::ostream& _out;
    Socket _links = openSocket(NETLINK_ROUTE, RTMGRP_LINK);
    Socket _teams = openSocket(NETLINK_GENERIC);
    std::uint16_t _family = 0;
};

void record(std::istream& steps, std::ostream& out) {
    utsname system{};
    uname(&system);
    out << "# " << system.sysname << ' ' << system.release << ' ' << system.version << ' ' << system.machine << '\n';
    Recorder recorder(out);
    out << "== dump\n";
    recorder.dumpLinks();
    for (std::string step; std::getline(steps, step);) {
        std::cout << step << std::endl;
        out << "== " << step << '\n';
        recorder.perform(step);
        recorder.listen();
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
