#include "agent/file/TreeBuilder.h"

#include <utility>

namespace Orv::Agent {

namespace {

constexpr const char* hostPath = "/";

char kindOf(NodeLexicon::NodeType type) {
    return type == NodeLexicon::NODE_NETWORK_PORT ? 'p' : 'a';
}

} // namespace

TreeBuilder::TreeBuilder(std::string hostDescription) {
    addNode(hostPath, "", std::move(hostDescription));
}

void TreeBuilder::addNode(std::string path, std::string parentPath, std::string description) {
    _nodes.push_back(std::make_shared<const Node>(
        Node{std::move(path), std::move(parentPath), std::nullopt, std::move(description), {}}));
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
        addNode(path, hostPath, description);
    }
    return path;
}

std::string TreeBuilder::devicePath(const DescribedNode& node) {
    const std::string chassis = chassisPath(node.chassis);
    if (!node.device) {
        std::string path = newPath('d', node.identity.value_or(""));
        addNode(path, chassis, node.identity.value_or("Device"));
        return path;
    }
    std::string& path = _devices[chassis + '\n' + *node.device];
    if (path.empty()) {
        path = newPath('d', *node.device);
        addNode(path, chassis, *node.device);
    }
    return path;
}

std::string TreeBuilder::add(DescribedNode node) {
    std::string parent = devicePath(node);
    addBelow(parent, std::move(node));
    return parent;
}

void TreeBuilder::addBelow(const std::string& devicePath, DescribedNode node) {
    std::string path = newPath(kindOf(node.type), node.identity.value_or(""));
    std::string description = std::move(node.description).value_or(node.identity.value_or(""));
    if (node.identity) {
        node.properties.emplace(NodeLexicon::PROP_NODE_STRING, std::move(*node.identity));
    }
    _nodes.push_back(std::make_shared<const Node>(
        Node{std::move(path), devicePath, node.type, std::move(description), std::move(node.properties)}));
}

std::shared_ptr<const Tree> TreeBuilder::build() {
    _pathUses.clear();
    _devices.clear();
    return std::make_shared<const Tree>(std::exchange(_nodes, {}));
}

} // namespace Orv::Agent
