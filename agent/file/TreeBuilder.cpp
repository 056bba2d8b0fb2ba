#include "agent/file/TreeBuilder.h"

#include <utility>

namespace Orv::Agent {

namespace {

constexpr const char* hostPath = "/";

char kindOf(NodeLexicon::NodeType type) {
    return type == NodeLexicon::NODE_NETWORK_PORT ? 'p' : 'a';
}

Tree::NodePointer untyped(std::string path, std::string parentPath, std::string description) {
    return std::make_shared<const Node>(
        Node{std::move(path), std::move(parentPath), std::nullopt, std::move(description), {}});
}

} // namespace

TreeBuilder::TreeBuilder() : _hostDescription("Host") {}

void TreeBuilder::describeHost(std::string description) {
    _hostDescription = std::move(description);
}

void TreeBuilder::addUntyped(std::string path, std::string parentPath, std::string description) {
    _nodes.push_back(untyped(std::move(path), std::move(parentPath), std::move(description)));
}

/** Paths are short, so that most of them need no memory beside the node itself; a repeated name gets a number. */
std::string TreeBuilder::newPath(char kind, const std::string& name) {
    const std::string wanted = std::string{kind, ':'} + name;
    unsigned& uses = _pathUses[wanted];
    std::string path = wanted;
    while (uses++ > 0) {
        path = wanted + '#' + std::to_string(uses);
        if (_pathUses.emplace(path, 1).second) {
            break;
        }
    }
    return path;
}

std::string TreeBuilder::chassisPath(const std::string& description) {
    std::string& path = _chassis[description];
    if (path.empty()) {
        path = newPath('c', description);
        addUntyped(path, hostPath, description);
    }
    return path;
}

std::string TreeBuilder::devicePath(const DescribedNode& node) {
    const std::string chassis = chassisPath(node.chassis);
    if (!node.device) {
        std::string path = newPath('d', node.identity.value_or(""));
        addUntyped(path, chassis, node.identity.value_or("Device"));
        return path;
    }
    std::string& path = _devices[chassis + '\n' + *node.device];
    if (path.empty()) {
        path = newPath('d', *node.device);
        addUntyped(path, chassis, *node.device);
    }
    return path;
}

void TreeBuilder::add(DescribedNode node) {
    std::string parent = devicePath(node);
    std::string path = newPath(kindOf(node.type), node.identity.value_or(""));
    std::string description = std::move(node.description).value_or(node.identity.value_or(""));
    if (node.identity) {
        node.properties.emplace(NodeLexicon::PROP_NODE_STRING, std::move(*node.identity));
    }
    _nodes.push_back(std::make_shared<const Node>(
        Node{std::move(path), std::move(parent), node.type, std::move(description), std::move(node.properties)}));
}

void TreeBuilder::addPortsOfAdapters() {
    const std::size_t count = _nodes.size();
    for (std::size_t i = 0; i < count; ++i) {
        const Tree::NodePointer adapter = _nodes[i];
        if (adapter->type != NodeLexicon::NODE_NETWORK_ADAPTER) {
            continue;
        }
        PropertyMap properties;
        for (const auto property : {NodeLexicon::PROP_NODE_STRING, NodeLexicon::PROP_MAC_ADDRESS}) {
            if (const auto found = adapter->properties.find(property); found != adapter->properties.end()) {
                properties.emplace(property, found->second);
            }
        }
        _nodes.push_back(std::make_shared<const Node>(Node{newPath('p', adapter->path.substr(2)), adapter->parentPath,
                                                           NodeLexicon::NODE_NETWORK_PORT, adapter->description,
                                                           std::move(properties)}));
    }
}

std::shared_ptr<const Tree> TreeBuilder::build() {
    _pathUses.clear();
    _chassis.clear();
    _devices.clear();
    _nodes.insert(_nodes.begin(), untyped(hostPath, "", std::move(_hostDescription)));
    return std::make_shared<const Tree>(std::exchange(_nodes, {}));
}

} // namespace Orv::Agent
