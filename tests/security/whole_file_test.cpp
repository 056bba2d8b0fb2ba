#include "host/security/WholeFile.h"
#include "tests/security/TemporaryDirectory.h"

#include <algorithm>
#include <filesystem>
#include <fstream>
#include <iterator>
#include <string>
#include <system_error>

#include <gtest/gtest.h>
#include <sys/stat.h>
#include <unistd.h>

namespace {

namespace fs = std::filesystem;
using marlo::security::makeDirectory;
using marlo::security::readWhole;
using marlo::security::writeWhole;
using marlo::test::TemporaryDirectory;

mode_t modeOf(const std::string& path) {
    struct stat status {};

    return stat(path.c_str(), &status) == 0 ? status.st_mode & 07777U : 0;
}

std::string refusalOf(const std::string& path) {
    try {
        readWhole(path);
        return "read";
    } catch (const std::system_error& error) {
        return error.what();
    }
}

TEST(WholeFiles, AreWrittenWithTheirMode) {
    const TemporaryDirectory directory;
    const mode_t former = umask(0077);
    writeWhole(directory.file("public"), "one", 0644);
    umask(0);
    writeWhole(directory.file("private"), "two", 0600);
    umask(former);
    EXPECT_EQ(readWhole(directory.file("public")), "one");
    EXPECT_EQ(modeOf(directory.file("public")), 0644U);
    EXPECT_EQ(readWhole(directory.file("private")), "two");
    EXPECT_EQ(modeOf(directory.file("private")), 0600U);
}

TEST(WholeFiles, AreReplacedAndNotWrittenInto) {
    const TemporaryDirectory directory;
    writeWhole(directory.file("file"), "former", 0644);
    std::ifstream former(directory.file("file"));
    writeWhole(directory.file("file"), std::string(100000, 'x'), 0600);
    EXPECT_EQ(std::string(std::istreambuf_iterator<char>(former), {}), "former");
    EXPECT_EQ(readWhole(directory.file("file")), std::string(100000, 'x'));
    EXPECT_EQ(modeOf(directory.file("file")), 0600U);
}

TEST(WholeFiles, LeaveNothingBehindWhenTheyCannotBeWritten) {
    const TemporaryDirectory directory;
    fs::create_directories(directory.path() / "taken" / "inside");
    EXPECT_THROW(writeWhole(directory.file("taken"), "x", 0600), std::system_error);
    EXPECT_EQ(std::distance(fs::directory_iterator(directory.path()), fs::directory_iterator()), 1);
    EXPECT_THROW(writeWhole(directory.file("missing/file"), "x", 0600), std::system_error);
}

TEST(WholeFiles, AreReadUpToALimit) {
    const TemporaryDirectory directory;
    constexpr std::size_t limit = std::size_t{1} << 20;
    writeWhole(directory.file("file"), std::string(limit, 'x'), 0600);
    EXPECT_EQ(readWhole(directory.file("file")).size(), limit);
    writeWhole(directory.file("file"), std::string(limit + 1, 'x'), 0600);
    EXPECT_NE(refusalOf(directory.file("file")).find("is too long"), std::string::npos);
}

TEST(WholeFiles, AreRegularFiles) {
    const TemporaryDirectory directory;
    ASSERT_EQ(mkfifo(directory.file("pipe").c_str(), 0600), 0);
    EXPECT_NE(refusalOf(directory.file("pipe")).find(directory.file("pipe") + ": is no regular file"),
              std::string::npos);
    EXPECT_NE(refusalOf(directory.path()).find("is no regular file"), std::string::npos);
    EXPECT_NE(refusalOf(directory.file("missing")).find(directory.file("missing")), std::string::npos);
}

TEST(Directories, AreMadeForTheOwnerAlone) {
    const TemporaryDirectory directory;
    makeDirectory(directory.file("a/b/c"));
    for (const char* made : {"a", "a/b", "a/b/c"}) {
        EXPECT_EQ(modeOf(directory.file(made)), 0700U) << made;
    }
}

TEST(Directories, StayAsTheyAre) {
    const TemporaryDirectory directory;
    fs::permissions(directory.path(), fs::perms(0755));
    makeDirectory(directory.path());
    EXPECT_EQ(modeOf(directory.path()), 0755U);
    writeWhole(directory.file("file"), "", 0600);
    EXPECT_THROW(makeDirectory(directory.file("file/below")), std::system_error);
}

} // namespace
