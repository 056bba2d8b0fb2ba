#include "agent/config/TextFile.h"
#include "agent/file/FileBackEnd.h"
#include "tests/agent/TemporaryFile.h"

#include <atomic>
#include <chrono>
#include <filesystem>
#include <thread>

#include <fcntl.h>
#include <gmock/gmock.h>
#include <gtest/gtest.h>
#include <sys/mman.h>
#include <unistd.h>

namespace {

using namespace Orv::NodeLexicon;
using Orv::Agent::BackEnd;
using Orv::Agent::makeFileBackEnd;
using Orv::Agent::Tree;
using Orv::Test::messageOf;
using Orv::Test::TemporaryFile;

std::string adapters(const std::string& identity, int count = 1) {
    std::string text;
    for (int i = 0; i < count; ++i) {
        text += "[[adapter]]\nidentity = \"" + identity + "\"\n";
    }
    return text;
}

std::string firstIdentity(const Tree& tree) {
    return tree.nodesOfType(NODE_NETWORK_ADAPTER).at(0)->description;
}

/** Waits until a file written just now can be trusted to be seen changed. */
void settle() {
    std::this_thread::sleep_for(std::chrono::milliseconds(200));
}

struct FileBackEndTest : testing::Test {
    std::string identityNow() { return firstIdentity(*backEnd->snapshot()); }

    std::string failure() {
        return messageOf([&] { backEnd->snapshot(); });
    }

    TemporaryFile file{"lab.toml", adapters("eth0")};
    std::unique_ptr<BackEnd> backEnd = makeFileBackEnd(file.path());
};

TEST_F(FileBackEndTest, GivesTheSameTreeWhileTheFileIsTheSame) {
    settle();
    const auto first = backEnd->snapshot();
    EXPECT_EQ(backEnd->snapshot(), first);
    EXPECT_EQ(backEnd->snapshot(), first);
}

TEST_F(FileBackEndTest, GivesTheSameTreeWhileAFileWrittenJustNowIsTheSame) {
    const auto first = backEnd->snapshot();
    EXPECT_EQ(backEnd->snapshot(), first);
}

TEST_F(FileBackEndTest, SeesAFileWrittenInPlace) {
    EXPECT_EQ(identityNow(), "eth0");
    file.write(adapters("eth17"));
    EXPECT_EQ(identityNow(), "eth17");
}

TEST_F(FileBackEndTest, SeesEveryOneOfManyQuickWritesOfOneLength) {
    for (int i = 0; i < 200; ++i) {
        const std::string identity = "eth" + std::to_string(100 + i);
        file.write(adapters(identity));
        ASSERT_EQ(identityNow(), identity);
    }
}

/** A file as memory: stores to a page that is dirty already leave the times of the file alone. */
class MappedFile {
  public:
    explicit MappedFile(const std::string& path) : _size(std::filesystem::file_size(path)) {
        const int descriptor = ::open(path.c_str(), O_RDWR | O_CLOEXEC);
        _bytes = static_cast<char*>(::mmap(nullptr, _size, PROT_READ | PROT_WRITE, MAP_SHARED, descriptor, 0));
        ::close(descriptor);
    }

    ~MappedFile() { ::munmap(_bytes, _size); }

    MappedFile(const MappedFile&) = delete;
    MappedFile& operator=(const MappedFile&) = delete;

    void put(std::size_t offset, char byte) { _bytes[offset] = byte; }

  private:
    std::size_t _size;
    char* _bytes;
};

TEST_F(FileBackEndTest, SeesAWriteWithinOneStepOfTheFileClock) {
    const std::size_t digit = adapters("eth").size() - 2;
    for (int attempt = 0; attempt < 100; ++attempt) {
        file.write(adapters("eth0"));
        const auto start = std::chrono::steady_clock::now();
        MappedFile mapped(file.path());
        mapped.put(digit, '1');
        const std::string first = identityNow();
        const auto stamp = Orv::Agent::stampOf(file.path());
        mapped.put(digit, '2');
        const bool isWithin = std::chrono::steady_clock::now() - start < std::chrono::milliseconds(50);
        if (isWithin && Orv::Agent::stampOf(file.path()) == stamp) {
            EXPECT_EQ(first, "eth1");
            EXPECT_EQ(identityNow(), "eth2");
            return;
        }
    }
    FAIL() << "no write was quick enough";
}

TEST(TextFile, IsSettledWhenItsLastWriteIsLongerAgoThanTheFileClockIsCoarse) {
    const TemporaryFile file("text", "text");
    const auto start = std::chrono::steady_clock::now();
    const bool atOnce = Orv::Agent::readTextFile(file.path()).settled;
    EXPECT_TRUE(!atOnce || std::chrono::steady_clock::now() - start > std::chrono::milliseconds(50));
    settle();
    EXPECT_TRUE(Orv::Agent::readTextFile(file.path()).settled);
}

TEST(TextFile, IsReadWholeWhateverItsLength) {
    const std::string text(1000001, 'x');
    for (const std::string& content : {std::string(), std::string(1, 'a'), text}) {
        const TemporaryFile file("text", content);
        EXPECT_EQ(Orv::Agent::readTextFile(file.path()).text, content);
    }
}

TEST_F(FileBackEndTest, SeesAFileRenamedOntoItWithTheOldTime) {
    EXPECT_EQ(identityNow(), "eth0");
    const auto time = std::filesystem::last_write_time(file.path());
    file.replace(adapters("eth1"));
    std::filesystem::last_write_time(file.path(), time);
    EXPECT_EQ(identityNow(), "eth1");
}

TEST_F(FileBackEndTest, KeepsATreeThatACursorHolds) {
    const auto held = backEnd->snapshot();
    file.write(adapters("eth1"));
    EXPECT_EQ(identityNow(), "eth1");
    EXPECT_EQ(firstIdentity(*held), "eth0");
}

TEST_F(FileBackEndTest, FailsWhenTheFileVanishesAndServesItAgainWhenItIsBack) {
    EXPECT_EQ(identityNow(), "eth0");
    file.remove();
    EXPECT_EQ(failure(), file.path() + ": cannot be read: No such file or directory");
    file.write(adapters("eth2"));
    EXPECT_EQ(identityNow(), "eth2");
}

TEST_F(FileBackEndTest, FailsWhileTheFileIsWrongAndServesNothingOfItsFormerState) {
    EXPECT_EQ(identityNow(), "eth0");
    file.write("[[adapter]]\nstatus = \"up\"\n");
    const std::string message =
        file.path() + ":2: adapter.status: expected an integer from 0 to 4294967295, found a string";
    EXPECT_EQ(failure(), message);
    EXPECT_EQ(failure(), message);
    file.write(adapters("eth0"));
    EXPECT_EQ(identityNow(), "eth0");
}

TEST_F(FileBackEndTest, FailsAgainThoughTheWrongFileLooksUnchanged) {
    file.write("[[adapter]]\nstatus = \"up\"\n");
    EXPECT_NE(failure(), "nothing was thrown");
    EXPECT_NE(failure(), "nothing was thrown");
}

TEST_F(FileBackEndTest, NeedsNoFileUntilItIsAsked) {
    const auto early = makeFileBackEnd((file.directory() / "later.toml").string());
    EXPECT_THAT(messageOf([&] { early->snapshot(); }), testing::HasSubstr("later.toml: cannot be read"));
}

TEST_F(FileBackEndTest, NeverShowsHalfAFileThatIsReplacedWhileItIsRead) {
    constexpr int count = 300;
    file.replace(adapters("old", count));
    std::atomic<bool> isDone{false};
    std::thread writer([&] {
        for (int i = 0; i < 60; ++i) {
            file.replace(adapters(i % 2 == 0 ? "new" : "older", count));
        }
        isDone = true;
    });
    while (!isDone) {
        const auto tree = backEnd->snapshot();
        const auto& nodes = tree->nodesOfType(NODE_NETWORK_ADAPTER);
        ASSERT_EQ(nodes.size(), static_cast<std::size_t>(count));
        EXPECT_EQ(nodes.front()->description, nodes.back()->description);
    }
    writer.join();
    EXPECT_EQ(identityNow(), "older");
}

TEST_F(FileBackEndTest, ServesManyThreadsWhileTheFileChanges) {
    std::atomic<bool> isDone{false};
    std::atomic<int> wrong{0};
    std::vector<std::thread> readers;
    for (int i = 0; i < 4; ++i) {
        readers.emplace_back([&] {
            while (!isDone) {
                wrong += firstIdentity(*backEnd->snapshot()).starts_with("eth") ? 0 : 1;
            }
        });
    }
    for (int i = 0; i < 50; ++i) {
        file.replace(adapters("eth" + std::to_string(i)));
    }
    isDone = true;
    for (auto& reader : readers) {
        reader.join();
    }
    EXPECT_EQ(wrong, 0);
    EXPECT_EQ(identityNow(), "eth49");
}

TEST_F(FileBackEndTest, GivesAWarmSnapshotOfTenThousandNodesWithoutReadingThem) {
    file.write(adapters("eth0", 10000));
    settle();
    // Reading is a matter of tens of milliseconds each; ten thousand warm snapshots would take minutes if they read.
    const auto first = backEnd->snapshot();
    const auto start = std::chrono::steady_clock::now();
    for (int i = 0; i < 10000; ++i) {
        ASSERT_EQ(backEnd->snapshot(), first);
    }
    EXPECT_LT(std::chrono::steady_clock::now() - start, std::chrono::seconds(10));
}

} // namespace
