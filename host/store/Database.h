/**
 * @file
 * The server's database: one SQLite file that several rooms keep their tables in.
 */
#pragma once

#include <cstdint>
#include <filesystem>
#include <memory>
#include <span>
#include <stdexcept>
#include <string>
#include <string_view>
#include <unordered_map>

struct sqlite3;
struct sqlite3_stmt;

namespace marlo::store {

/** Where the server keeps its database unless it is told otherwise. */
inline constexpr const char* standardFile = "/var/lib/marlo/marlo.db";

/** What the database refused. The text names the file, the statement and the reason. */
class Error : public std::runtime_error {
  public:
    Error(const std::string& what, int code) : std::runtime_error(what), _code(code) {}

    /** The extended result code of SQLite; 0 when it was not SQLite that refused. */
    [[nodiscard]] int code() const { return _code; }

    /** True when the disk, or a limit on the file's size, has no room. */
    [[nodiscard]] bool isFull() const;
    /** True when the file is damaged, or is no database at all. */
    [[nodiscard]] bool isCorrupt() const;

  private:
    int _code;
};

/** A text that is stored as bytes: its length counts, and nothing converts it. */
struct Blob {
    std::string_view bytes;
};

struct Finalize {
    void operator()(sqlite3_stmt* statement) const;
};

struct TextHash {
    using is_transparent = void;

    std::size_t operator()(std::string_view text) const { return std::hash<std::string_view>()(text); }
};

/** Prepared statements that nobody uses, by their text. */
using Cache = std::unordered_map<std::string, std::unique_ptr<sqlite3_stmt, Finalize>, TextHash, std::equal_to<>>;

class Database;

/**
 * The rows of one statement. It uses a prepared statement of the database's cache, and gives it back when it ends; it
 * must not outlive the database. Columns are counted from 0; views are good until the next row.
 */
class Rows {
  public:
    Rows(const Rows&) = delete;
    Rows& operator=(const Rows&) = delete;
    ~Rows();

    /** Goes to the next row, the first one to begin with; false when there is none. Throws Error. */
    bool next();

    [[nodiscard]] bool isNull(int column) const;
    [[nodiscard]] std::int64_t integer(int column) const; ///< 0 for NULL
    [[nodiscard]] std::string text(int column) const;     ///< empty for NULL
    [[nodiscard]] std::string_view blob(int column) const;

    /** The first column of the first row, for a statement that has one; 0 where there is no row. Instead of next().
     */
    std::int64_t firstInteger();
    std::string firstText(); ///< the same, empty where there is no row

  private:
    friend class Database;

    template <typename... Parameters>
    Rows(Database& database, Cache::node_type&& prepared, const Parameters&... parameters)
        : _database(database), _prepared(std::move(prepared)) {
        [[maybe_unused]] int place = 0;
        (bind(++place, parameters), ...);
    }

    void bind(int place, std::int64_t value);
    void bind(int place, std::string_view value);
    void bind(int place, Blob value);
    void bind(int place, std::nullptr_t);

    void check(int result);

    [[nodiscard]] sqlite3_stmt* statement() const { return _prepared.mapped().get(); }

    Database& _database;
    Cache::node_type _prepared;
};

/**
 * One connection to the file, for one thread at a time. Threads, and rooms, that work at the same time open one each:
 * readers and the writer do not wait for each other, writers wait for one another up to `patience`.
 *
 * Written ahead (WAL) and synchronised at each commit: what a transaction wrote is on disk when it has ended, or none
 * of it is. References between tables are enforced.
 */
class Database {
  public:
    static constexpr int patience = 10000; ///< in ms, for other writers to end

    /**
     * Opens the file, or makes it, for the owner alone, in a directory that exists. Throws Error: it cannot be
     * opened, is no database of this program or is damaged, or was written by a later version. What is refused is
     * left as it is.
     */
    explicit Database(const std::filesystem::path& file);
    ~Database();
    Database(const Database&) = delete;
    Database& operator=(const Database&) = delete;

    /**
     * Brings the tables of one room up to date: of `steps`, each one or more statements, those that the file has not
     * yet seen are run, in one transaction, and counted. A file that has seen more steps than there are is refused.
     */
    void migrate(const std::string& room, std::span<const std::string_view> steps);

    /** Begins a statement with its parameters, integers, texts (UTF-8), Blobs or nullptr, in their order. Texts and
     * bytes must live as long as the rows. */
    template <typename... Parameters>
    Rows query(std::string_view sql, const Parameters&... parameters) {
        return Rows(*this, take(sql), parameters...);
    }

    /** Runs a statement of which no rows are wanted. */
    template <typename... Parameters>
    void run(std::string_view sql, const Parameters&... parameters) {
        Rows rows = query(sql, parameters...);
        while (rows.next()) {
        }
    }

    /** Runs any number of statements without parameters. */
    void script(std::string_view sql);

    /**
     * Gives the room of what was removed back to the file system, by writing what is left anew (VACUUM). Only where
     * the file is large, most of it is free, and what is left is soon written; else it does nothing, at next to no
     * cost. Not within a transaction or a query. Other connections go on. Throws Error: the file is as it was.
     */
    void shrink();

    [[nodiscard]] std::int64_t lastInserted() const; ///< the row id of the last row that was inserted
    [[nodiscard]] std::int64_t changes() const;      ///< rows that the last statement changed

    [[nodiscard]] const std::filesystem::path& file() const { return _file; }

  private:
    friend class Rows;
    friend class Transaction;

    struct Close {
        void operator()(sqlite3* handle) const;
    };

    void open();
    void identify();
    Cache::node_type take(std::string_view sql);
    [[noreturn]] void fail(std::string_view what) const;

    std::filesystem::path _file;
    std::unique_ptr<sqlite3, Close> _handle;
    Cache _cache;
};

/** Several statements that take effect together: what is not committed when this ends never happened. */
class Transaction {
  public:
    /** Takes the file for writing at once, so that what was read in it cannot change before it is written. */
    explicit Transaction(Database& database);
    ~Transaction();
    Transaction(const Transaction&) = delete;
    Transaction& operator=(const Transaction&) = delete;

    /** On disk when this returns; throws Error, and nothing has happened. */
    void commit();

  private:
    Database& _database;
    bool _isOpen = true;
};

} // namespace marlo::store
