/**
 * @file
 * The two sockets through which the kernel is heard: one for questions, one for its notifications.
 *
 * They stand on libmnl, which frames and checks messages and leaves everything else to its caller. A library with
 * object caches of its own would keep a second copy of every interface, hide when it re-reads, and lose sight of
 * which message made which difference, which is what this back end lives on.
 */
#pragma once

#include <cstdint>
#include <functional>
#include <memory>
#include <span>
#include <string>
#include <vector>

#include <linux/netlink.h>

struct mnl_socket;

namespace Orv::Agent::Linux {

/** Takes one message; it is valid during the call only. */
using MessageHandler = std::function<void(const nlmsghdr&)>;

/** How the kernel answered a request. */
struct Verdict {
    int error = 0;           ///< errno; 0: done
    std::string explanation; ///< the kernel's own words, where it has some
};

/** The verdict in a message of type NLMSG_ERROR or NLMSG_DONE. */
Verdict verdictOf(const nlmsghdr& message);

/**
 * A bound netlink socket in the network namespace of the thread that made it, for good, whichever thread uses it
 * later. Not thread-safe. Failures to set it up are thrown as std::system_error.
 */
class NetlinkSocket {
  public:
    /**
     * `receiveBytes` is the size asked for the kernel's queue; without privileges the system's limit cuts it.
     * `protocol` is a NETLINK_*.
     */
    explicit NetlinkSocket(int receiveBytes, int protocol = NETLINK_ROUTE);

    [[nodiscard]] int descriptor() const;

    /** What one receive brought. */
    enum class Received { messages, nothing, overrun };

    /**
     * Receives one datagram. `nothing`: none waits (or none came before the timeout); `overrun`: the kernel dropped
     * messages, or one that was not waited for did not fit the buffer, which then has grown. Throws
     * std::system_error.
     */
    Received receive(bool wait, const MessageHandler& handler);

    void send(const nlmsghdr& message);

    /** Sends messages one behind the other, each padded to four bytes, which the kernel works off in one go. */
    void send(std::span<const std::uint8_t> messages);

    void setOption(int level, int option, int value, const char* what);

    /** As setOption, for options that older kernels lack and that can be done without. */
    void tryOption(int level, int option, int value);

  private:
    struct Close {
        void operator()(mnl_socket* socket) const;
    };

    void makeRoom();
    void dispatch(std::size_t length, const MessageHandler& handler) const;

    std::unique_ptr<mnl_socket, Close> _socket;
    std::vector<std::uint32_t> _buffer; ///< of words, because messages are aligned to four
};

/** Asks, and collects the answer of one request at a time. */
class RequestSocket {
  public:
    RequestSocket();

    /** Whether a dump shows one state of the kernel, or entries may be missing because it changed meanwhile. */
    enum class Dump { consistent, interrupted };

    /**
     * Sends a dump request and hands over each object of the answer. `what` names it in errors. Throws
     * std::system_error with the kernel's own words where it has some, ETIMEDOUT when it does not answer.
     */
    Dump dump(nlmsghdr& request, const char* what, const MessageHandler& handler);

    /** As dump(), for a request that one message answers. */
    void get(nlmsghdr& request, const char* what, const MessageHandler& handler);

  private:
    struct Answer;

    Dump exchange(nlmsghdr& request, const char* what, const MessageHandler& handler);

    NetlinkSocket _socket;
    std::uint32_t _sequence = 0;
};

/** Hears what changes. */
class NotificationSocket {
  public:
    /** `receiveBytes` is the size of the queue; a smaller one overruns earlier. */
    explicit NotificationSocket(int receiveBytes, int protocol = NETLINK_ROUTE);

    /** Joins a group of the protocol: RTNLGRP_*, or what a family of generic netlink has. */
    void subscribe(int group);

    /**
     * Has the kernel drop routes that are no default route of the main table before they reach the queue: a routing
     * daemon announces them by the hundred thousand.
     */
    void ignoreOtherRoutes();

    /** Whether everything that was announced came through. */
    enum class Drain { complete, overrun };

    /**
     * Hands over everything that waits, without blocking. After `overrun` some messages are lost: each of those that
     * were handed over is true of its moment, but the present must be read anew.
     */
    Drain drain(const MessageHandler& handler);

    [[nodiscard]] int descriptor() const { return _socket.descriptor(); }

  private:
    NetlinkSocket _socket;
};

} // namespace Orv::Agent::Linux
