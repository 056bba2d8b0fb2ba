#include "host/store/Database.h"

#include <cerrno>
#include <system_error>

#include <fcntl.h>
#include <sqlite3.h>
#include <unistd.h>

namespace marlo::store {
namespace {

constexpr std::int64_t application = 0x4d61726c; ///< in the head of the file: "Marl"
constexpr std::int64_t format = 1;

/** Pages that are kept in memory, in KiB: what is read is mostly at one of the two ends of a table. */
constexpr std::string_view settings =
    "PRAGMA synchronous = FULL; PRAGMA foreign_keys = ON; PRAGMA cache_size = -1024;";

// In pages of 4 KiB.
constexpr std::int64_t leastFree = 1024; ///< less is soon filled again
constexpr std::int64_t mostLeft = 2048;  ///< so that other writers wait for a fraction of a second

/**
 * Made for the owner alone; SQLite gives the files beside it the same mode. A file that exists is not opened here:
 * closing it again would release the locks that this process has on it.
 */
void makeFile(const std::filesystem::path& file) {
    const int descriptor = ::open(file.c_str(), O_RDWR | O_CREAT | O_EXCL | O_CLOEXEC, S_IRUSR | S_IWUSR);
    if (descriptor >= 0) {
        ::close(descriptor);
    } else if (errno != EEXIST) {
        throw Error(file.string() + ": cannot be made: " + std::generic_category().message(errno), 0);
    }
}

} // namespace

bool Error::isFull() const {
    return (_code & 0xff) == SQLITE_FULL;
}

bool Error::isCorrupt() const {
    return (_code & 0xff) == SQLITE_CORRUPT || (_code & 0xff) == SQLITE_NOTADB;
}

void Finalize::operator()(sqlite3_stmt* statement) const {
    sqlite3_finalize(statement);
}

void Database::Close::operator()(sqlite3* handle) const {
    sqlite3_close(handle);
}

Database::Database(const std::filesystem::path& file) : _file(file) {
    makeFile(file);
    open();
    identify();
    if (query("PRAGMA journal_mode = WAL").firstText() != "wal") {
        throw Error(_file.string() + ": cannot be written ahead on this file system", 0);
    }
    script(settings);
    int persists = 1; // overwriting blocks that the log has costs a fraction of appending new ones
    sqlite3_file_control(_handle.get(), nullptr, SQLITE_FCNTL_PERSIST_WAL, &persists);
}

Database::~Database() = default;

void Database::open() {
    sqlite3* handle = nullptr;
    const int result = sqlite3_open_v2(_file.c_str(), &handle, SQLITE_OPEN_READWRITE | SQLITE_OPEN_NOMUTEX, nullptr);
    _handle.reset(handle);
    if (result != SQLITE_OK) {
        fail("open");
    }
    sqlite3_extended_result_codes(handle, 1);
    sqlite3_busy_timeout(handle, patience);
}

/** Refuses what is not ours before anything of it is changed. */
void Database::identify() {
    Transaction transaction(*this);
    const std::int64_t owner = query("PRAGMA application_id").firstInteger();
    const std::int64_t version = query("PRAGMA user_version").firstInteger();
    const bool isNew = query("SELECT count(*) FROM sqlite_schema").firstInteger() == 0;
    if (owner != application && !(owner == 0 && isNew)) {
        throw Error(_file.string() + ": is a database of another program", 0);
    }
    if (version > format) {
        throw Error(_file.string() + ": was written by a later version of this program: format " +
                        std::to_string(version) + ", and this one knows " + std::to_string(format),
                    0);
    }
    if (version < format) {
        script("PRAGMA application_id = " + std::to_string(application));
        script("CREATE TABLE room (name TEXT PRIMARY KEY, steps INTEGER NOT NULL) STRICT, WITHOUT ROWID");
        script("PRAGMA user_version = " + std::to_string(format));
    }
    transaction.commit();
}

void Database::migrate(const std::string& room, std::span<const std::string_view> steps) {
    Transaction transaction(*this);
    const auto seen = static_cast<std::size_t>(
        query("SELECT steps FROM room WHERE name = ?", std::string_view(room)).firstInteger());
    if (seen > steps.size()) {
        throw Error(_file.string() + ": the tables of " + room +
                        " were written by a later version of this program: " + std::to_string(seen) +
                        " steps, and this one knows " + std::to_string(steps.size()),
                    0);
    }
    if (seen == steps.size()) {
        return;
    }
    for (const std::string_view step : steps.subspan(seen)) {
        script(step);
    }
    run("INSERT INTO room VALUES (?1, ?2) ON CONFLICT DO UPDATE SET steps = ?2", std::string_view(room),
        static_cast<std::int64_t>(steps.size()));
    transaction.commit();
}

Cache::node_type Database::take(std::string_view sql) {
    if (const auto found = _cache.find(sql); found != _cache.end()) {
        return _cache.extract(found);
    }
    sqlite3_stmt* statement = nullptr;
    if (sqlite3_prepare_v3(_handle.get(), sql.data(), static_cast<int>(sql.size()), SQLITE_PREPARE_PERSISTENT,
                           &statement, nullptr) != SQLITE_OK) {
        fail(sql);
    }
    Cache single;
    single.emplace(std::string(sql), statement);
    return single.extract(single.begin());
}

void Database::script(std::string_view sql) {
    const std::string text(sql);
    if (sqlite3_exec(_handle.get(), text.c_str(), nullptr, nullptr, nullptr) != SQLITE_OK) {
        fail(text);
    }
}

/** The file itself is cut when all of the log has come into it, for which those who read have to end. */
void Database::shrink() {
    const std::int64_t free = query("PRAGMA freelist_count").firstInteger();
    const std::int64_t left = query("PRAGMA page_count").firstInteger() - free;
    if (free >= leastFree && left <= free / 3 && left <= mostLeft) {
        run("VACUUM");
        run("PRAGMA wal_checkpoint(RESTART)");
    }
}

std::int64_t Database::lastInserted() const {
    return sqlite3_last_insert_rowid(_handle.get());
}

std::int64_t Database::changes() const {
    return sqlite3_changes64(_handle.get());
}

void Database::fail(std::string_view what) const {
    if (!_handle) {
        throw Error(_file.string() + ": " + std::string(what) + ": out of memory", SQLITE_NOMEM);
    }
    throw Error(_file.string() + ": " + std::string(what) + ": " + sqlite3_errmsg(_handle.get()),
                sqlite3_extended_errcode(_handle.get()));
}

Transaction::Transaction(Database& database) : _database(database) {
    database.run("BEGIN IMMEDIATE");
}

/** SQLite itself has rolled back what failed in some ways. */
Transaction::~Transaction() {
    if (_isOpen && sqlite3_get_autocommit(_database._handle.get()) == 0) {
        sqlite3_exec(_database._handle.get(), "ROLLBACK", nullptr, nullptr, nullptr);
    }
}

void Transaction::commit() {
    _database.run("COMMIT");
    _isOpen = false;
}

} // namespace marlo::store
