#include "host/security/AccessList.h"
#include "tests/support/Namespace.h"

#include <functional>
#include <stdexcept>
#include <string>

#include <gtest/gtest.h>

namespace {

using marlo::security::Access;
using marlo::security::AccessList;
using marlo::security::Identity;
using marlo::security::Role;

std::string rolesOf(const Identity& identity) {
    std::string roles = identity.name() + ":";
    roles += identity.may(Role::read) ? " read" : "";
    roles += identity.may(Role::change) ? " change" : "";
    roles += identity.may(Role::subscribe) ? " subscribe" : "";
    return roles;
}

std::string rolesOf(const Access& access, const std::string& user) {
    return rolesOf(AccessList(access).identityOf(user));
}

std::string refusalOf(const Access& access) {
    try {
        const AccessList list(access);
        return "taken";
    } catch (const std::runtime_error& error) {
        return error.what();
    }
}

TEST(Access, IsForThoseWhoAreNamed) {
    const Access access{{"root"}, {}, {}};
    EXPECT_EQ(rolesOf(access, "root"), "root: read");
    EXPECT_EQ(rolesOf(access, "daemon"), ":");
}

TEST(Access, ToChangeOrSubscribeIsAccessToRead) {
    EXPECT_EQ(rolesOf({{}, {"root"}, {}}, "root"), "root: read change");
    EXPECT_EQ(rolesOf({{}, {}, {"root"}}, "root"), "root: read subscribe");
    EXPECT_EQ(rolesOf({{"daemon"}, {"root"}, {"root"}}, "root"), "root: read change subscribe");
}

TEST(Access, OfEveryoneNeedsAnAccount) {
    EXPECT_EQ(rolesOf({{"*"}, {}, {}}, "daemon"), "daemon: read");
    EXPECT_EQ(rolesOf({{"*"}, {}, {}}, "no-such-user"), ":");
    EXPECT_EQ(rolesOf({{"*"}, {}, {}}, "*"), ":");
    EXPECT_EQ(rolesOf({{"*"}, {}, {}}, ""), ":");
}

TEST(Access, IsForWholeNamesOnly) {
    EXPECT_EQ(rolesOf({{"*"}, {}, {}}, std::string("root\0x", 6)), ":");
    EXPECT_EQ(rolesOf({{"*"}, {}, {}}, "root "), ":");
    EXPECT_EQ(rolesOf({{"*"}, {}, {}}, "0"), ":");
}

TEST(Access, OfNobodyIsWhatThereIsWithoutNames) {
    EXPECT_EQ(rolesOf({}, "root"), ":");
}

TEST(Access, RefusesNamesThatDoNotExist) {
    EXPECT_EQ(refusalOf({{"root", "no-such-user"}, {}, {}}), "read: there is no user \"no-such-user\"");
    EXPECT_EQ(refusalOf({{}, {"@no-such-group"}, {}}), "change: there is no group \"no-such-group\"");
    EXPECT_EQ(refusalOf({{}, {}, {"@"}}), "subscribe: there is no group \"\"");
    EXPECT_EQ(refusalOf({{""}, {}, {}}), "read: there is no user \"\"");
    EXPECT_EQ(refusalOf({{"root"}, {"@root"}, {"*"}}), "taken");
}

TEST(Access, OfAGroupIsForItsPrimaryAndItsOtherMembers) {
    REQUIRE_NAMESPACES();
    Orv::Test::Namespace system;
    system.replaceFile("/etc/passwd", "root:x:0:0::/root:/bin/sh\n"
                                      "primary:x:7001:7100::/:/bin/false\n"
                                      "member:x:7002:7002::/:/bin/false\n"
                                      "stranger:x:7003:7003::/:/bin/false\n");
    system.replaceFile("/etc/group", "root:x:0:\nnetwork:x:7100:member\nother:x:7101:stranger\n");
    system.run([] {
        const Access access{{"@other"}, {"@network"}, {}};
        EXPECT_EQ(rolesOf(access, "primary"), "primary: read change");
        EXPECT_EQ(rolesOf(access, "member"), "member: read change");
        EXPECT_EQ(rolesOf(access, "stranger"), "stranger: read");
        EXPECT_EQ(rolesOf(access, "root"), ":");
    });
}

TEST(Access, FindsAMemberOfManyGroups) {
    REQUIRE_NAMESPACES();
    Orv::Test::Namespace system;
    std::string groups = "root:x:0:\n";
    for (int id = 8000; id < 8100; ++id) {
        groups += "g" + std::to_string(id) + ":x:" + std::to_string(id) + ":busy\n";
    }
    system.replaceFile("/etc/passwd", "root:x:0:0::/root:/bin/sh\nbusy:x:7001:7001::/:/bin/false\n");
    system.replaceFile("/etc/group", groups);
    system.run([] { EXPECT_EQ(rolesOf({{"@g8099"}, {}, {}}, "busy"), "busy: read"); });
}

} // namespace
