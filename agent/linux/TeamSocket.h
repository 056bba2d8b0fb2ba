/**
 * @file
 * Hearing what the team driver says of its teams' options.
 */
#pragma once

#include "agent/hardware/Netlink.h"
#include "agent/linux/Messages.h"
#include "agent/linux/NetlinkSocket.h"

#include <cstdint>
#include <functional>
#include <optional>

namespace Orv::Agent::Linux {

/**
 * Generic netlink for the family "team", in the network namespace of the thread that made it, for good. Its sockets
 * are opened at once, since later threads may be in other namespaces; the family is asked for when there is a team: a
 * question about it loads the driver. Not thread-safe. Operations throw std::system_error, but for a kernel without
 * generic netlink or a process that may not ask (CAP_NET_ADMIN): such teams have no options.
 */
class TeamSocket {
  public:
    /** `receiveBytes` as of a NotificationSocket. */
    explicit TeamSocket(int receiveBytes);

    using Handler = std::function<void(const Message&)>;

    /**
     * Subscribes to changes of options and then gives all options of a team, in one message or several; nothing when
     * it is gone. What changes meanwhile is given by drain().
     */
    void read(int team, const Handler& handler);

    /** Gives the changes that wait, without blocking, as NotificationSocket::drain(). None before the first read().
     */
    NotificationSocket::Drain drain(const Handler& handler);

    /** Readable when changes wait; below 0 when none ever will. */
    [[nodiscard]] int descriptor() const { return _sockets ? _sockets->notifications.descriptor() : -1; }

  private:
    struct Sockets {
        explicit Sockets(int receiveBytes);

        Hardware::NetlinkSocket requests;
        NotificationSocket notifications;
    };

    bool subscribe();

    std::optional<Sockets> _sockets; ///< none when the kernel has no generic netlink, or refuses to answer
    std::uint16_t _family = 0;       ///< nlmsg_type of its messages; 0 before it is subscribed to
};

} // namespace Orv::Agent::Linux
