#include "host/security/Accounts.h"

#include <cerrno>
#include <system_error>

#include <grp.h>
#include <pwd.h>

namespace marlo::security {

namespace {

/** What getpwnam_r and its like say instead of "there is none", depending on where the system asks. */
bool meansNone(int error) {
    return error == 0 || error == ENOENT || error == ESRCH || error == EBADF || error == EPERM;
}

/** Calls `look(record, buffer, size, found)` with ever more room; returns whether there is a record. */
template <typename Record, typename Look>
bool look(Record& record, std::vector<char>& buffer, const std::string& what, const Look& look) {
    constexpr std::size_t most = std::size_t{1} << 24; // groups of whole universities
    for (buffer.resize(4096);; buffer.resize(buffer.size() * 4)) {
        Record* found = nullptr;
        const int error = look(&record, buffer.data(), buffer.size(), &found);
        if (found != nullptr) {
            return true;
        }
        if (meansNone(error)) {
            return false;
        }
        if (error != ERANGE || buffer.size() >= most) {
            throw std::system_error(error, std::generic_category(), what);
        }
    }
}

template <typename Look>
std::optional<Account> findPasswd(const std::string& what, const Look& lookUp) {
    passwd record{};
    std::vector<char> buffer;
    if (!look(record, buffer, what, lookUp)) {
        return std::nullopt;
    }
    return Account{record.pw_name, record.pw_uid, record.pw_gid};
}

} // namespace

std::optional<Account> findAccount(const std::string& name) {
    if (name.find('\0') != std::string::npos) {
        return std::nullopt; // else what is before it would be looked up
    }
    return findPasswd("user \"" + name + "\"", [&](passwd* record, char* buffer, std::size_t size, passwd** found) {
        return getpwnam_r(name.c_str(), record, buffer, size, found);
    });
}

std::optional<Account> findAccount(uid_t user) {
    return findPasswd("user " + std::to_string(user),
                      [&](passwd* record, char* buffer, std::size_t size, passwd** found) {
                          return getpwuid_r(user, record, buffer, size, found);
                      });
}

std::optional<gid_t> findGroup(const std::string& name) {
    group record{};
    std::vector<char> buffer;
    const bool found = look(record, buffer, "group \"" + name + "\"",
                            [&](group* result, char* bytes, std::size_t size, group** where) {
                                return getgrnam_r(name.c_str(), result, bytes, size, where);
                            });
    return found ? std::optional<gid_t>(record.gr_gid) : std::nullopt;
}

std::vector<gid_t> groupsOf(const Account& account) {
    std::vector<gid_t> groups(32);
    int count = static_cast<int>(groups.size());
    while (getgrouplist(account.name.c_str(), account.group, groups.data(), &count) < 0) {
        groups.resize(groups.size() * 2);
        count = static_cast<int>(groups.size());
    }
    groups.resize(static_cast<std::size_t>(count));
    return groups;
}

} // namespace marlo::security
