#include "agent/persistence/FileTransaction.h"
#include "tests/agent/TemporaryFile.h"

#include <filesystem>

#include <gmock/gmock.h>
#include <gtest/gtest.h>
#include <sys/stat.h>
#include <sys/xattr.h>
#include <unistd.h>

namespace {

using namespace Orv::Agent::Persistence;
using Orv::Test::messageOf;
using Orv::Test::TemporaryFile;
using testing::HasSubstr;

namespace fs = std::filesystem;

struct FileTransactionTest : testing::Test {
    [[nodiscard]] std::string at(const std::string& name) const { return (file.directory() / name).string(); }

    [[nodiscard]] std::string read(const std::string& name) const {
        return fs::exists(at(name)) ? TemporaryFile::readFrom(at(name)) : "absent";
    }

    [[nodiscard]] std::vector<std::string> names() const {
        std::vector<std::string> found;
        for (const auto& entry : fs::recursive_directory_iterator(file.directory())) {
            found.push_back(fs::relative(entry.path(), file.directory()).string());
        }
        std::sort(found.begin(), found.end());
        return found;
    }

    static struct stat statusOf(const std::string& path) {
        struct stat status {};

        ::stat(path.c_str(), &status);
        return status;
    }

    TemporaryFile file{"a", "old"};
    FileTransaction transaction;
};

TEST_F(FileTransactionTest, ReplacesCreatesAndRemoves) {
    TemporaryFile::readFrom(at("a"));
    fs::copy_file(at("a"), at("b"));
    transaction.apply({{at("a"), "old", "new"}, {at("b"), "old", std::nullopt}, {at("c"), std::nullopt, "made"}});
    transaction.commit();
    EXPECT_EQ(read("a"), "new");
    EXPECT_EQ(read("c"), "made");
    EXPECT_THAT(names(), testing::ElementsAre("a", "c"));
}

TEST_F(FileTransactionTest, PutsBackWhatWasThere) {
    fs::copy_file(at("a"), at("b"));
    fs::permissions(at("b"), fs::perms(0604));
    transaction.apply({{at("a"), "old", "new"}, {at("b"), "old", std::nullopt}, {at("d/e/c"), std::nullopt, "made"}});
    transaction.apply({{at("a"), "new", "newer"}});
    EXPECT_EQ(read("d/e/c"), "made");
    transaction.revert();
    EXPECT_THAT(names(), testing::ElementsAre("a", "b"));
    EXPECT_EQ(read("a"), "old");
    EXPECT_EQ(read("b"), "old");
    EXPECT_EQ(statusOf(at("b")).st_mode & 07777U, 0604U);
}

TEST_F(FileTransactionTest, PutsBackWhenItEndsWithoutACommit) {
    {
        FileTransaction abandoned;
        abandoned.apply({{at("a"), "old", "new"}});
        EXPECT_EQ(read("a"), "new");
    }
    EXPECT_EQ(read("a"), "old");
}

TEST_F(FileTransactionTest, TakesBackTheFirstEditsWhenOneFails) {
    EXPECT_THAT(messageOf([&] {
                    transaction.apply({{at("a"), "old", "new"},
                                       {at("d/b"), std::nullopt, "made"},
                                       {at("a/c"), std::nullopt, "no directory"}});
                }),
                HasSubstr("a"));
    EXPECT_EQ(read("a"), "old");
    EXPECT_THAT(names(), testing::ElementsAre("a"));
}

TEST_F(FileTransactionTest, KeepsEarlierEditsWhenALaterCallFails) {
    transaction.apply({{at("a"), "old", "new"}});
    EXPECT_NE(messageOf([&] { transaction.apply({{at("a"), "other", "newer"}}); }), "nothing was thrown");
    EXPECT_EQ(read("a"), "new");
    transaction.revert();
    EXPECT_EQ(read("a"), "old");
}

TEST_F(FileTransactionTest, RefusesAFileThatHasChangedSinceThePlan) {
    const FileEdit edits[] = {{at("a"), "older", "new"},
                              {at("a"), std::nullopt, "new"},
                              {at("b"), "old", "new"},
                              {at("a"), "older", std::nullopt},
                              {at("b"), "old", std::nullopt}};
    for (const FileEdit& edit : edits) {
        EXPECT_THAT(messageOf([&] { transaction.apply({edit}); }), HasSubstr(edit.path)) << edit.before.value_or("-");
        EXPECT_EQ(read("a"), "old");
        EXPECT_THAT(names(), testing::ElementsAre("a"));
    }
}

TEST_F(FileTransactionTest, LeavesAloneWhatSomebodyElseHasChangedAndSaysSo) {
    fs::copy_file(at("a"), at("b"));
    transaction.apply({{at("a"), "old", "new"}, {at("b"), "old", "new"}});
    file.write("theirs");
    EXPECT_THAT(messageOf([&] { transaction.revert(); }), HasSubstr(at("a") + ": has been changed"));
    EXPECT_EQ(read("a"), "theirs");
    EXPECT_EQ(read("b"), "old");
}

TEST_F(FileTransactionTest, TouchesNothingThatStaysTheSame) {
    const auto before = statusOf(at("a"));
    transaction.apply({{at("a"), "old", "old"}, {at("b"), std::nullopt, std::nullopt}});
    EXPECT_EQ(statusOf(at("a")).st_ino, before.st_ino);
    EXPECT_THAT(names(), testing::ElementsAre("a"));
}

TEST_F(FileTransactionTest, KeepsModeOwnerAndAttributes) {
    fs::permissions(at("a"), fs::perms(0640));
    const bool isRoot = ::geteuid() == 0;
    if (isRoot) {
        ASSERT_EQ(::chown(at("a").c_str(), 12, 34), 0);
    }
    const bool hasAttributes = ::setxattr(at("a").c_str(), "user.marlo", "kept", 4, 0) == 0;
    transaction.apply({{at("a"), "old", "new"}});
    const auto status = statusOf(at("a"));
    EXPECT_EQ(status.st_mode & 07777U, 0640U);
    if (isRoot) {
        EXPECT_EQ(status.st_uid, 12U);
        EXPECT_EQ(status.st_gid, 34U);
    }
    if (hasAttributes) {
        char value[8] = {};
        EXPECT_EQ(::getxattr(at("a").c_str(), "user.marlo", value, sizeof value), 4);
        EXPECT_STREQ(value, "kept");
    }
}

TEST_F(FileTransactionTest, GivesANewFileTheModeThatTheEditSays) {
    const mode_t mask = ::umask(077);
    transaction.apply({{at("b"), std::nullopt, "made"}, {at("c"), std::nullopt, "made", 0600}});
    ::umask(mask);
    EXPECT_EQ(statusOf(at("b")).st_mode & 07777U, 0644U);
    EXPECT_EQ(statusOf(at("c")).st_mode & 07777U, 0600U);
}

TEST_F(FileTransactionTest, FollowsLinksToTheirTarget) {
    fs::create_directory(at("d"));
    fs::rename(at("a"), at("d/target"));
    fs::create_symlink("d/target", at("link"));
    fs::create_symlink(at("link"), at("a"));
    fs::create_symlink("d/later", at("dangling"));
    transaction.apply({{at("a"), "old", "new"}, {at("dangling"), std::nullopt, "made"}});
    EXPECT_EQ(read("d/target"), "new");
    EXPECT_EQ(read("d/later"), "made");
    EXPECT_TRUE(fs::is_symlink(at("a")) && fs::is_symlink(at("link")) && fs::is_symlink(at("dangling")));
    transaction.revert();
    EXPECT_EQ(read("d/target"), "old");
    EXPECT_FALSE(fs::exists(at("d/later")));
}

TEST_F(FileTransactionTest, RefusesACircleOfLinks) {
    fs::create_symlink("y", at("x"));
    fs::create_symlink("x", at("y"));
    EXPECT_THAT(messageOf([&] {
                    transaction.apply({{at("x"), std::nullopt, "made"}});
                }),
                HasSubstr("cannot be followed"));
}

TEST_F(FileTransactionTest, RefusesWhatIsNoRegularFile) {
    ASSERT_EQ(::mkfifo(at("pipe").c_str(), 0600), 0);
    EXPECT_NE(messageOf([&] { transaction.apply({{at("pipe"), "", "new"}}); }), "nothing was thrown");
    EXPECT_TRUE(fs::is_fifo(at("pipe")));
}

TEST_F(FileTransactionTest, SaysWhichFileCannotBeWritten) {
    EXPECT_THAT(messageOf([&] { transaction.apply({{"/proc/version", "x", "y"}}); }), HasSubstr("/proc/version"));
    EXPECT_THAT(messageOf([&] { transaction.apply({{"/proc/no/such", std::nullopt, "y"}}); }), HasSubstr("/proc/no"));
}

} // namespace
