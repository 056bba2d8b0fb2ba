#include "host/security/AccessList.h"

#include <algorithm>
#include <stdexcept>
#include <system_error>

namespace marlo::security {

namespace {

gid_t groupNamed(const std::string& name, const std::string& key) {
    const std::optional<gid_t> group = findGroup(name);
    if (!group) {
        throw std::runtime_error(key + ": there is no group \"" + name + "\"");
    }
    return *group;
}

std::string userNamed(const std::string& name, const std::string& key) {
    const std::optional<Account> account = findAccount(name);
    if (!account) {
        throw std::runtime_error(key + ": there is no user \"" + name + "\"");
    }
    return account->name;
}

} // namespace

AccessList::AccessList(const Access& access) {
    add(Role::read, "read", access.read);
    add(Role::change, "change", access.change);
    add(Role::subscribe, "subscribe", access.subscribe);
}

void AccessList::add(Role role, const char* key, const std::vector<std::string>& names) {
    Members members;
    members.role = role;
    for (const std::string& name : names) {
        if (name == "*") {
            members.everyone = true;
        } else if (name.starts_with('@')) {
            members.groups.insert(groupNamed(name.substr(1), key));
        } else {
            members.users.insert(userNamed(name, key));
        }
    }
    _members.push_back(std::move(members));
}

Identity AccessList::identityOf(const std::string& user) const {
    const std::optional<Account> account = findAccount(user);
    return account ? identityOf(*account) : Identity();
}

Identity AccessList::identityOf(const Account& account) const {
    const std::vector<gid_t> groups = groupsOf(account);
    Identity identity(account.name, {});
    for (const Members& members : _members) {
        if (members.everyone || members.users.contains(account.name) ||
            std::any_of(groups.begin(), groups.end(), [&](gid_t group) { return members.groups.contains(group); })) {
            identity.add(members.role);
            identity.add(Role::read);
        }
    }
    return identity.may(Role::read) ? identity : Identity();
}

} // namespace marlo::security
