/**
 * @file
 * CIM object paths and instances as plain values.
 */
#pragma once

#include "host/model/Value.h"

#include <optional>
#include <string>
#include <string_view>
#include <vector>

namespace marlo {

/** A named value: a key binding, a property or an argument. */
struct NamedValue {
    std::string name;
    Value value;
    bool operator==(const NamedValue&) const = default;
};

/** True when two CIM names are equal: without regard to the case of ASCII letters (DSP0004). */
bool equalNames(std::string_view left, std::string_view right);

/** The entry of a name, or null. */
const NamedValue* findName(const std::vector<NamedValue>& values, std::string_view name);

/** Host and namespace may be empty; a path without keys names a class. */
struct ObjectPath {
    std::string host;
    std::string nameSpace;
    std::string className;
    std::vector<NamedValue> keys;

    /** The canonical text form of DSP0004: `//host/namespace:Class.Key="value",Other=1`, each part only where set. */
    [[nodiscard]] std::string toString() const;

    /**
     * Reads a path: `Class`, `Class.Key=value,...`, `namespace:Class...`, `//host/namespace:Class...`; values are
     * quoted strings with `\"` and `\\`, integers, booleans, and quoted paths where the class says reference. The
     * slashes may be missing before a host that cannot be the beginning of a namespace (`127.0.0.1/root/x:Class`).
     * Throws std::invalid_argument with the position and what was expected there.
     */
    static ObjectPath parse(std::string_view text);

    /** Deep, exact. */
    bool operator==(const ObjectPath&) const = default;
};

/** Properties in the order in which they were first set. */
struct Instance {
    ObjectPath path;
    std::vector<NamedValue> properties;
    bool operator==(const Instance&) const = default;
};

} // namespace marlo
