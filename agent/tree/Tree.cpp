#include "agent/tree/Tree.h"

#include <utility>

namespace Orv::Agent {

Tree::Tree(std::vector<NodePointer> nodes) {
    _nodes.reserve(nodes.size());
    _byPath.max_load_factor(0.5F);
    _byPath.reserve(nodes.size());
    for (NodePointer& node : nodes) {
        if (!_byPath.emplace(node->path, node).second) {
            continue;
        }
        if (node->type) {
            _byType[*node->type].push_back(node);
        }
        _nodes.push_back(std::move(node));
    }
}

const std::vector<Tree::NodePointer>& Tree::nodesOfType(NodeLexicon::NodeType type) const {
    static const std::vector<NodePointer> none;
    const auto found = _byType.find(type);
    return found == _byType.end() ? none : found->second;
}

Tree::NodePointer Tree::find(std::string_view path) const {
    const auto found = _byPath.find(path);
    return found == _byPath.end() ? nullptr : found->second;
}

} // namespace Orv::Agent
