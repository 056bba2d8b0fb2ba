#include "agent/tree/Tree.h"

#include <bit>
#include <functional>
#include <utility>

namespace Orv::Agent {

namespace {

std::uint32_t hashOf(std::string_view path) {
    return static_cast<std::uint32_t>(std::hash<std::string_view>()(path));
}

} // namespace

Tree::Tree(std::vector<NodePointer> nodes) : _slots(std::bit_ceil(2 * nodes.size() + 1)) {
    _nodes.reserve(nodes.size());
    _placesInType.reserve(nodes.size());
    for (NodePointer& node : nodes) {
        const std::uint32_t hash = hashOf(node->path);
        Slot& slot = _slots[slotOf(node->path, hash)];
        if (slot.place != 0) {
            continue;
        }
        std::size_t placeInType = 0;
        if (node->type) {
            std::vector<NodePointer>& ofType = _byType[*node->type];
            placeInType = ofType.size();
            ofType.push_back(node);
        }
        _placesInType.push_back(static_cast<std::uint32_t>(placeInType));
        _nodes.push_back(std::move(node));
        slot = {hash, static_cast<std::uint32_t>(_nodes.size())};
    }
}

Tree::Tree(Tree former, const std::vector<NodePointer>& fresh) : Tree(std::move(former)) {
    for (const NodePointer& node : fresh) {
        const std::size_t place = placeOf(node->path);
        if (place == 0) {
            continue;
        }
        if (node->type) {
            _byType[*node->type].at(_placesInType[place - 1]) = node;
        }
        _nodes[place - 1] = node;
    }
}

const std::vector<Tree::NodePointer>& Tree::nodesOfType(NodeLexicon::NodeType type) const {
    static const std::vector<NodePointer> none;
    const auto found = _byType.find(type);
    return found == _byType.end() ? none : found->second;
}

/** The slot that leads to the path, or the free one where it would be put. */
std::size_t Tree::slotOf(std::string_view path, std::uint32_t hash) const {
    const std::size_t mask = _slots.size() - 1;
    std::size_t at = hash & mask;
    while (_slots[at].place != 0 && (_slots[at].hash != hash || _nodes[_slots[at].place - 1]->path != path)) {
        at = (at + 1) & mask;
    }
    return at;
}

/** The place of the node at a path in _nodes, from 1; 0 when there is none. */
std::size_t Tree::placeOf(std::string_view path) const {
    return _slots.empty() ? 0 : _slots[slotOf(path, hashOf(path))].place;
}

const Tree::NodePointer& Tree::find(std::string_view path) const {
    static const NodePointer none;
    const std::size_t place = placeOf(path);
    return place == 0 ? none : _nodes[place - 1];
}

} // namespace Orv::Agent
