#include "host/store/Database.h"
#include "tests/security/TemporaryDirectory.h"
#include "tests/support/Namespace.h"

#include <array>
#include <filesystem>
#include <fstream>
#include <string>
#include <thread>
#include <vector>

#include <gmock/gmock.h>
#include <gtest/gtest.h>
#include <sys/stat.h>
#include <sys/wait.h>
#include <unistd.h>

namespace {

using namespace marlo::store;
using namespace std::string_view_literals;
using testing::HasSubstr;

constexpr std::array firstSteps{"CREATE TABLE fruit (name TEXT PRIMARY KEY, count INTEGER) STRICT"sv};
constexpr std::array bothSteps{
    firstSteps[0], "ALTER TABLE fruit ADD COLUMN skin BLOB; INSERT INTO fruit VALUES ('fig', 2, x'00')"sv};

class Store : public testing::Test {
  protected:
    /** What opening the file throws. */
    std::string refusal() const {
        try {
            const Database opened(file);
        } catch (const Error& error) {
            return error.what();
        }
        return "nothing was thrown";
    }

    static std::string contentOf(const std::string& path) {
        std::ifstream stream(path, std::ios::binary);
        return {std::istreambuf_iterator<char>(stream), {}};
    }

    marlo::test::TemporaryDirectory directory;
    const std::string file = directory.file("marlo.db");
};

TEST_F(Store, GivesBackWhatWasWritten) {
    Database database(file);
    database.migrate("larder", bothSteps);
    const std::string bytes("\0a\0", 3);
    database.run("INSERT INTO fruit VALUES (?, ?, ?)", "quince", std::int64_t{-7}, Blob{bytes});
    database.run("INSERT INTO fruit VALUES (?, ?, ?)", "", nullptr, Blob{});
    Rows rows = database.query("SELECT name, count, skin FROM fruit WHERE name <> ? ORDER BY name", "fig");
    ASSERT_TRUE(rows.next());
    EXPECT_EQ(rows.text(0), "");
    EXPECT_TRUE(rows.isNull(1));
    EXPECT_EQ(rows.integer(1), 0);
    EXPECT_FALSE(rows.isNull(2));
    ASSERT_TRUE(rows.next());
    EXPECT_EQ(rows.text(0), "quince");
    EXPECT_EQ(rows.integer(1), -7);
    EXPECT_EQ(rows.blob(2), bytes);
    EXPECT_FALSE(rows.next());
}

TEST_F(Store, RunsOneStatementWithinItself) {
    Database database(file);
    database.migrate("larder", bothSteps);
    const auto count = "SELECT count FROM fruit"sv;
    Rows outer = database.query(count);
    ASSERT_TRUE(outer.next());
    EXPECT_EQ(database.query(count).firstInteger(), 2);
    EXPECT_EQ(outer.integer(0), 2);
}

TEST_F(Store, IsForItsOwnerAlone) {
    const ::mode_t former = ::umask(0);
    Database database(file);
    database.migrate("larder", bothSteps);
    ::umask(former);
    for (const auto& entry : std::filesystem::directory_iterator(directory.path())) {
        EXPECT_EQ(entry.status().permissions() & std::filesystem::perms::all,
                  std::filesystem::perms::owner_read | std::filesystem::perms::owner_write)
            << entry.path();
    }
}

TEST_F(Store, NamesFileStatementAndReasonOfAFailure) {
    Database database(file);
    try {
        database.run("SELECT taste FROM fruit");
        FAIL();
    } catch (const Error& error) {
        EXPECT_THAT(error.what(), HasSubstr(file + ": SELECT taste FROM fruit: no such table: fruit"));
        EXPECT_NE(error.code(), 0);
        EXPECT_FALSE(error.isFull());
        EXPECT_FALSE(error.isCorrupt());
    }
}

TEST_F(Store, KeepsNothingOfATransactionThatWasNotCommitted) {
    Database database(file);
    database.migrate("larder", bothSteps);
    {
        const Transaction transaction(database);
        database.run("DELETE FROM fruit");
    }
    EXPECT_EQ(database.query("SELECT count(*) FROM fruit").firstInteger(), 1);
    Transaction transaction(database);
    database.run("DELETE FROM fruit");
    transaction.commit();
    EXPECT_EQ(Database(file).query("SELECT count(*) FROM fruit").firstInteger(), 0);
}

TEST_F(Store, SynchronisesAtEachCommit) {
    Database database(file);
    EXPECT_EQ(database.query("PRAGMA synchronous").firstInteger(), 2); // FULL
    EXPECT_EQ(database.query("PRAGMA journal_mode").firstText(), "wal");
    EXPECT_EQ(database.query("PRAGMA foreign_keys").firstInteger(), 1);
}

TEST_F(Store, RunsOnlyTheStepsThatTheFileHasNotSeen) {
    Database(file).migrate("larder", firstSteps);
    Database(file).migrate("larder", bothSteps);
    Database database(file);
    database.migrate("larder", bothSteps);
    database.migrate("cellar", std::array{"CREATE TABLE wine (year INTEGER)"sv});
    EXPECT_EQ(database.query("SELECT count(*) FROM fruit").firstInteger(), 1);
    EXPECT_EQ(database.query("SELECT count(*) FROM wine").firstInteger(), 0);
}

TEST_F(Store, MakesAllStepsOrNone) {
    Database database(file);
    EXPECT_THROW(database.migrate("larder", std::array{firstSteps[0], "CREATE TABLE fruit (again)"sv}), Error);
    EXPECT_EQ(database.query("SELECT count(*) FROM sqlite_schema WHERE name = 'fruit'").firstInteger(), 0);
    database.migrate("larder", bothSteps);
}

TEST_F(Store, RefusesTablesOfALaterVersion) {
    Database database(file);
    database.migrate("larder", bothSteps);
    try {
        database.migrate("larder", firstSteps);
        FAIL();
    } catch (const Error& error) {
        EXPECT_THAT(error.what(), HasSubstr("tables of larder were written by a later version"));
    }
}

TEST_F(Store, RefusesAFileOfALaterVersion) {
    Database(file).script("PRAGMA user_version = 2");
    EXPECT_THAT(refusal(), HasSubstr(file + ": was written by a later version of this program: format 2"));
}

TEST_F(Store, RefusesAndLeavesADatabaseOfAnotherProgram) {
    Database(file).script("PRAGMA application_id = 7");
    const std::string before = contentOf(file);
    EXPECT_THAT(refusal(), HasSubstr("is a database of another program"));
    EXPECT_EQ(contentOf(file), before);
}

TEST_F(Store, RefusesAndLeavesWhatIsNoDatabase) {
    const std::string text(10000, 'x');
    std::ofstream(file) << text;
    EXPECT_THAT(refusal(), HasSubstr(file));
    EXPECT_THAT(refusal(), HasSubstr("not a database"));
    EXPECT_EQ(contentOf(file), text);
}

TEST_F(Store, RefusesAndLeavesADamagedFile) {
    {
        Database database(file);
        database.migrate("larder", bothSteps);
        database.script("PRAGMA wal_checkpoint(TRUNCATE)");
    }
    std::fstream stream(file, std::ios::binary | std::ios::in | std::ios::out);
    stream.seekp(100); // the root of the table of tables, behind the file's head
    stream << std::string(3000, '\x55');
    stream.close();
    const std::string before = contentOf(file);
    try {
        const Database opened(file);
        FAIL();
    } catch (const Error& error) {
        EXPECT_TRUE(error.isCorrupt()) << error.what();
        EXPECT_THAT(error.what(), HasSubstr("malformed"));
    }
    EXPECT_EQ(contentOf(file), before);
}

TEST_F(Store, SaysWhyAFileCannotBeMade) {
    try {
        const Database opened(directory.path() / "none" / "marlo.db");
        FAIL();
    } catch (const Error& error) {
        EXPECT_THAT(error.what(), HasSubstr("none/marlo.db: cannot be made: No such file or directory"));
    }
}

/** A file with rows of a page and more each, of which the last ones are left. */
class Shrinking : public Store {
  protected:
    void SetUp() override { database.migrate("larder", bothSteps); }

    void fill(int count) {
        Transaction transaction(database);
        const std::string bytes(5000, 'x');
        for (int number = 0; number < count; ++number) {
            database.run("INSERT INTO fruit VALUES (?, ?, ?)", std::to_string(number), std::int64_t{number},
                         Blob{bytes});
        }
        transaction.commit();
    }

    void removeBelow(int number) { database.run("DELETE FROM fruit WHERE count < ?", std::int64_t{number}); }

    /** In KiB, with all of the log in it. */
    std::uintmax_t size() {
        database.script("PRAGMA wal_checkpoint(RESTART)");
        return std::filesystem::file_size(file) / 1024;
    }

    Database database{file};
};

TEST_F(Shrinking, GivesTheRoomBackOfWhatWasRemoved) {
    fill(2000);
    removeBelow(1990);
    const std::uintmax_t before = size();
    EXPECT_GT(before, 10000U);
    database.shrink();
    EXPECT_LT(std::filesystem::file_size(file) / 1024, 200U);
    EXPECT_EQ(database.query("SELECT count(*) FROM fruit WHERE length(skin) = 5000").firstInteger(), 10);
    EXPECT_EQ(Database(file).query("SELECT count(*) FROM fruit").firstInteger(), 10);
    fill(100);
    EXPECT_EQ(database.query("SELECT count(*) FROM fruit").firstInteger(), 110);
}

TEST_F(Shrinking, GoesOnWhileOthersHaveTheFile) {
    fill(2000);
    removeBelow(1990);
    Database other(file);
    EXPECT_EQ(other.query("SELECT count(*) FROM fruit").firstInteger(), 10);
    database.shrink();
    EXPECT_LT(std::filesystem::file_size(file) / 1024, 200U);
    other.run("DELETE FROM fruit");
    EXPECT_EQ(database.query("SELECT count(*) FROM fruit").firstInteger(), 0);
}

TEST_F(Shrinking, LeavesAFileOfWhichMuchIsLeft) {
    fill(2000);
    removeBelow(1000);
    const std::uintmax_t before = size();
    database.shrink();
    EXPECT_EQ(size(), before);
}

/** Others who write would wait too long. */
TEST_F(Shrinking, LeavesWhatTakesLongToWriteAnew) {
    for (const char* rest : {"8600000", "8000000"}) {
        database.script("DELETE FROM fruit; INSERT INTO fruit VALUES ('rest', 1, zeroblob(" + std::string(rest) +
                        ")), ('much', 2, zeroblob(30000000)); DELETE FROM fruit WHERE name = 'much'");
        const std::uintmax_t before = size();
        database.shrink();
        EXPECT_EQ(size() == before, std::string(rest) == "8600000") << size();
    }
}

TEST_F(Shrinking, LeavesAFileThatIsSmall) {
    fill(400);
    removeBelow(400);
    const std::uintmax_t before = size();
    EXPECT_GT(before, 2000U);
    database.shrink();
    EXPECT_EQ(size(), before);
}

TEST_F(Store, LetsWritersWaitForOneAnother) {
    Database(file).migrate("tally", std::array{"CREATE TABLE tally (count INTEGER); INSERT INTO tally VALUES (0)"sv});
    std::vector<std::thread> writers;
    for (int writer = 0; writer < 4; ++writer) {
        writers.emplace_back([this] {
            Database database(file);
            for (int round = 0; round < 50; ++round) {
                Transaction transaction(database);
                const std::int64_t count = database.query("SELECT count FROM tally").firstInteger();
                database.run("UPDATE tally SET count = ?", count + 1);
                transaction.commit();
            }
        });
    }
    for (std::thread& writer : writers) {
        writer.join();
    }
    EXPECT_EQ(Database(file).query("SELECT count FROM tally").firstInteger(), 200);
}

TEST_F(Store, SaysThatTheDiskIsFullAndGoesOnWhenItIsNot) {
    REQUIRE_NAMESPACES();
    const Orv::Test::Namespace space;
    space.run([] {
        if (std::system("mount -t tmpfs -o size=1m none /mnt") != 0) { // seen in there alone
            throw std::runtime_error("no tmpfs");
        }
        Database database("/mnt/marlo.db");
        database.migrate("larder", bothSteps);
        std::ofstream("/mnt/ballast") << std::string(800'000, 'x');
        const std::string much(300'000, 'y');
        try {
            database.run("INSERT INTO fruit VALUES ('melon', 1, ?)", Blob{much});
            ADD_FAILURE() << "it fit";
        } catch (const Error& error) {
            EXPECT_TRUE(error.isFull()) << error.what();
        }
        std::filesystem::remove("/mnt/ballast");
        database.run("INSERT INTO fruit VALUES ('melon', 1, ?)", Blob{much});
        EXPECT_EQ(database.query("SELECT count(*) FROM fruit").firstInteger(), 2);
    });
}

} // namespace
