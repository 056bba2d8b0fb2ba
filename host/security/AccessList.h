/**
 * @file
 * Who may do what, looked up.
 */
#pragma once

#include "host/security/Accounts.h"
#include "host/security/Gatekeeper.h"
#include "host/security/Identity.h"

#include <set>
#include <string>
#include <vector>

namespace marlo::security {

/** An Access whose names have been found in the system. Not changed once made: any thread. */
class AccessList {
  public:
    /** Throws std::runtime_error 'change: there is no group "x"'. */
    explicit AccessList(const Access& access);

    /** An account with its roles; nobody without an account or a role. */
    [[nodiscard]] Identity identityOf(const std::string& user) const;
    [[nodiscard]] Identity identityOf(const Account& account) const;

  private:
    struct Members {
        Role role = Role::read;
        bool everyone = false;
        std::set<std::string> users;
        std::set<gid_t> groups;
    };

    void add(Role role, const char* key, const std::vector<std::string>& names);

    std::vector<Members> _members;
};

} // namespace marlo::security
