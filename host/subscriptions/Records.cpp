#include "host/subscriptions/Records.h"

#include <array>
#include <stdexcept>
#include <string_view>
#include <utility>

namespace marlo::subscriptions {

namespace {

constexpr std::int64_t notAnElement = -1; ///< of values that are no array

/**
 * Numbers are never given twice (AUTOINCREMENT), since queues and sequences of indications are told by them. A value
 * is an integer or a text; its type is the schema's to know. Elements of an array are counted from 0.
 */
constexpr std::array<std::string_view, 1> steps{R"(
    CREATE TABLE subscription_objects (
        id INTEGER PRIMARY KEY AUTOINCREMENT,
        class TEXT NOT NULL,
        path TEXT NOT NULL UNIQUE,
        fixed INTEGER NOT NULL,
        owner TEXT NOT NULL);
    CREATE TABLE subscription_values (
        object INTEGER NOT NULL REFERENCES subscription_objects (id) ON DELETE CASCADE,
        name TEXT NOT NULL,
        element INTEGER NOT NULL,
        value,
        PRIMARY KEY (object, name, element)) WITHOUT ROWID;
)"};

/** Nothing for a stored value that is none of the type any more. */
std::optional<Value> readValue(const store::Rows& row, int column, CMPIType type) {
    if (row.isNull(column)) {
        return Value::null(type);
    }
    if ((type & CMPI_ARRAY) != 0) {
        return std::nullopt;
    }
    switch (type) {
    case CMPI_string:
        return Value::string(row.text(column));
    case CMPI_boolean:
        return Value::boolean(row.integer(column) != 0);
    case CMPI_dateTime:
        return Value{type, DateTime{row.text(column)}};
    case CMPI_ref:
        try {
            return reference(ObjectPath::parse(row.text(column)));
        } catch (const std::invalid_argument&) {
            return std::nullopt;
        }
    case CMPI_uint8:
    case CMPI_uint16:
    case CMPI_uint32:
    case CMPI_uint64:
        return Value::uint(type, static_cast<std::uint64_t>(row.integer(column)));
    default:
        return std::nullopt;
    }
}

/** Adds an element, or sets a value that is no array. */
void addValue(Instance& instance, const Property& property, std::int64_t element, Value value) {
    if (element == notAnElement) {
        set(instance, property.name, std::move(value));
        return;
    }
    const NamedValue* former = findName(instance.properties, property.name);
    Value array = former == nullptr ? Value{property.type, Value::Array{}} : former->value;
    std::get<Value::Array>(array.data).push_back(std::move(value));
    set(instance, property.name, std::move(array));
}

} // namespace

Records::Records(const std::filesystem::path& file) : _database(file) {
    _database.migrate("subscriptions", steps);
}

void Records::loadProperties(const Schema& schema, Object& object) {
    const Class& definition = *schema.findClass(interop, object.instance.path.className);
    store::Rows rows = _database.query(
        "SELECT name, element, value FROM subscription_values WHERE object = ? ORDER BY name, element", object.id);
    while (rows.next()) {
        const Property* property = definition.findProperty(rows.text(0));
        const std::int64_t element = rows.integer(1);
        if (property == nullptr || ((property->type & CMPI_ARRAY) != 0) != (element != notAnElement)) {
            continue;
        }
        const auto type = static_cast<CMPIType>(property->type & ~CMPI_ARRAY);
        if (auto value = readValue(rows, 2, type)) {
            addValue(object.instance, *property, element, *std::move(value));
        }
    }
    for (const Property* key : definition.keys()) {
        if (const NamedValue* value = findName(object.instance.properties, key->name)) {
            object.instance.path.keys.push_back(*value);
        }
    }
}

std::vector<Object> Records::load(const Schema& schema, const std::function<void(const std::string&)>& complain) {
    std::vector<Object> objects;
    store::Rows rows = _database.query("SELECT id, class, fixed, owner, path FROM subscription_objects ORDER BY id");
    while (rows.next()) {
        const std::string className = rows.text(1);
        const auto kind = kindOf(className);
        if (!kind || schema.findClass(interop, className) == nullptr) {
            complain("left out " + rows.text(4) + ": there is no such class any more");
            continue;
        }
        Object object{rows.integer(0), *kind, rows.integer(2) != 0, rows.text(3), {{"", interop, className, {}}, {}}};
        loadProperties(schema, object);
        objects.push_back(std::move(object));
    }
    return objects;
}

Id Records::lastId() {
    return _database.query("SELECT seq FROM sqlite_sequence WHERE name = 'subscription_objects'").firstInteger();
}

void Records::writeValue(Id id, const std::string& name, std::int64_t element, const Value& value) {
    constexpr std::string_view insert =
        "INSERT INTO subscription_values (object, name, element, value) VALUES (?, ?, ?, ?)";
    if (const auto* text = std::get_if<std::string>(&value.data)) {
        _database.run(insert, id, name, element, *text);
    } else if (const auto* time = std::get_if<DateTime>(&value.data)) {
        _database.run(insert, id, name, element, time->text);
    } else if (const auto* path = std::get_if<std::shared_ptr<const ObjectPath>>(&value.data)) {
        _database.run(insert, id, name, element, (*path)->toString());
    } else if (const auto* truth = std::get_if<bool>(&value.data)) {
        _database.run(insert, id, name, element, std::int64_t{*truth ? 1 : 0});
    } else if (const auto* number = std::get_if<std::uint64_t>(&value.data)) {
        _database.run(insert, id, name, element, static_cast<std::int64_t>(*number));
    } else if (element != notAnElement) {
        _database.run(insert, id, name, element, nullptr);
    }
}

void Records::writeProperties(const Object& object) {
    for (const NamedValue& property : object.instance.properties) {
        const auto* elements = std::get_if<Value::Array>(&property.value.data);
        if (elements == nullptr) {
            writeValue(object.id, property.name, notAnElement, property.value);
            continue;
        }
        std::int64_t place = 0;
        for (const Value& element : *elements) {
            writeValue(object.id, property.name, place++, element);
        }
    }
}

void Records::add(const Object& object) {
    store::Transaction transaction(_database);
    _database.run("INSERT INTO subscription_objects (id, class, path, fixed, owner) VALUES (?, ?, ?, ?, ?)",
                  object.id, object.instance.path.className, object.path(), std::int64_t{object.isFixed ? 1 : 0},
                  object.owner);
    writeProperties(object);
    transaction.commit();
}

void Records::replace(const Object& object) {
    store::Transaction transaction(_database);
    _database.run("DELETE FROM subscription_values WHERE object = ?", object.id);
    writeProperties(object);
    transaction.commit();
}

void Records::remove(const std::vector<Id>& ids) {
    store::Transaction transaction(_database);
    for (const Id id : ids) {
        _database.run("DELETE FROM subscription_objects WHERE id = ?", id);
    }
    transaction.commit();
}

} // namespace marlo::subscriptions
