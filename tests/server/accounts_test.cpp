// Who gets in where the accounts of the host count, and what root and others can serve.
#include "tests/server/Serving.h"
#include "tests/support/Namespace.h"

#include <csignal>
#include <filesystem>

#include <gmock/gmock.h>

namespace marlo::test {
namespace {

using testing::HasSubstr;
using testing::IsEmpty;
using testing::Not;

/** A server that sees two more accounts than the host has, in files that are mounted over the host's for it alone. */
class Accounts : public Serving {
  protected:
    void SetUp() override {
        REQUIRE_NAMESPACES();
        configure("access", "read = [\"reader\", \"writer\"]\nchange = [\"writer\"]\n");
        serveAccountsNamed({"reader", "writer", "other"});
        start();
    }

    [[nodiscard]] std::string at(const std::string& credentials) const {
        return "http://" + credentials + "@127.0.0.1:" + std::to_string(port("http")) + "/root/served:SERVED_Thing";
    }
};

TEST_F(Accounts, GetInByTheirPasswordsAndDoWhatTheyMay) {
    EXPECT_THAT(said(), Not(HasSubstr("password")));
    EXPECT_THAT(wbemcli({"ein", at("reader:secret")}).out, HasSubstr("Id=\"one\""));
    const Outcome refused = wbemcli({"sp", at("reader:secret") + ".Id=\"one\"", "Number=5"});
    EXPECT_THAT(refused.err, HasSubstr("Cim: (2) CIM_ERR_ACCESS_DENIED"));
    EXPECT_EQ(wbemcli({"sp", at("writer:secret") + ".Id=\"one\"", "Number=5"}).exitCode, 0);
    EXPECT_EQ(wbemcli({"gp", at("writer:secret") + ".Id=\"one\"", "Number"}).out, "5\n");
    for (const char* wrong : {"reader:wrong", "nobody:secret", "other:secret", "root:secret"}) {
        const Outcome outcome = wbemcli({"ein", at(wrong)});
        EXPECT_THAT(outcome.out, IsEmpty()) << wrong;
        EXPECT_THAT(outcome.err, HasSubstr("Invalid username/password")) << wrong;
    }
    EXPECT_EQ(status().exitCode, 0) << "root, by the local socket";
}

TEST_F(Accounts, AreOthersAfterTheConfigurationWasReadAnew) {
    EXPECT_EQ(wbemcli({"ein", at("reader:secret")}).exitCode, 0);
    readAnew("\"reader\", ", "");
    EXPECT_NE(wbemcli({"ein", at("reader:secret")}).exitCode, 0);
    EXPECT_EQ(wbemcli({"ein", at("writer:secret")}).exitCode, 0);
}

TEST_F(Serving, IsForItsOwnUserAloneWhereItIsNotRoots) {
    REQUIRE_NAMESPACES();
    std::filesystem::permissions(directory(), std::filesystem::perms::all);
    const std::vector<std::string> asNobody{"setpriv", "--reuid", "65534", "--regid", "65534", "--clear-groups"};
    serveAccounts();
    startBy(asNobody);
    start();
    EXPECT_THAT(said(), HasSubstr("this is not root, which alone may check passwords"));
    EXPECT_EQ(curl({"-o", "/dev/null", "-w", "%{http_code}", "-u", "root:x", address("status")}).out, "401");
    auto arguments = asNobody;
    arguments.insert(arguments.end(), {MARLO_EXECUTABLE, "status", "--socket", socket()});
    EXPECT_EQ(runProgram(arguments, {}, "", directory()).exitCode, 0);
    arguments[2] = "65533";
    const Outcome other = runProgram(arguments, {}, "", directory());
    EXPECT_EQ(other.exitCode, 1);
    EXPECT_THAT(other.err, HasSubstr("401"));
}

TEST_F(Serving, SaysWhichFileAFullDiskDoesNotTake) {
    REQUIRE_NAMESPACES();
    startBehind("mkdir state\nmount -t tmpfs -o size=4k none state\nhead -c 4096 /dev/zero >state/filler");
    EXPECT_EQ(startInVain(), 1);
    EXPECT_EQ(said(), "");
    EXPECT_THAT(readFile(path("server.err")), HasSubstr("state/"));
    EXPECT_THAT(readFile(path("server.err")), HasSubstr("No space left on device"));
}

} // namespace
} // namespace marlo::test
