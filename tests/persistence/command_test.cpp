#include "agent/persistence/Command.h"
#include "tests/agent/TemporaryFile.h"

#include <csignal>
#include <thread>

#include <fcntl.h>
#include <gmock/gmock.h>
#include <gtest/gtest.h>
#include <unistd.h>

namespace {

using namespace Orv::Agent::Persistence;
using Orv::Test::messageOf;
using std::chrono::milliseconds;
using std::chrono::seconds;
using testing::HasSubstr;

CommandResult shell(const std::string& script, const std::string& input = {}) {
    return runCommand({"/bin/sh", "-c", script}, seconds(20), input);
}

TEST(Command, GivesStatusAndBothStreams) {
    const CommandResult result = shell("echo out; echo err >&2; exit 7");
    EXPECT_EQ(result.status, 7);
    EXPECT_EQ(result.output, "out\nerr\n");
    EXPECT_EQ(result.lastLine(), "err");
}

TEST(Command, HandsArgumentsOverWithoutAShell) {
    EXPECT_EQ(runCommand({"/bin/echo", "$(id)", "a b", ";", "*"}, seconds(20)).output, "$(id) a b ; *\n");
}

TEST(Command, HandsInputOver) {
    EXPECT_EQ(shell("cat", "nameserver 10.0.0.1\n").output, "nameserver 10.0.0.1\n");
    EXPECT_EQ(shell("cat").output, "");
}

TEST(Command, KeepsTheEndOfALongOutput) {
    const CommandResult result = shell("yes | head -100000; echo last");
    EXPECT_LT(result.output.size(), 5000U);
    EXPECT_EQ(result.lastLine(), "last");
}

TEST(Command, SaysWhichSignalEndedIt) {
    EXPECT_EQ(shell("kill -9 $$").status, 128 + SIGKILL);
}

TEST(Command, ThrowsWhenThereIsNoSuchProgram) {
    EXPECT_THAT(messageOf([] { runCommand({"/no/such/program"}, seconds(20)); }),
                testing::StartsWith("/no/such/program: cannot be run"));
}

TEST(Command, ThrowsWithTheLastLineWhenItFails) {
    EXPECT_EQ(messageOf([] {
                  runOrThrow({"/bin/sh", "-c", "echo no; printf 'why\\033[2J \\n'; exit 3"}, seconds(20));
              }),
              "/bin/sh: failed with status 3: why [2J");
    EXPECT_EQ(messageOf([] { runOrThrow({"/bin/true"}, seconds(20)); }), "nothing was thrown");
}

TEST(Command, KillsWhatTakesTooLongWithItsChildren) {
    const Orv::Test::TemporaryFile file("pid", "");
    const auto start = std::chrono::steady_clock::now();
    EXPECT_THAT(messageOf([&] {
                    runCommand({"/bin/sh", "-c", "sleep 1000 & echo $! > " + file.path() + "; echo waiting; wait"},
                               milliseconds(300));
                }),
                HasSubstr("has not ended within 300 ms: waiting"));
    EXPECT_LT(std::chrono::steady_clock::now() - start, seconds(10));
    const pid_t child = std::stoi(file.read());
    for (int i = 0; i < 100 && ::kill(child, 0) == 0; ++i) {
        // An orphan stays a zombie until the first process of the host has reaped it.
        const std::string status = Orv::Test::TemporaryFile::readFrom("/proc/" + std::to_string(child) + "/stat");
        if (status.find(") Z ") != std::string::npos) {
            return;
        }
        std::this_thread::sleep_for(milliseconds(20));
    }
    EXPECT_NE(::kill(child, 0), 0);
}

TEST(Command, DoesNotWaitForADaemonThatKeepsItsOutputOpen) {
    const auto start = std::chrono::steady_clock::now();
    const CommandResult result = shell("(sleep 30 & echo $! ; exec sleep 0) ; echo done");
    EXPECT_LT(std::chrono::steady_clock::now() - start, seconds(10));
    EXPECT_EQ(result.lastLine(), "done");
    ::kill(std::stoi(result.output), SIGKILL);
}

TEST(Command, PassesNoDescriptorsOn) {
    const int open = ::open("/dev/null", O_RDONLY); // without O_CLOEXEC
    ASSERT_GE(open, 3);
    EXPECT_EQ(shell("[ -e /proc/$$/fd/" + std::to_string(open) + " ] && echo leaked || echo none").output, "none\n");
    ::close(open);
}

TEST(Command, GivesABareEnvironmentAndNoBlockedSignals) {
    ::setenv("MARLO_SECRET", "x", 1);
    sigset_t all;
    sigset_t before;
    sigfillset(&all);
    pthread_sigmask(SIG_BLOCK, &all, &before);
    const CommandResult result = shell("env | grep -c MARLO; grep SigBlk /proc/self/status");
    pthread_sigmask(SIG_SETMASK, &before, nullptr);
    ::unsetenv("MARLO_SECRET");
    EXPECT_THAT(result.output, testing::StartsWith("0\n"));
    EXPECT_THAT(result.output, HasSubstr("0000000000000000"));
}

TEST(Command, WorksWhereChildrenAreReapedBySomebodyElse) {
    const auto before = ::signal(SIGCHLD, SIG_IGN);
    EXPECT_EQ(shell("echo done").output, "done\n");
    ::signal(SIGCHLD, before);
}

} // namespace
