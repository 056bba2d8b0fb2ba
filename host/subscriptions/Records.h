/**
 * @file
 * Objects in the server's database.
 */
#pragma once

#include "host/schema/Schema.h"
#include "host/store/Database.h"
#include "host/subscriptions/Objects.h"

#include <filesystem>
#include <functional>
#include <string>
#include <vector>

namespace marlo::subscriptions {

/**
 * One thread at a time. Every change is a transaction, on disk when the call returns; store::Error means that nothing
 * has changed.
 */
class Records {
  public:
    /** Opens the database, whose directory exists, and brings its tables up to date. Throws store::Error. */
    explicit Records(const std::filesystem::path& file);

    /**
     * All objects, in the order of their making. Of objects whose class the schema has not any more, and of
     * properties that the class has not, `complain` is told; they stay in the database.
     */
    std::vector<Object> load(const Schema& schema, const std::function<void(const std::string&)>& complain);

    /** The greatest number that an object ever had. */
    Id lastId();

    void add(const Object& object);
    /** Puts it in the place of the one with its number. */
    void replace(const Object& object);
    void remove(const std::vector<Id>& ids);

  private:
    void loadProperties(const Schema& schema, Object& object);
    void writeProperties(const Object& object);
    void writeValue(Id id, const std::string& name, std::int64_t element, const Value& value);

    store::Database _database;
};

} // namespace marlo::subscriptions
