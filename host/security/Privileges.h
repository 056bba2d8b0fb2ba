/**
 * @file
 * What a process that was started by root keeps of its power (capabilities(7)).
 */
#pragma once

#include <string>

namespace marlo::security {

/**
 * Gives up, for good, what the server and the programs that its providers run do not need. It stays root's process,
 * and so owner of the files in /etc and of /etc/shadow, but nothing lets it pass over modes and owners any more.
 *
 * What stays, as far as it was there: CAP_NET_ADMIN, to configure the network; CAP_CHOWN and CAP_FOWNER, so that a
 * configuration file that is replaced stays its owner's; CAP_NET_RAW and CAP_NET_BIND_SERVICE for DHCP clients, which
 * speak from port 68, and CAP_SETUID, CAP_SETGID and CAP_SYS_CHROOT for those that lock themselves in; CAP_KILL to
 * end them then; CAP_AUDIT_WRITE, without which PAM fails on a kernel with auditing.
 *
 * No program gains anything by set-user-ID or file capabilities (PR_SET_NO_NEW_PRIVS), and root's programs get no
 * more than the process has: this is why it keeps what only they need.
 *
 * Capabilities belong to threads: to be called before the first one is started, those of libraries included. Returns
 * a sentence for the log. Without root there is nothing to give up. Throws std::runtime_error when the kernel
 * refuses.
 */
std::string dropPrivileges();

} // namespace marlo::security
