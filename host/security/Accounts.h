/**
 * @file
 * The users and groups of the system (getpwnam(3), getgrnam(3)), wherever it has them from (nsswitch.conf(5)).
 */
#pragma once

#include <optional>
#include <string>
#include <vector>

#include <sys/types.h>

namespace marlo::security {

struct Account {
    std::string name;
    uid_t user = 0;
    gid_t group = 0; ///< the primary one
};

/** All: any thread. None when there is none; std::system_error, with the name, when the system could not tell. */
std::optional<Account> findAccount(const std::string& name);
std::optional<Account> findAccount(uid_t user);
std::optional<gid_t> findGroup(const std::string& name);

/** The primary group and the supplementary ones. */
std::vector<gid_t> groupsOf(const Account& account);

} // namespace marlo::security
