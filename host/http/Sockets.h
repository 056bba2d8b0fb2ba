/**
 * @file
 * Sockets by address.
 */
#pragma once

#include "host/http/Descriptor.h"
#include "host/http/Message.h"
#include "host/http/Server.h"

#include <string>

#include <sys/socket.h>

namespace marlo::http {

/** "127.0.0.1:5988", "[::1]:5989", "/run/marlo.sock". */
std::string toString(const Endpoint& endpoint);

/** A listening socket that does not block. Throws std::runtime_error that names the endpoint and the reason. */
Descriptor listenOn(const Endpoint& endpoint);

/** The port that a socket was given; 0 for a Unix domain socket. */
unsigned short portOf(int descriptor);

/** Who is at the other end of a connection that came in by `transport`. */
Peer peerOf(int descriptor, const sockaddr_storage& address, Transport transport);

/**
 * Bytes that were sent and that the other end's system has not acknowledged (SIOCOUTQ: tcp(7)); on a Unix domain
 * socket those that have not been read, with the kernel's overhead (unix(7)). 0 where there is no telling.
 */
std::size_t untaken(int descriptor);

/** Nothing waits for more to be sent with it: an answer that is given leaves at once. */
void sendAtOnce(int descriptor);

/**
 * What came is acknowledged now and not with what is sent next: a client that has sent a head, and does as Nagle
 * would (RFC 896), keeps the body back until then, and 40 ms are lost.
 */
void acknowledgeAtOnce(int descriptor);

} // namespace marlo::http
