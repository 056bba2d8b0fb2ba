#include "agent/hardware/Netlink.h"

#include <cerrno>
#include <system_error>

#include <sys/socket.h>
#include <sys/time.h>

namespace Orv::Agent::Hardware {

namespace {

/** The kernel fills one datagram of a dump up to this size when the receiver offers as much. */
constexpr std::size_t receiveSize = 32768;

/** The kernel answers within the call; this only keeps a caller from waiting for ever. */
constexpr timeval patience{10, 0};

[[noreturn]] void fail(int error, const char* what) {
    throw std::system_error(error, std::generic_category(), what);
}

/** The error code of NLMSG_ERROR, or of an NLMSG_DONE that ends a dump which failed halfway; 0 for success. */
int errorOf(const nlmsghdr& message) {
    int error = 0;
    if (mnl_nlmsg_get_payload_len(&message) >= sizeof error) {
        std::memcpy(&error, mnl_nlmsg_get_payload(&message), sizeof error);
    }
    return -error;
}

} // namespace

NetlinkRequest::NetlinkRequest(std::uint16_t type, std::uint16_t flags) {
    nlmsghdr& header = *mnl_nlmsg_put_header(_buffer.data());
    header.nlmsg_type = type;
    const unsigned acknowledged = (flags & NLM_F_DUMP) == 0 ? NLM_F_ACK : 0;
    header.nlmsg_flags = static_cast<std::uint16_t>(NLM_F_REQUEST | flags | acknowledged);
}

NetlinkSocket::NetlinkSocket(int protocol) : _socket(mnl_socket_open2(protocol, SOCK_CLOEXEC)), _buffer(receiveSize) {
    if (!_socket || mnl_socket_bind(_socket.get(), 0, MNL_SOCKET_AUTOPID) < 0 ||
        setsockopt(mnl_socket_get_fd(_socket.get()), SOL_SOCKET, SO_RCVTIMEO, &patience, sizeof patience) < 0) {
        fail(errno, "netlink socket");
    }
}

bool NetlinkSocket::ask(NetlinkRequest& request, const Handler& handler) {
    nlmsghdr& message = request.message();
    message.nlmsg_seq = ++_sequence;
    if (mnl_socket_sendto(_socket.get(), &message, message.nlmsg_len) < 0) {
        fail(errno, "netlink request");
    }
    bool whole = true;
    while (true) {
        const ssize_t received = mnl_socket_recvfrom(_socket.get(), _buffer.data(), _buffer.size());
        if (received < 0) {
            if (errno == EINTR) {
                continue;
            }
            fail(errno == EAGAIN ? ETIMEDOUT : errno, "netlink answer");
        }
        auto rest = static_cast<int>(received);
        const auto* answer = static_cast<const nlmsghdr*>(static_cast<const void*>(_buffer.data()));
        for (; mnl_nlmsg_ok(answer, rest); answer = mnl_nlmsg_next(answer, &rest)) {
            if (handle(*answer, handler, whole) == Progress::Last) {
                return whole;
            }
        }
    }
}

NetlinkSocket::Progress NetlinkSocket::handle(const nlmsghdr& message, const Handler& handler, bool& whole) const {
    if (message.nlmsg_seq != _sequence || message.nlmsg_type == NLMSG_NOOP) {
        return Progress::More; // the rest of an earlier request that was given up
    }
    whole = whole && (message.nlmsg_flags & NLM_F_DUMP_INTR) == 0;
    if (message.nlmsg_type == NLMSG_ERROR || message.nlmsg_type == NLMSG_DONE) {
        if (const int error = errorOf(message); error != 0) {
            fail(error, "netlink answer");
        }
        return Progress::Last;
    }
    handler(
        Bytes(static_cast<const std::byte*>(mnl_nlmsg_get_payload(&message)), mnl_nlmsg_get_payload_len(&message)));
    return Progress::More;
}

} // namespace Orv::Agent::Hardware
