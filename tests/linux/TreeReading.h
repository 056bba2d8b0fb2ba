/**
 * @file
 * Reading a tree as a test does: by interface name.
 */
#pragma once

#include "agent/tree/Tree.h"

#include <chrono>
#include <optional>
#include <set>
#include <stdexcept>
#include <string>
#include <thread>
#include <vector>

namespace Orv::Test {

/** The adapter of this name, or null. */
inline Agent::Tree::NodePointer adapterOf(const Agent::Tree& tree, const std::string& name,
                                          NodeLexicon::NodeType type = NodeLexicon::NODE_NETWORK_ADAPTER) {
    for (const auto& node : tree.nodesOfType(type)) {
        const auto found = node->properties.find(NodeLexicon::PROP_NODE_STRING);
        if (found != node->properties.end() && std::get<std::string>(found->second) == name) {
            return node;
        }
    }
    return nullptr;
}

/** A property of a node, which must have it. */
template <typename Value>
const Value& valueOf(const Agent::Node& node, NodeLexicon::Properties property) {
    const auto found = node.properties.find(property);
    if (found == node.properties.end()) {
        throw std::out_of_range(node.path + " has no property " + std::to_string(property));
    }
    return std::get<Value>(found->second);
}

/** A property of an adapter; nothing when either is not there. */
template <typename Value>
std::optional<Value> propertyOf(const Agent::Tree& tree, const std::string& name, NodeLexicon::Properties property) {
    const auto node = adapterOf(tree, name);
    if (!node || node->properties.find(property) == node->properties.end()) {
        return std::nullopt;
    }
    return valueOf<Value>(*node, property);
}

/** A text property, empty when it is not there. */
inline std::string textOf(const Agent::Tree& tree, const std::string& name, NodeLexicon::Properties property) {
    return propertyOf<std::string>(tree, name, property).value_or("");
}

/** A number, 0 when it is not there. */
inline unsigned numberOf(const Agent::Tree& tree, const std::string& name, NodeLexicon::Properties property) {
    return propertyOf<unsigned int>(tree, name, property).value_or(0);
}

/**
 * Reads until `read` gives what is expected, and returns what it gave last. For what the kernel does in its own time
 * after a command has returned: carrier and operational states, IPv6 addresses. At most five seconds.
 */
template <typename Value, typename Read>
Value awaited(const Value& expected, Read read) {
    Value value = read();
    for (int attempt = 0; attempt < 500 && !(value == expected); ++attempt) {
        std::this_thread::sleep_for(std::chrono::milliseconds(10));
        value = read();
    }
    return value;
}

inline std::set<std::string> adapterNames(const Agent::Tree& tree) {
    std::set<std::string> names;
    for (const auto& node : tree.nodesOfType(NodeLexicon::NODE_NETWORK_ADAPTER)) {
        names.insert(valueOf<std::string>(*node, NodeLexicon::PROP_NODE_STRING));
    }
    return names;
}

} // namespace Orv::Test
