/**
 * @file
 * All filters, destinations and subscriptions that there are, in memory.
 */
#pragma once

#include "host/subscriptions/Objects.h"

#include <map>
#include <mutex>
#include <string>
#include <vector>

namespace marlo::subscriptions {

/** Any thread. What is given out stays as it is, whatever becomes of the object. */
class Registry {
  public:
    /** Adds an object, or puts it in the place of the one with its number. */
    void put(const ObjectPointer& object);
    void remove(Id id);

    /** Null where there is none. */
    [[nodiscard]] ObjectPointer find(Id id) const;
    [[nodiscard]] ObjectPointer find(const std::string& path) const;

    /** In the order of their making. */
    [[nodiscard]] std::vector<ObjectPointer> all(Kind kind) const;

    /** The subscriptions that point at a filter or destination. */
    [[nodiscard]] std::vector<ObjectPointer> referringTo(const std::string& path) const;

    [[nodiscard]] std::size_t count(Kind kind) const;

  private:
    mutable std::mutex _mutex; ///< guards both below
    std::map<Id, ObjectPointer> _objects;
    std::map<std::string, Id> _byPath;
};

} // namespace marlo::subscriptions
