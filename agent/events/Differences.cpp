#include "agent/events/Differences.h"

#include <algorithm>
#include <array>
#include <memory>
#include <utility>

namespace Orv::Agent {

namespace {

using namespace NodeLexicon;

constexpr unsigned int running = 1;
constexpr unsigned int stopped = 5;

constexpr std::array addressProperties{PROP_IPV4_ADDRESS, PROP_IPV4_SUBNET_MASK, PROP_IPV6_ADDRESS, PROP_MAC_ADDRESS};

bool isEqual(Properties property, const Node& one, const Node& other) {
    const auto first = one.properties.find(property);
    const auto second = other.properties.find(property);
    const bool hasFirst = first != one.properties.end();
    const bool hasSecond = second != other.properties.end();
    return hasFirst == hasSecond && (!hasFirst || first->second == second->second);
}

void add(const std::vector<Difference>& found, const Tree& tree, std::chrono::system_clock::time_point time,
         std::vector<Event>& events) {
    for (const Difference& difference : found) {
        events.push_back({difference.code, time, difference.node, ancestorsOf(tree, *difference.node)});
    }
}

} // namespace

std::optional<unsigned int> statusOf(const Node& node) {
    const auto found = node.properties.find(PROP_STATUS);
    const auto* status = found == node.properties.end() ? nullptr : std::get_if<unsigned int>(&found->second);
    return status == nullptr ? std::nullopt : std::optional(*status);
}

Tree::NodePointer withStatus(const Node& node, unsigned int status) {
    PropertyMap properties{{PROP_STATUS, status}};
    for (const auto& [property, value] : node.properties) {
        properties.emplace(property, value);
    }
    return std::make_shared<const Node>(
        Node{node.path, node.parentPath, node.type, node.description, std::move(properties)});
}

std::vector<Difference> differences(const Tree::NodePointer& before, const Tree::NodePointer& after) {
    std::vector<Difference> found;
    if (before == after) {
        return found;
    }
    if (after == nullptr) {
        if (statusOf(*before) == running) {
            found.push_back({EventCode::status, withStatus(*before, stopped)});
        }
        return found;
    }
    if (before == nullptr) {
        if (statusOf(*after) == running) {
            found.push_back({EventCode::status, after});
        }
        return found;
    }
    if (!isEqual(PROP_NODE_STRING, *before, *after)) {
        found.push_back({EventCode::name, after});
    }
    if (statusOf(*after) && statusOf(*before) != statusOf(*after)) {
        found.push_back({EventCode::status, after});
    }
    if (!std::all_of(addressProperties.begin(), addressProperties.end(),
                     [&](Properties property) { return isEqual(property, *before, *after); })) {
        found.push_back({EventCode::address, after});
    }
    return found;
}

std::vector<Tree::NodePointer> ancestorsOf(const Tree& tree, const Node& node) {
    std::vector<Tree::NodePointer> ancestors;
    for (auto parent = tree.find(node.parentPath); parent != nullptr; parent = tree.find(parent->parentPath)) {
        ancestors.push_back(parent);
    }
    return ancestors;
}

std::vector<Event> eventsBetween(const Tree& before, const Tree& after, std::chrono::system_clock::time_point time) {
    std::vector<Event> events;
    for (const Tree::NodePointer& node : before.nodesOfType(NODE_NETWORK_ADAPTER)) {
        if (after.find(node->path) == nullptr) {
            add(differences(node, nullptr), before, time, events);
        }
    }
    for (const Tree::NodePointer& node : after.nodesOfType(NODE_NETWORK_ADAPTER)) {
        add(differences(before.find(node->path), node), after, time, events);
    }
    return events;
}

} // namespace Orv::Agent
