/**
 * @file
 * The properties of one node.
 */
#pragma once

#include "instrumentation/NodeLexicon.h"

#include <algorithm>
#include <initializer_list>
#include <string>
#include <utility>
#include <variant>
#include <vector>

namespace Orv::Agent {

using PropertyValue = std::variant<unsigned int, std::string, std::vector<std::string>>;

/**
 * A map from property to value, in the order of the properties' numbers. One block of exactly the memory that its
 * entries take: a host may have ten thousand interfaces, and their properties are most of a tree.
 */
class PropertyMap {
  public:
    using value_type = std::pair<NodeLexicon::Properties, PropertyValue>;
    using const_iterator = std::vector<value_type>::const_iterator;

    PropertyMap() = default;

    /** Of two entries of one property the first counts. */
    PropertyMap(std::initializer_list<value_type> entries) {
        for (const value_type& entry : entries) {
            emplace(entry.first, entry.second);
        }
    }

    [[nodiscard]] const_iterator begin() const { return _entries.begin(); }

    [[nodiscard]] const_iterator end() const { return _entries.end(); }

    [[nodiscard]] std::size_t size() const { return _entries.size(); }

    [[nodiscard]] bool empty() const { return _entries.empty(); }

    [[nodiscard]] const_iterator find(NodeLexicon::Properties property) const {
        const auto place = placeOf(property);
        return place != end() && place->first == property ? place : end();
    }

    /** Adds an entry unless the property has one. */
    template <typename Value>
    void emplace(NodeLexicon::Properties property, Value&& value) {
        const auto offset = placeOf(property) - begin();
        if (find(property) == end()) {
            _entries.reserve(_entries.size() + 1);
            _entries.emplace(begin() + offset, property, std::forward<Value>(value));
        }
    }

    bool operator==(const PropertyMap&) const = default;

  private:
    [[nodiscard]] const_iterator placeOf(NodeLexicon::Properties property) const {
        return std::lower_bound(
            begin(), end(), property,
            [](const value_type& entry, NodeLexicon::Properties wanted) { return entry.first < wanted; });
    }

    std::vector<value_type> _entries;
};

} // namespace Orv::Agent
