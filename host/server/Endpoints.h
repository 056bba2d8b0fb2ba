/**
 * @file
 * Addresses to listen on, as people write them.
 */
#pragma once

#include "host/http/Server.h"

#include <string>
#include <vector>

namespace marlo::server {

/** The registered ports of CIM-XML over HTTP and HTTPS (IANA: wbem-http, wbem-https). */
constexpr unsigned short HttpPort = 5988;
constexpr unsigned short HttpsPort = 5989;

/**
 * "127.0.0.1:5988" or "[::1]:5988": a numeric address and a port, 0 for one that is free. Throws
 * std::invalid_argument with the reason; so for an address beyond loopback without TLS, where everybody on the way
 * could read passwords.
 */
http::Endpoint parseEndpoint(const std::string& text, http::Transport transport);

/** Whether an address, numeric, is reached from this host alone: 127.0.0.0/8 or ::1. */
bool isLoopback(const std::string& address);

/** "http", "https" or "local". */
std::string nameOf(http::Transport transport);

/** As parseEndpoint reads it; the path of a Unix domain socket. */
std::string toString(const http::Endpoint& endpoint);

/** Both loopback addresses with the port of the transport; IPv6 only where this host has it. */
std::vector<http::Endpoint> loopbackEndpoints(http::Transport transport);

/** True when another socket listens there by now. Of a Unix domain socket: when somebody answers. */
bool isBusy(const http::Endpoint& endpoint);

} // namespace marlo::server
