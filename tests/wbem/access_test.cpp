/** @file Nobody gets in who should not: every method on every path, and every operation with every role. */
#include "host/wbem/Operation.h"
#include "tests/wbem/Host.h"
#include "tests/wbem/MemoryResponder.h"

#include <array>
#include <cctype>

#include <gmock/gmock.h>
#include <gtest/gtest.h>
#include <sys/socket.h>
#include <unistd.h>

namespace marlo::test {
namespace {

using security::Identity;
using security::Role;
using testing::HasSubstr;
using testing::Not;
using testing::StartsWith;

std::vector<wbem::Route> statusRoute() {
    return {{"GET", "/status", Role::read, [](const http::Request& /*request*/, const Identity& identity) {
                 http::Answer answer;
                 answer.body = "status for " + identity.name();
                 return answer;
             }}};
}

/** All that comes back over a connection of its own, by a peer of its own, until it is closed. */
std::string askOnce(http::Server& server, const std::string& request) {
    static unsigned peers = 0;
    std::array<int, 2> ends{};
    if (socketpair(AF_UNIX, SOCK_STREAM | SOCK_CLOEXEC, 0, ends.data()) != 0) {
        return "no socket pair";
    }
    ++peers;
    const std::string address = "10.0." + std::to_string(peers / 250) + "." + std::to_string(peers % 250);
    server.serve(ends[1], {http::Transport::tcp, address, 4000, std::nullopt, std::nullopt});
    send(ends[0], request.data(), request.size(), MSG_NOSIGNAL);
    shutdown(ends[0], SHUT_WR);
    std::string answer;
    std::array<char, 4096> buffer{};
    for (ssize_t count = 0; (count = recv(ends[0], buffer.data(), buffer.size(), 0)) > 0;) {
        answer.append(buffer.data(), static_cast<std::size_t>(count));
    }
    close(ends[0]);
    return answer;
}

const std::vector<std::string>& badCredentials() {
    static const std::vector<std::string> fields{
        "",
        "Authorization:\r\n",
        "Authorization: Basic\r\n",
        "Authorization: Basic \r\n",
        "Authorization: Basic ***\r\n",
        "Authorization: Basic bWFybG8\r\n",          // "marlo", without a colon
        "Authorization: Basic bWFybG86d3Jvbmc=\r\n", // "marlo:wrong"
        "Authorization: Basic Om9scmFt\r\n",         // ":olram"
        "Authorization: Basic bWFybG86\r\n",         // "marlo:"
        "Authorization: Bearer abcdef\r\n",
        "Authorization: " + Host::credentials(Host::everything) + ", Basic x\r\n",
        "Authorization: " + Host::credentials(Host::everything) +
            "\r\nAuthorization: " + Host::credentials(Host::everything) + "\r\n",
        "Authorization: Basic " + std::string(12000, 'A') + "\r\n",
        "X-Authorization: " + Host::credentials(Host::everything) + "\r\n",
        "Authorization: " + Host::credentials("nobody") + "\r\n", // an account without a role
    };
    return fields;
}

class EveryRoute : public testing::TestWithParam<std::string> {};

TEST_P(EveryRoute, IsShutToWhoeverHasNoGoodCredentials) {
    Host host({}, statusRoute());
    http::Server server(host.service(), {}, std::nullopt, {}, [](const std::string& /*line*/) {});
    for (const char* path : {"/", "/cimom", "/status", "/any/path?with=query", "*"}) {
        for (const std::string& credentials : badCredentials()) {
            const std::string answer =
                askOnce(server, GetParam() + " " + path + " HTTP/1.1\r\nHost: h\r\nContent-Length: 0\r\n" +
                                    credentials + "\r\n");
            EXPECT_THAT(answer, StartsWith("HTTP/1.1 401 ")) << path << "\n" << credentials;
            EXPECT_THAT(answer, HasSubstr("\r\nWWW-Authenticate: Basic realm=\"marlo\"")) << path << "\n"
                                                                                          << credentials;
            EXPECT_THAT(answer, HasSubstr("\r\nContent-Length: ")) << path << "\n" << credentials;
        }
    }
}

INSTANTIATE_TEST_SUITE_P(Methods, EveryRoute,
                         testing::Values("GET", "HEAD", "POST", "M-POST", "PUT", "DELETE", "PATCH", "OPTIONS", "FOO"),
                         [](const testing::TestParamInfo<std::string>& method) {
                             return method.param == "M-POST" ? "MPOST" : method.param;
                         });

TEST(Routes, AreForTheirRole) {
    Host host({}, statusRoute());
    http::Server server(host.service(), {}, std::nullopt, {}, [](const std::string& /*line*/) {});
    const std::string ask = "GET /status?x HTTP/1.1\r\nHost: h\r\nConnection: close\r\nAuthorization: ";
    EXPECT_THAT(askOnce(server, ask + Host::credentials(Host::reader) + "\r\n\r\n"), HasSubstr("status for daemon"));
    const Identity subscriberAlone("eve", {Role::subscribe});
    http::Request request = intrinsic(subscriberAlone, "", "");
    request.head.method = "GET";
    request.head.target = "/status";
    MemoryResponder responder;
    host.service().handle(std::move(request), responder);
    ASSERT_TRUE(responder.sent);
    EXPECT_EQ(responder.sent->status, 403U);
}

/** The CIM status of the answer to a method without any argument, by a user with some roles. */
std::string answerTo(Host& host, const Identity& identity, const std::string& method, const std::string& arguments) {
    MemoryResponder responder;
    host.service().handle(intrinsic(identity, method, arguments), responder);
    return responder.body;
}

const std::vector<Role> allRoles{Role::read, Role::change, Role::subscribe};

TEST(EveryOperation, IsForThoseWhoHaveItsRole) {
    Host host;
    for (const wbem::Operation& operation : wbem::operations()) {
        const std::string name(operation.name());
        Identity others("eve", {});
        for (const Role role : allRoles) {
            if (role != operation.role()) {
                others.add(role);
            }
        }
        EXPECT_THAT(answerTo(host, others, name, ""), HasSubstr("<ERROR CODE=\"2\" DESCRIPTION=\"user 'eve' may not"))
            << name;
        EXPECT_THAT(answerTo(host, Identity("eve", {operation.role()}), name, ""), Not(HasSubstr("CODE=\"2\"")))
            << name;
        EXPECT_THAT(answerTo(host, Identity(), name, ""), HasSubstr("<ERROR CODE=\"2\"")) << name;
    }
}

TEST(EveryOperation, IsFoundInAnyCaseAndThereOnce) {
    for (const wbem::Operation& operation : wbem::operations()) {
        std::string upper(operation.name());
        for (char& character : upper) {
            character = static_cast<char>(std::toupper(static_cast<unsigned char>(character)));
        }
        EXPECT_EQ(wbem::findOperation(upper), &operation) << upper;
    }
    EXPECT_EQ(wbem::findOperation("Nobody"), nullptr);
}

TEST(EveryOperation, RefusesAParameterThatItDoesNotHave) {
    Host host;
    const Identity all("eve", {Role::read, Role::change, Role::subscribe});
    for (const wbem::Operation& operation : wbem::operations()) {
        EXPECT_THAT(answerTo(host, all, std::string(operation.name()), argument("Nonsense", "1")),
                    HasSubstr("<ERROR CODE=\"4\" DESCRIPTION=\"" + std::string(operation.name()) +
                              " has no parameter 'Nonsense'\""));
    }
}

TEST(UnknownOperations, AndMethodsOfClassesTakeARoleToo) {
    Host host;
    EXPECT_THAT(answerTo(host, Identity("eve", {Role::change}), "Frobnicate", ""), HasSubstr("CODE=\"2\""));
    EXPECT_THAT(answerTo(host, Identity("eve", {Role::read}), "Frobnicate", ""), HasSubstr("CODE=\"7\""));
    const std::string call =
        "<METHODCALL NAME=\"Hello\"><LOCALCLASSPATH><LOCALNAMESPACEPATH><NAMESPACE NAME=\"root\"/>"
        "<NAMESPACE NAME=\"test\"/></LOCALNAMESPACEPATH><CLASSNAME NAME=\"TEST_Item\"/>"
        "</LOCALCLASSPATH></METHODCALL>";
    for (const Role role : allRoles) {
        MemoryResponder responder;
        host.service().handle(requestOf(Identity("eve", {role}), "Hello", "root/test:TEST_Item", call), responder);
        EXPECT_THAT(responder.body, HasSubstr(role == Role::change ? ">hello<" : "CODE=\"2\""));
    }
}

TEST(Subscriptions, AreForThoseWhoMaySubscribe) {
    const Schema schema = Schema::readDirectory(MARLO_SHARE "/schema");
    for (const char* name : {"CIM_IndicationFilter", "cim_indicationsubscription", "CIM_ListenerDestinationCIMXML",
                             "CIM_IndicationHandlerCIMXML", "CIM_ListenerDestination"}) {
        EXPECT_EQ(wbem::roleFor(Role::change, schema, "root/interop", name), Role::subscribe) << name;
        EXPECT_EQ(wbem::roleFor(Role::read, schema, "root/interop", name), Role::read) << name;
    }
    EXPECT_EQ(wbem::roleFor(Role::change, schema, "root/interop", "CIM_Namespace"), Role::change);
    EXPECT_EQ(wbem::roleFor(Role::change, schema, "root/tavis", "MARLO_NetworkAdapterConfiguration"), Role::change);
}

} // namespace
} // namespace marlo::test
