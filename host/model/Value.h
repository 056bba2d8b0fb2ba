/**
 * @file
 * A CIM value as plain C++: what the object manager keeps, compares and prints.
 */
#pragma once

#include <cstdint>
#include <memory>
#include <string>
#include <variant>
#include <vector>

#include <cmpidt.h>

namespace marlo {

struct Instance;
struct ObjectPath;

/** A CIM date-time or interval (DSP0004): the 25 characters as they were given. */
struct DateTime {
    std::string text;
    bool operator==(const DateTime&) const = default;
};

/**
 * A typed value. `type` is a CMPI type code (CMPI_string for texts, CMPI_ARRAY set for arrays); NULL of a type is the
 * type with the `std::monostate` alternative. Integers are held in 64 bits by signedness, reals as double, references
 * and embedded instances as shared immutable objects, arrays as elements of the plain type, each of which may be
 * NULL.
 */
struct Value {
    using Array = std::vector<Value>;
    using Variant = std::variant<std::monostate, bool, char16_t, std::uint64_t, std::int64_t, double, std::string,
                                 DateTime, std::shared_ptr<const ObjectPath>, std::shared_ptr<const Instance>, Array>;

    CMPIType type = CMPI_null;
    Variant data;

    [[nodiscard]] bool isNull() const { return std::holds_alternative<std::monostate>(data); }

    [[nodiscard]] bool isArray() const { return (type & CMPI_ARRAY) != 0; }

    static Value null(CMPIType type) { return {type, {}}; }

    static Value string(std::string text) { return {CMPI_string, std::move(text)}; }

    static Value boolean(bool value) { return {CMPI_boolean, value}; }

    static Value uint(CMPIType type, std::uint64_t value) { return {type, value}; }

    static Value sint(CMPIType type, std::int64_t value) { return {type, value}; }

    bool operator==(const Value& other) const; ///< deep
};

/** The CIM name of a type ("uint16", "string", "datetime", ...), without array brackets; "" for codes CIM has not. */
std::string typeName(CMPIType type);

/** A value as it stands in the text of an object path: texts quoted, arrays in braces, NULL as such. */
std::string toText(const Value& value);

} // namespace marlo
