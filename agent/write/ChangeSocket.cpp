#include "agent/write/ChangeSocket.h"

#include <cerrno>
#include <cstring>
#include <system_error>
#include <utility>

#include <libmnl/libmnl.h>
#include <linux/netlink.h>
#include <sys/socket.h>

namespace Orv::Agent::Linux {

namespace {

/** Room for the answers to the longest batch, which come before the sending returns. */
constexpr int receiveBytes = 1024 * 1024;

} // namespace

void ChangeBatch::add(std::uint16_t type, std::uint16_t flags, const KernelObject& object, std::string what) {
    const std::size_t begin = _messages.size();
    const std::size_t length = sizeof(nlmsghdr) + object.bytes().size();
    nlmsghdr header{};
    header.nlmsg_len = static_cast<std::uint32_t>(length);
    header.nlmsg_type = type;
    header.nlmsg_flags = static_cast<std::uint16_t>(NLM_F_REQUEST | NLM_F_ACK | flags);
    // Counted from the first message of the batch; the socket adds its own count.
    header.nlmsg_seq = static_cast<std::uint32_t>(_what.size());
    _messages.resize(begin + NLMSG_ALIGN(length));
    std::memcpy(&_messages[begin], &header, sizeof header);
    std::memcpy(&_messages[begin + sizeof header], object.bytes().data(), object.bytes().size());
    _what.push_back(std::move(what));
}

ChangeSocket::ChangeSocket() : _socket(receiveBytes) {
    _socket.tryOption(SOL_NETLINK, NETLINK_EXT_ACK, 1);
    _socket.tryOption(SOL_NETLINK, NETLINK_CAP_ACK, 1);
}

std::vector<Refusal> ChangeSocket::apply(ChangeBatch batch) {
    std::vector<Refusal> refusals;
    const auto count = static_cast<std::uint32_t>(batch._what.size());
    const std::uint32_t first = _sequence + 1;
    _sequence += count;
    for (std::size_t at = 0; at < batch._messages.size();) {
        auto* header = reinterpret_cast<nlmsghdr*>(&batch._messages[at]);
        header->nlmsg_seq += first;
        at += NLMSG_ALIGN(header->nlmsg_len);
    }
    if (count != 0) {
        _socket.send(batch._messages);
    }
    std::uint32_t answered = 0;
    const auto take = [&](const nlmsghdr& message) {
        const std::uint32_t place = message.nlmsg_seq - first;
        if (message.nlmsg_type != NLMSG_ERROR || place >= count) {
            return;
        }
        ++answered;
        if (const Verdict verdict = verdictOf(message); verdict.error != 0) {
            const std::string& what = batch._what[place];
            refusals.push_back(
                {place, verdict.error, verdict.explanation.empty() ? what : what + ": " + verdict.explanation});
        }
    };
    while (answered < count) {
        switch (_socket.receive(true, take)) {
        case NetlinkSocket::Received::messages:
            break;
        case NetlinkSocket::Received::nothing:
            throw std::system_error(ETIMEDOUT, std::generic_category(), "changing addresses and routes");
        case NetlinkSocket::Received::overrun:
            throw std::system_error(ENOBUFS, std::generic_category(), "changing addresses and routes");
        }
    }
    return refusals;
}

} // namespace Orv::Agent::Linux
