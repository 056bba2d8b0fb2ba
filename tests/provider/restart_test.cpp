/**
 * RestartNetwork with a script of the test's own in the place of the host's, in a mount namespace that nobody else
 * sees.
 */
#include "tests/provider/Scene.h"
#include "tests/support/Namespace.h"

#include <cerrno>
#include <csignal>
#include <fstream>
#include <iterator>
#include <system_error>

#include <gmock/gmock.h>
#include <gtest/gtest.h>
#include <sys/mount.h>
#include <sys/resource.h>
#include <sys/stat.h>

namespace {

using namespace provider_test;
using marlo::Value;
using scripted_agent::recorded;
using testing::Contains;
using testing::ElementsAre;
using testing::HasSubstr;
using testing::IsEmpty;
using testing::Not;

const std::string DIRECTORY = "/etc/init.d";

class Restart : public ReadBase, public testing::Test {
  protected:
    /** Calls the method where /etc/init.d has this script alone, or nothing when it is empty. */
    void restart(const std::string& script) {
        const Orv::Test::Namespace space;
        space.run([&] {
            if (mount("tmpfs", DIRECTORY.c_str(), "tmpfs", 0, "mode=755") != 0) {
                throw std::system_error(errno, std::generic_category(), "mount over " + DIRECTORY);
            }
            if (!script.empty()) {
                std::ofstream(DIRECTORY + "/network") << "#!/bin/sh\n" << script;
                chmod((DIRECTORY + "/network").c_str(), 0755);
            }
            scripted_agent::clearRecord();
            answer = calls.invokeMethod(classPath(CONFIGURATION), "RestartNetwork");
            std::ifstream trail(DIRECTORY + "/trail");
            left = {std::istreambuf_iterator<char>(trail), {}};
        });
    }

    void expectSuccess() {
        EXPECT_EQ(answer.code, CMPI_RC_OK);
        EXPECT_FALSE(answer.hasMessage);
        EXPECT_THAT(answer.values, ElementsAre(Value::uint(CMPI_uint32, 0)));
        EXPECT_TRUE(answer.done);
        EXPECT_TRUE(hasExitMark());
        EXPECT_THAT(recorded("log 6000"), IsEmpty());
        EXPECT_THAT(recorded("log 4000"), Contains(HasSubstr("ENTERING: executeRestartNetwork()")));
        EXPECT_THAT(recorded("log 4000"), Not(Contains(HasSubstr("EXITING: executeRestartNetwork()"))));
    }

    Answer answer;
    std::string left; ///< what the script wrote to its trail
};

TEST_F(Restart, RunsTheScriptOnceWithOneArgumentAndWaitsForItsEnd) {
    REQUIRE_NAMESPACES();
    restart("echo \"$# $1\" >>/etc/init.d/trail\nsleep 0.3\necho ended >>/etc/init.d/trail\n");
    EXPECT_EQ(left, "1 restart\nended\n");
    expectSuccess();
}

TEST_F(Restart, NeedsNoKeyAndReadsNone) {
    REQUIRE_NAMESPACES();
    restart("exit 0\n");
    expectSuccess();
    EXPECT_THAT(setup.faulty.calls(), Not(Contains("objectPath.getKey SettingID")));
    EXPECT_THAT(setup.faulty.calls(), Not(Contains("args.getArgCount")));
}

TEST_F(Restart, ScriptThatFailsIsASuccess) {
    REQUIRE_NAMESPACES();
    restart("echo called >>/etc/init.d/trail\nexit 3\n");
    EXPECT_EQ(left, "called\n");
    expectSuccess();
}

TEST_F(Restart, ScriptThatIsNotThereIsASuccess) {
    REQUIRE_NAMESPACES();
    testing::internal::CaptureStderr();
    restart("");
    (void)testing::internal::GetCapturedStderr(); // the shell's own complaint
    expectSuccess();
}

TEST_F(Restart, ScriptThatPrintsWithoutEndIsEndedAndNotWaitedForInVain) {
    REQUIRE_NAMESPACES();
    (void)signal(SIGPIPE, SIG_DFL); // as a program starts, unless who started it had it otherwise
    restart("while echo output; do :; done\necho told of it >>/etc/init.d/trail\n");
    EXPECT_EQ(left, "") << "nobody reads what it prints";
    expectSuccess();
}

TEST_F(Restart, WithoutAFileDescriptorForThePipeIsASuccessThatIsLogged) {
    // The library is loaded, and UndefinedBehaviorSanitizer meets the types of an answer, while files can be opened.
    ASSERT_EQ(calls.invokeMethod(classPath(CONFIGURATION), "Unheard").code, CMPI_RC_OK);
    rlimit before{};
    ASSERT_EQ(getrlimit(RLIMIT_NOFILE, &before), 0);
    const rlimit none{0, before.rlim_max};
    ASSERT_EQ(setrlimit(RLIMIT_NOFILE, &none), 0);
    answer = calls.invokeMethod(classPath(CONFIGURATION), "RestartNetwork");
    ASSERT_EQ(setrlimit(RLIMIT_NOFILE, &before), 0);
    EXPECT_EQ(answer.code, CMPI_RC_OK);
    EXPECT_THAT(answer.values, ElementsAre(Value::uint(CMPI_uint32, 0)));
    EXPECT_THAT(recorded("log 6000"), ElementsAre(HasSubstr("]: Failed to Restart Network")));
    EXPECT_THAT(recorded("log 4000"), Contains(HasSubstr("EXITING: executeRestartNetwork()")));
}

} // namespace
