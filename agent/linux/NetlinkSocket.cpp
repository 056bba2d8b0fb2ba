#include "agent/linux/NetlinkSocket.h"

#include <array>
#include <cerrno>
#include <cstddef>
#include <cstring>
#include <string>
#include <system_error>

#include <arpa/inet.h>
#include <libmnl/libmnl.h>
#include <linux/filter.h>
#include <linux/rtnetlink.h>
#include <sys/socket.h>
#include <sys/time.h>

namespace Orv::Agent::Linux {

namespace {

/** The kernel fills dump datagrams up to 32 KiB; single messages beyond that are rare and make the buffer grow. */
constexpr std::size_t initialBufferBytes = 64UL * 1024;
constexpr std::size_t largestBufferBytes = 16UL * 1024 * 1024;

constexpr timeval answerTimeout{10, 0};

/** Room for the answer to a request; what exceeds it makes the kernel wait, not drop. */
constexpr int requestReceiveBytes = 256 * 1024;

/**
 * No queue holds more datagrams than this, so a drain that has seen as many has seen all that waited when it began,
 * and a steady flood cannot hold it up for ever.
 */
constexpr unsigned longestDrain = 1U << 18U;

[[noreturn]] void fail(int error, const std::string& what) {
    throw std::system_error(error, std::generic_category(), what);
}

} // namespace

void NetlinkSocket::Close::operator()(mnl_socket* socket) const {
    mnl_socket_close(socket);
}

NetlinkSocket::NetlinkSocket(int receiveBytes, int protocol)
    : _socket(mnl_socket_open2(protocol, SOCK_CLOEXEC)), _buffer(initialBufferBytes / sizeof(std::uint32_t)) {
    if (!_socket || mnl_socket_bind(_socket.get(), 0, MNL_SOCKET_AUTOPID) < 0) {
        fail(errno, "opening a netlink socket");
    }
    setOption(SOL_SOCKET, SO_RCVBUF, receiveBytes, "sizing a netlink socket");
    tryOption(SOL_SOCKET, SO_RCVBUFFORCE, receiveBytes);
    if (setsockopt(descriptor(), SOL_SOCKET, SO_RCVTIMEO, &answerTimeout, sizeof answerTimeout) < 0) {
        fail(errno, "setting a netlink timeout");
    }
}

int NetlinkSocket::descriptor() const {
    return mnl_socket_get_fd(_socket.get());
}

void NetlinkSocket::setOption(int level, int option, int value, const char* what) {
    if (setsockopt(descriptor(), level, option, &value, sizeof value) < 0) {
        fail(errno, what);
    }
}

void NetlinkSocket::tryOption(int level, int option, int value) {
    setsockopt(descriptor(), level, option, &value, sizeof value);
}

void NetlinkSocket::send(const nlmsghdr& message) {
    send(std::span(reinterpret_cast<const std::uint8_t*>(&message), message.nlmsg_len));
}

void NetlinkSocket::send(std::span<const std::uint8_t> messages) {
    if (mnl_socket_sendto(_socket.get(), messages.data(), messages.size()) < 0) {
        fail(errno, "sending a netlink request");
    }
}

/** Waits for a datagram and grows the buffer to its size: an answer cut short would be lost as a whole. */
void NetlinkSocket::makeRoom() {
    const ssize_t length = recv(descriptor(), nullptr, 0, MSG_PEEK | MSG_TRUNC);
    if (length > 0 && static_cast<std::size_t>(length) > _buffer.size() * sizeof(std::uint32_t)) {
        _buffer.resize(static_cast<std::size_t>(length) / sizeof(std::uint32_t) + 1);
    }
}

NetlinkSocket::Received NetlinkSocket::receive(bool wait, const MessageHandler& handler) {
    if (wait) {
        makeRoom();
    }
    sockaddr_nl sender{};
    iovec vector{_buffer.data(), _buffer.size() * sizeof(std::uint32_t)};
    msghdr header{};
    header.msg_name = &sender;
    header.msg_namelen = sizeof sender;
    header.msg_iov = &vector;
    header.msg_iovlen = 1;
    const ssize_t length = recvmsg(descriptor(), &header, wait ? 0 : MSG_DONTWAIT);
    if (length < 0) {
        switch (errno) {
        case EAGAIN:
            return Received::nothing;
        case EINTR:
            return receive(wait, handler);
        case ENOBUFS:
            return Received::overrun;
        default:
            fail(errno, "receiving from the kernel");
        }
    }
    if ((header.msg_flags & MSG_TRUNC) != 0) {
        if (_buffer.size() * sizeof(std::uint32_t) >= largestBufferBytes) {
            fail(EMSGSIZE, "receiving from the kernel");
        }
        _buffer.resize(_buffer.size() * 2);
        return Received::overrun;
    }
    // Another process may write to this socket; only the kernel has port 0.
    if (sender.nl_pid == 0) {
        dispatch(static_cast<std::size_t>(length), handler);
    }
    return Received::messages;
}

void NetlinkSocket::dispatch(std::size_t length, const MessageHandler& handler) const {
    int left = static_cast<int>(length);
    const auto* message = reinterpret_cast<const nlmsghdr*>(_buffer.data());
    while (mnl_nlmsg_ok(message, left)) {
        handler(*message);
        message = mnl_nlmsg_next(message, &left);
    }
}

/** What has been seen of the answer to one request. */
struct RequestSocket::Answer {
    std::uint32_t sequence;
    const char* what;
    const MessageHandler& handler;
    bool finished = false;
    Dump dump = Dump::consistent;

    void take(const nlmsghdr& message);
    void takeEnd(const nlmsghdr& message);
};

namespace {

/** The kernel's explanation, which follows the error number (and, unless capped, the request that it refuses). */
std::string explanationOf(const nlmsghdr& message, std::size_t skip) {
    std::string text;
    const std::size_t length = mnl_nlmsg_get_payload_len(&message);
    if ((message.nlmsg_flags & NLM_F_ACK_TLVS) == 0 || skip > length) {
        return text;
    }
    const auto* bytes = static_cast<const char*>(mnl_nlmsg_get_payload(&message));
    auto left = static_cast<int>(length - skip);
    const auto* attribute = reinterpret_cast<const nlattr*>(bytes + skip);
    while (mnl_attr_ok(attribute, left)) {
        if (mnl_attr_get_type(attribute) == NLMSGERR_ATTR_MSG) {
            const auto* begin = static_cast<const char*>(mnl_attr_get_payload(attribute));
            text.assign(begin, strnlen(begin, mnl_attr_get_payload_len(attribute)));
        }
        left -= static_cast<int>(MNL_ALIGN(attribute->nla_len));
        attribute = mnl_attr_next(attribute);
    }
    return text;
}

/** Where the attributes begin in an error or end message. */
std::size_t explanationOffset(const nlmsghdr& message) {
    if (message.nlmsg_type == NLMSG_DONE) {
        return sizeof(int);
    }
    const auto* error = static_cast<const nlmsgerr*>(mnl_nlmsg_get_payload(&message));
    const bool capped = (message.nlmsg_flags & NLM_F_CAPPED) != 0;
    const std::size_t echo =
        capped || error->msg.nlmsg_len < MNL_NLMSG_HDRLEN ? 0 : MNL_ALIGN(error->msg.nlmsg_len) - MNL_NLMSG_HDRLEN;
    return sizeof(nlmsgerr) + echo;
}

} // namespace

Verdict verdictOf(const nlmsghdr& message) {
    const std::size_t least = message.nlmsg_type == NLMSG_ERROR ? sizeof(nlmsgerr) : sizeof(int);
    if (mnl_nlmsg_get_payload_len(&message) < least) {
        return {};
    }
    int error = 0;
    std::memcpy(&error, mnl_nlmsg_get_payload(&message), sizeof error);
    return error < 0 ? Verdict{-error, explanationOf(message, explanationOffset(message))} : Verdict{};
}

void RequestSocket::Answer::takeEnd(const nlmsghdr& message) {
    finished = true;
    if (const Verdict verdict = verdictOf(message); verdict.error != 0) {
        fail(verdict.error, verdict.explanation.empty() ? what : std::string(what) + ": " + verdict.explanation);
    }
}

void RequestSocket::Answer::take(const nlmsghdr& message) {
    // What is left of the answer to an earlier request that was given up.
    if (message.nlmsg_seq != sequence) {
        return;
    }
    if ((message.nlmsg_flags & NLM_F_DUMP_INTR) != 0) {
        dump = Dump::interrupted;
    }
    if (message.nlmsg_type == NLMSG_DONE || message.nlmsg_type == NLMSG_ERROR) {
        takeEnd(message);
    } else if (message.nlmsg_type >= NLMSG_MIN_TYPE) {
        handler(message);
        finished = finished || (message.nlmsg_flags & NLM_F_MULTI) == 0;
    }
}

RequestSocket::RequestSocket() : _socket(requestReceiveBytes) {
    // Explanations since Linux 4.12, filters in dump requests since 4.20; without them errors are numbers and the
    // filters are applied here.
    _socket.tryOption(SOL_NETLINK, NETLINK_EXT_ACK, 1);
    _socket.tryOption(SOL_NETLINK, NETLINK_GET_STRICT_CHK, 1);
}

RequestSocket::Dump RequestSocket::dump(nlmsghdr& request, const char* what, const MessageHandler& handler) {
    request.nlmsg_flags = NLM_F_REQUEST | NLM_F_DUMP;
    return exchange(request, what, handler);
}

void RequestSocket::get(nlmsghdr& request, const char* what, const MessageHandler& handler) {
    request.nlmsg_flags = NLM_F_REQUEST;
    exchange(request, what, handler);
}

RequestSocket::Dump RequestSocket::exchange(nlmsghdr& request, const char* what, const MessageHandler& handler) {
    request.nlmsg_seq = ++_sequence;
    _socket.send(request);
    Answer answer{_sequence, what, handler};
    while (!answer.finished) {
        switch (_socket.receive(true, [&](const nlmsghdr& message) { answer.take(message); })) {
        case NetlinkSocket::Received::messages:
            break;
        case NetlinkSocket::Received::nothing:
            fail(ETIMEDOUT, what);
        case NetlinkSocket::Received::overrun:
            answer.dump = Dump::interrupted;
            break;
        }
    }
    return answer.dump;
}

NotificationSocket::NotificationSocket(int receiveBytes, int protocol) : _socket(receiveBytes, protocol) {}

void NotificationSocket::subscribe(int group) {
    _socket.setOption(SOL_NETLINK, NETLINK_ADD_MEMBERSHIP, group, "subscribing to kernel notifications");
}

void NotificationSocket::ignoreOtherRoutes() {
    constexpr std::uint32_t destinationLength = NLMSG_HDRLEN + offsetof(rtmsg, rtm_dst_len);
    constexpr std::uint32_t table = NLMSG_HDRLEN + offsetof(rtmsg, rtm_table);
    constexpr std::uint32_t everything = 0xffffffff;
    // Loads are in network order, the message type is in host order.
    std::array<sock_filter, 9> program{{
        BPF_STMT(BPF_LD | BPF_H | BPF_ABS, offsetof(nlmsghdr, nlmsg_type)),
        BPF_JUMP(BPF_JMP | BPF_JEQ | BPF_K, htons(RTM_NEWROUTE), 1, 0),
        BPF_JUMP(BPF_JMP | BPF_JEQ | BPF_K, htons(RTM_DELROUTE), 0, 4),
        BPF_STMT(BPF_LD | BPF_B | BPF_ABS, destinationLength),
        BPF_JUMP(BPF_JMP | BPF_JEQ | BPF_K, 0, 0, 3),
        BPF_STMT(BPF_LD | BPF_B | BPF_ABS, table),
        BPF_JUMP(BPF_JMP | BPF_JEQ | BPF_K, RT_TABLE_MAIN, 0, 1),
        BPF_STMT(BPF_RET | BPF_K, everything),
        BPF_STMT(BPF_RET | BPF_K, 0),
    }};
    const sock_fprog filter{static_cast<unsigned short>(program.size()), program.data()};
    if (setsockopt(descriptor(), SOL_SOCKET, SO_ATTACH_FILTER, &filter, sizeof filter) < 0) {
        fail(errno, "filtering kernel notifications");
    }
}

NotificationSocket::Drain NotificationSocket::drain(const MessageHandler& handler) {
    Drain result = Drain::complete;
    for (unsigned datagram = 0; datagram < longestDrain; ++datagram) {
        switch (_socket.receive(false, handler)) {
        case NetlinkSocket::Received::messages:
            break;
        case NetlinkSocket::Received::nothing:
            return result;
        case NetlinkSocket::Received::overrun:
            // Only an empty queue takes new messages again, and what it still holds came before the loss.
            result = Drain::overrun;
            break;
        }
    }
    return result;
}

} // namespace Orv::Agent::Linux
