#include "host/security/Gatekeeper.h"
#include "tests/security/Child.h"
#include "tests/security/TemporaryDirectory.h"
#include "tests/support/Namespace.h"

#include <chrono>
#include <filesystem>
#include <fstream>
#include <memory>
#include <stdexcept>
#include <string>

#include <crypt.h>
#include <gmock/gmock.h>
#include <gtest/gtest.h>

namespace {

namespace fs = std::filesystem;
using marlo::security::makePamCheck;
using marlo::security::PasswordCheck;

/** A directory of services, as /etc/pam.d. */
class PamTest : public testing::Test {
  protected:
    void write(const std::string& service, const std::string& rules) const {
        std::ofstream(_directory / service) << rules;
    }

    /** A service with these modules for "auth" and "account". */
    std::unique_ptr<PasswordCheck> service(const std::string& authentication, const std::string& account) const {
        write("test", "auth required " + authentication + "\naccount required " + account + "\n");
        return makePamCheck("test", _directory);
    }

    const marlo::test::TemporaryDirectory _temporary;
    const fs::path _directory = _temporary.path();
};

TEST_F(PamTest, IsGoodWhenTheModulesSaySo) {
    EXPECT_TRUE(service("pam_permit.so", "pam_permit.so")->isGood("root", "x"));
}

TEST_F(PamTest, NeedsThePassword) {
    EXPECT_FALSE(service("pam_deny.so", "pam_permit.so")->isGood("root", "x"));
}

TEST_F(PamTest, NeedsTheAccount) {
    EXPECT_FALSE(service("pam_permit.so", "pam_deny.so")->isGood("root", "x"));
}

TEST_F(PamTest, SaysWhichServiceHasNoRules) {
    // In a process of its own: PAM does not free all it had for such a service.
    EXPECT_THAT(marlo::test::inChild([&] {
                    static_cast<void>(makePamCheck("no-such-service", _directory)->isGood("root", "x"));
                    return std::string();
                }),
                testing::StartsWith("threw: PAM service \"no-such-service\": "));
}

TEST_F(PamTest, GoesByTheRulesForOtherServices) {
    write("other", "auth required pam_deny.so\naccount required pam_deny.so\n");
    EXPECT_FALSE(makePamCheck("no-such-service", _directory)->isGood("root", "x"));
}

TEST_F(PamTest, IsNoForAModuleThatIsNotThere) {
    EXPECT_FALSE(service("pam_no_such_module.so", "pam_permit.so")->isGood("root", "x"));
}

TEST_F(PamTest, AsksInTheNameOfTheUser) {
    const auto check = service("pam_succeed_if.so quiet user = daemon", "pam_permit.so");
    EXPECT_TRUE(check->isGood("daemon", "x"));
    EXPECT_FALSE(check->isGood("root", "x"));
}

TEST_F(PamTest, RefusesPasswordsThatModulesDoNotTake) {
    const auto check = service("pam_permit.so", "pam_permit.so");
    EXPECT_TRUE(check->isGood("root", std::string(511, 'x')));
    EXPECT_FALSE(check->isGood("root", std::string(512, 'x')));
}

/** Accounts of the system, in a mount namespace where it has others. */
class PamAccounts : public PamTest {
  protected:
    void SetUp() override {
        REQUIRE_NAMESPACES();
        _system = std::make_unique<Orv::Test::Namespace>();
        fs::copy("/etc/pam.d", _directory, fs::copy_options::recursive);
        fs::copy(MARLO_PAM_SERVICE, _directory / "marlo");
        std::string passwd = "root:x:0:0::/root:/bin/sh\n";
        for (const char* user : {"alice", "locked", "expired", "stale", "blank"}) {
            passwd += std::string(user) + ":x:7001:7001::/:/bin/sh\n";
        }
        _system->replaceFile("/etc/passwd", passwd);
        const std::string hash = hashOf("good");
        _system->replaceFile("/etc/shadow", "root:*:19000:0:99999:7:::\n"
                                            "alice:" +
                                                hash +
                                                ":19000:0:99999:7:::\n"
                                                "locked:!" +
                                                hash +
                                                ":19000:0:99999:7:::\n"
                                                "expired:" +
                                                hash +
                                                ":19000:0:99999:7::1:\n"
                                                "stale:" +
                                                hash +
                                                ":0:0:99999:7:::\n"
                                                "blank::19000:0:99999:7:::\n");
    }

    static std::string hashOf(const std::string& password) {
        crypt_data data{};
        return crypt_r(password.c_str(), "$6$rounds=1000$marlo$", &data);
    }

    bool isGood(const std::string& user, const std::string& password) const {
        bool good = false;
        _system->run([&] { good = makePamCheck("marlo", _directory)->isGood(user, password); });
        return good;
    }

    std::unique_ptr<Orv::Test::Namespace> _system;
};

TEST_F(PamAccounts, GetInWithTheirPasswordOnly) {
    EXPECT_TRUE(isGood("alice", "good"));
    EXPECT_FALSE(isGood("alice", "bad"));
    EXPECT_FALSE(isGood("alice", "Good"));
    EXPECT_FALSE(isGood("alice", ""));
    EXPECT_FALSE(isGood("nobody-known", "good"));
    EXPECT_FALSE(isGood("root", "good"));
}

TEST_F(PamAccounts, DoNotGetInWhenTheyAreLockedOrExpired) {
    EXPECT_FALSE(isGood("locked", "good"));
    EXPECT_FALSE(isGood("expired", "good"));
}

TEST_F(PamAccounts, DoNotGetInWhileTheirPasswordHasToBeChanged) {
    EXPECT_FALSE(isGood("stale", "good"));
}

TEST_F(PamAccounts, DoNotGetInWithoutAPassword) {
    EXPECT_FALSE(isGood("blank", ""));
    EXPECT_FALSE(isGood("blank", "good"));
}

TEST_F(PamAccounts, AreNotKeptWaitingByModules) {
    // pam_unix(8) asks for two seconds after a failure unless it is told otherwise.
    const auto start = std::chrono::steady_clock::now();
    for (int count = 0; count < 4; ++count) {
        EXPECT_FALSE(isGood("alice", "bad"));
    }
    EXPECT_LT(std::chrono::steady_clock::now() - start, std::chrono::seconds(5));
}

} // namespace
