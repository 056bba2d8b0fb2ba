#include "host/store/Database.h"

#include <sqlite3.h>

namespace marlo::store {

/** A second user of the same statement may have given his back before: then this one is not kept. */
Rows::~Rows() {
    sqlite3_reset(statement());
    sqlite3_clear_bindings(statement());
    _database._cache.insert(std::move(_prepared));
}

bool Rows::next() {
    switch (sqlite3_step(statement())) {
    case SQLITE_ROW:
        return true;
    case SQLITE_DONE:
        return false;
    default:
        _database.fail(_prepared.key());
    }
}

bool Rows::isNull(int column) const {
    return sqlite3_column_type(statement(), column) == SQLITE_NULL;
}

std::int64_t Rows::integer(int column) const {
    return sqlite3_column_int64(statement(), column);
}

std::string Rows::text(int column) const {
    return std::string(blob(column));
}

std::string_view Rows::blob(int column) const {
    const void* bytes = sqlite3_column_blob(statement(), column);
    return {static_cast<const char*>(bytes), static_cast<std::size_t>(sqlite3_column_bytes(statement(), column))};
}

std::int64_t Rows::firstInteger() {
    return next() ? integer(0) : 0;
}

std::string Rows::firstText() {
    return next() ? text(0) : std::string();
}

void Rows::check(int result) {
    if (result != SQLITE_OK) {
        _database.fail(_prepared.key());
    }
}

void Rows::bind(int place, std::int64_t value) {
    check(sqlite3_bind_int64(statement(), place, value));
}

/** An empty view may have no address, which would make it NULL. */
void Rows::bind(int place, std::string_view value) {
    const char* text = value.data() == nullptr ? "" : value.data();
    check(sqlite3_bind_text64(statement(), place, text, value.size(), SQLITE_STATIC, SQLITE_UTF8));
}

void Rows::bind(int place, Blob value) {
    if (value.bytes.empty()) {
        check(sqlite3_bind_zeroblob(statement(), place, 0));
    } else {
        check(sqlite3_bind_blob64(statement(), place, value.bytes.data(), value.bytes.size(), SQLITE_STATIC));
    }
}

void Rows::bind(int place, std::nullptr_t) {
    check(sqlite3_bind_null(statement(), place));
}

} // namespace marlo::store
