/**
 * @file
 * Telling the service manager how the server is doing (sd_notify(3)).
 */
#pragma once

#include <string>

namespace marlo::server {

/**
 * Sends an assignment or several lines of them, "READY=1", to the datagram socket that `$NOTIFY_SOCKET` names;
 * nothing where there is none. The protocol is a datagram of text, which systemd documents as stable: no library is
 * needed.
 */
void notifyManager(const std::string& state);

/** "RELOADING=1" with the monotonic time that systemd wants beside it. */
void notifyReloading();

} // namespace marlo::server
