#include "agent/persistence/FileTransaction.h"
#include "tests/agent/TemporaryFile.h"

#include <csignal>
#include <filesystem>
#include <random>

#include <gtest/gtest.h>
#include <sys/ptrace.h>
#include <sys/wait.h>
#include <unistd.h>

namespace {

using namespace Orv::Agent::Persistence;
using Orv::Test::TemporaryFile;

/** Larger than a page, so that half of it would show. */
std::string content(char letter) {
    return std::string(100'000, letter) + "\nend\n";
}

void makeEdits(const FileEdits& edits) {
    FileTransaction transaction;
    transaction.apply(edits);
    transaction.commit();
}

/**
 * Runs the edits in a child that is killed at its n-th stop at a system call, each of which stops before and behind.
 * False when the child got to its end before.
 */
bool runKilledAt(int stop, const FileEdits& edits) {
    const pid_t child = ::fork();
    if (child == 0) {
        ::ptrace(PTRACE_TRACEME, 0, nullptr, nullptr);
        ::raise(SIGSTOP);
        makeEdits(edits);
        ::_exit(0);
    }
    int status = 0;
    ::waitpid(child, &status, 0);
    for (int count = 0; count < stop && WIFSTOPPED(status); ++count) {
        ::ptrace(PTRACE_SYSCALL, child, nullptr, nullptr);
        ::waitpid(child, &status, 0);
    }
    if (!WIFSTOPPED(status)) {
        return false;
    }
    ::kill(child, SIGKILL);
    ::waitpid(child, &status, 0);
    return true;
}

TEST(KilledWriter, LeavesTheOldFileOrTheNewAtEverySystemCall) {
    const TemporaryFile file("a", content('a'));
    const std::string path = file.path();
    int stop = 0;
    int olds = 0;
    int news = 0;
    for (bool isKilled = true; isKilled;) {
        file.write(content('a'));
        isKilled = runKilledAt(++stop, {{path, content('a'), content('b')}});
        const std::string text = file.read();
        ASSERT_TRUE(text == content('a') || text == content('b')) << stop << ": " << text.size();
        (text == content('a') ? olds : news) += 1;
    }
    EXPECT_GT(stop, 20) << "the child was not followed";
    EXPECT_GT(olds, 10);
    EXPECT_GT(news, 2);
}

TEST(KilledWriter, LeavesANewFileWholeOrAbsentAtEverySystemCall) {
    const TemporaryFile file("a");
    int stop = 0;
    for (bool isKilled = true; isKilled;) {
        std::filesystem::remove(file.path());
        isKilled = runKilledAt(++stop, {{file.path(), std::nullopt, content('b')}});
        ASSERT_TRUE(!std::filesystem::exists(file.path()) || file.read() == content('b')) << stop;
    }
    EXPECT_GT(stop, 20) << "the child was not followed";
}

TEST(KilledWriter, LeavesOneOfTwoWholeFilesAtRandomMoments) {
    const TemporaryFile file("a", content('a'));
    const std::string path = file.path();
    std::mt19937 random(1); // NOLINT: the same moments every time
    for (int round = 0; round < 100; ++round) {
        const pid_t child = ::fork();
        if (child == 0) {
            for (std::string now = file.read();;) {
                std::string next = content(now.front() == 'a' ? 'b' : 'a');
                makeEdits({{path, now, next}});
                now = std::move(next);
            }
        }
        ::usleep(std::uniform_int_distribution<useconds_t>(0, 5000)(random));
        ::kill(child, SIGKILL);
        ::waitpid(child, nullptr, 0);
        const std::string text = file.read();
        ASSERT_TRUE(text == content('a') || text == content('b')) << round << ": " << text.size();
    }
}

} // namespace
