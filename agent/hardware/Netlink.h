/**
 * @file
 * Asking the kernel over netlink: one request, all its answers.
 */
#pragma once

#include "agent/hardware/Attributes.h"

#include <array>
#include <functional>
#include <memory>
#include <string>
#include <vector>

#include <libmnl/libmnl.h>

namespace Orv::Agent::Hardware {

/** A request under construction: a netlink header, a fixed structure and attributes. */
class NetlinkRequest {
  public:
    /** `flags` as NLM_F_DUMP; NLM_F_REQUEST and, where it is no dump, NLM_F_ACK are added. */
    NetlinkRequest(std::uint16_t type, std::uint16_t flags);

    /** Room for the structure behind the header, zeroed; once, before the attributes. */
    template <class Header>
    Header& put() {
        static_assert(std::is_trivially_copyable_v<Header>);
        return *static_cast<Header*>(mnl_nlmsg_put_extra_header(&message(), sizeof(Header)));
    }

    /** The message, to add attributes with libmnl; there is room for a few hundred octets. */
    nlmsghdr& message() { return *static_cast<nlmsghdr*>(static_cast<void*>(_buffer.data())); }

  private:
    alignas(nlmsghdr) std::array<std::byte, 512> _buffer{};
};

/** A netlink socket for requests of one thread. */
class NetlinkSocket {
  public:
    /** `protocol` as NETLINK_ROUTE. Throws std::system_error. */
    explicit NetlinkSocket(int protocol);

    /**
     * Receives the payload (all behind the netlink header) of an answer. What it throws leaves the rest of the answer
     * in the socket, which is of no use then.
     */
    using Handler = std::function<void(Bytes payload)>;

    /**
     * Sends a request and hands over its answers until the last. Returns false when the kernel marked the dump as
     * interrupted: what it describes changed underneath, so entries may be missing. Throws std::system_error with the
     * kernel's error code, also when it comes at the end of a dump, and with ETIMEDOUT when no answer comes.
     */
    bool ask(NetlinkRequest& request, const Handler& handler);

  private:
    enum class Progress { More, Last };

    Progress handle(const nlmsghdr& message, const Handler& handler, bool& whole) const;

    struct Closer {
        void operator()(mnl_socket* socket) const { mnl_socket_close(socket); }
    };

    std::unique_ptr<mnl_socket, Closer> _socket;
    std::vector<std::byte> _buffer;
    std::uint32_t _sequence = 0;
};

/**
 * The items of a dump that `parse` (Bytes to optional of Item) understands. A dump that was interrupted is repeated a
 * few times; when changes never pause, the last one counts.
 */
template <class Parse>
auto dump(NetlinkSocket& socket, NetlinkRequest& request, const Parse& parse) {
    std::vector<typename std::invoke_result_t<Parse, Bytes>::value_type> items;
    constexpr int attempts = 5;
    for (int attempt = 0; attempt < attempts; ++attempt) {
        items.clear();
        const bool whole = socket.ask(request, [&](Bytes payload) {
            if (auto item = parse(payload)) {
                items.push_back(std::move(*item));
            }
        });
        if (whole) {
            break;
        }
    }
    return items;
}

} // namespace Orv::Agent::Hardware
