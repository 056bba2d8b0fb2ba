#include "host/delivery/Journal.h"

#include <algorithm>
#include <array>
#include <cerrno>
#include <map>
#include <stdexcept>
#include <string_view>
#include <system_error>
#include <unordered_map>

#include <fcntl.h>
#include <sys/file.h>
#include <sys/random.h>
#include <sys/stat.h>

namespace marlo::delivery {
namespace {

using store::Rows;
using store::Transaction;

/** Ids are never given twice: what is left of a removed destination cannot become another one's. */
constexpr std::array<std::string_view, 1> steps{R"sql(
    CREATE TABLE delivery_destination (
        id INTEGER PRIMARY KEY AUTOINCREMENT,
        key TEXT NOT NULL UNIQUE,
        context TEXT NOT NULL,
        next INTEGER NOT NULL
    ) STRICT;
    CREATE TABLE delivery_subscription (
        id INTEGER PRIMARY KEY AUTOINCREMENT,
        key TEXT NOT NULL UNIQUE
    ) STRICT;
    CREATE TABLE delivery_event (
        id INTEGER PRIMARY KEY,
        xml BLOB NOT NULL
    ) STRICT;
    CREATE TABLE delivery_item (
        destination INTEGER NOT NULL,
        number INTEGER NOT NULL,
        event INTEGER NOT NULL,
        subscription INTEGER NOT NULL,
        posted INTEGER NOT NULL,
        bytes INTEGER NOT NULL,
        PRIMARY KEY (destination, number)
    ) STRICT, WITHOUT ROWID;
)sql"};

/** Two processes that deliver from one queue would send everything twice, and number it at odds. */
http::Descriptor lockFile(const std::filesystem::path& database) {
    const std::string name = database.string() + ".lock";
    http::Descriptor lock(::open(name.c_str(), O_RDWR | O_CREAT | O_CLOEXEC, S_IRUSR | S_IWUSR));
    if (lock.get() < 0) {
        throw std::runtime_error(name + ": " + std::generic_category().message(errno));
    }
    if (::flock(lock.get(), LOCK_EX | LOCK_NB) != 0) {
        throw std::runtime_error(database.string() + ": another process delivers indications from it");
    }
    return lock;
}

/** 128 random bits as hexadecimal digits. */
std::string newContext() {
    std::array<unsigned char, 16> bits{};
    if (::getrandom(bits.data(), bits.size(), 0) != static_cast<ssize_t>(bits.size())) {
        throw std::runtime_error("no random numbers: " + std::generic_category().message(errno));
    }
    constexpr std::string_view digits = "0123456789abcdef";
    std::string text;
    for (const unsigned char byte : bits) {
        text += digits[byte >> 4U];
        text += digits[byte & 15U];
    }
    return text;
}

} // namespace

Journal::Journal(const std::filesystem::path& file) : _lock(lockFile(file)), _writer(file), _reader(file) {
    _writer.migrate("delivery", steps);
}

std::vector<Record> Journal::destinations() {
    std::vector<Record> found;
    for (Rows rows = _writer.query("SELECT id, key, context, next FROM delivery_destination"); rows.next();) {
        found.push_back({rows.integer(0), rows.text(1), rows.text(2), rows.integer(3)});
    }
    return found;
}

std::vector<Record> Journal::subscriptions() {
    std::vector<Record> found;
    for (Rows rows = _writer.query("SELECT id, key FROM delivery_subscription"); rows.next();) {
        found.push_back({rows.integer(0), rows.text(1), {}, 0});
    }
    return found;
}

void Journal::restore(const std::function<void(std::int64_t destination, Item&& item)>& take) {
    std::unordered_map<std::int64_t, std::shared_ptr<Event>> events;
    Rows rows = _writer.query("SELECT destination, number, event, subscription, posted, bytes FROM delivery_item");
    while (rows.next()) {
        std::shared_ptr<Event>& event = events[rows.integer(2)];
        if (!event) {
            event = std::make_shared<Event>();
            event->id = rows.integer(2);
            event->bytes = static_cast<std::size_t>(rows.integer(5));
        }
        take(rows.integer(0), {rows.integer(1), event, rows.integer(3), rows.integer(4)});
    }
}

std::int64_t Journal::lastEvent() {
    return _writer.query("SELECT max(id) FROM delivery_event").firstInteger();
}

Record Journal::addDestination(const std::string& key) {
    Record record{0, key, newContext(), 0};
    _writer.run("INSERT INTO delivery_destination (key, context, next) VALUES (?, ?, 0)", key, record.context);
    record.id = _writer.lastInserted();
    return record;
}

Record Journal::addSubscription(const std::string& key) {
    _writer.run("INSERT INTO delivery_subscription (key) VALUES (?)", key);
    return {_writer.lastInserted(), key, {}, 0};
}

void Journal::removeDestination(std::int64_t id) {
    _writer.run("DELETE FROM delivery_destination WHERE id = ?", id);
}

void Journal::removeSubscription(std::int64_t id) {
    _writer.run("DELETE FROM delivery_subscription WHERE id = ?", id);
}

/** With the last item of a queue its place in the sequence would go as well: that is kept apart. */
void Journal::write(const Batch& batch) {
    Transaction transaction(_writer);
    for (const auto& [id, xml] : batch.events) {
        _writer.run("INSERT INTO delivery_event VALUES (?, ?)", id, store::Blob{*xml});
    }
    for (const auto& [destination, item] : batch.items) {
        _writer.run("INSERT INTO delivery_item VALUES (?, ?, ?, ?, ?, ?)", destination, item.number, item.event->id,
                    item.subscription, item.posted, static_cast<std::int64_t>(item.event->bytes));
    }
    std::map<std::int64_t, std::int64_t> next;
    for (const Removal& removal : batch.removals) {
        _writer.run("DELETE FROM delivery_item WHERE destination = ? AND number = ?", removal.destination,
                    removal.number);
        if (removal.endedEvent != 0) {
            _writer.run("DELETE FROM delivery_event WHERE id = ?", removal.endedEvent);
        }
        next[removal.destination] = std::max(next[removal.destination], removal.number + 1);
    }
    for (const auto& [destination, number] : next) {
        _writer.run("UPDATE delivery_destination SET next = max(next, ?) WHERE id = ?", number, destination);
    }
    transaction.commit();
}

std::string Journal::read(std::int64_t event) {
    Rows rows = _reader.query("SELECT xml FROM delivery_event WHERE id = ?", event);
    if (!rows.next()) {
        throw store::Error(_reader.file().string() + ": indication " + std::to_string(event) + " is missing", 0);
    }
    return std::string(rows.blob(0));
}

} // namespace marlo::delivery
