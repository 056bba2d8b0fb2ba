/**
 * @file
 * The tables of the delivery.
 */
#pragma once

#include "host/delivery/Queue.h"
#include "host/http/Descriptor.h"
#include "host/store/Database.h"

#include <cstdint>
#include <filesystem>
#include <functional>
#include <memory>
#include <string>
#include <utility>
#include <vector>

namespace marlo::delivery {

/** What is to be written together: first what came, then what went. */
struct Batch {
    struct NewItem {
        std::int64_t destination = 0;
        Item item;
    };

    /** An event and its text, which the event itself may have forgotten by the time it is written. */
    std::vector<std::pair<std::int64_t, std::shared_ptr<const std::string>>> events;
    std::vector<NewItem> items;
    std::vector<Removal> removals;

    [[nodiscard]] bool isEmpty() const { return items.empty() && removals.empty(); }
};

/** A destination or a subscription as the disk has it. */
struct Record {
    std::int64_t id = 0;
    std::string key;
    std::string context;   ///< of a destination
    std::int64_t next = 0; ///< of a destination: SequenceNumber
};

/**
 * Events once each, and an item for each queue that they wait in. Two connections: everything but `read` is for one
 * thread at a time, `read` for another one. All operations throw store::Error.
 */
class Journal {
  public:
    /** Throws std::runtime_error when another process has the same journal. */
    explicit Journal(const std::filesystem::path& file);

    std::vector<Record> destinations();
    std::vector<Record> subscriptions();
    /** All items with the id of their destination, by destination and number. Their events are shared. */
    void restore(const std::function<void(std::int64_t destination, Item&& item)>& take);
    std::int64_t lastEvent();

    /** With a new id, and for a destination a new context. */
    Record addDestination(const std::string& key);
    Record addSubscription(const std::string& key);
    void removeDestination(std::int64_t id);
    void removeSubscription(std::int64_t id);

    void write(const Batch& batch);

    /** Makes the file smaller where it is worth it; others who write wait meanwhile. */
    void shrink() { _writer.shrink(); }

    /** The text of an event; throws store::Error as well when there is none. */
    std::string read(std::int64_t event);

  private:
    http::Descriptor _lock; ///< of the file beside the database
    store::Database _writer;
    store::Database _reader;
};

} // namespace marlo::delivery
