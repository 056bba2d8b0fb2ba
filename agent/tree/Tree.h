/**
 * @file
 * The instrumentation tree as one immutable value: what every cursor reads.
 */
#pragma once

#include "agent/tree/PropertyMap.h"
#include "instrumentation/NodeLexicon.h"

#include <cstddef>
#include <cstdint>
#include <map>
#include <memory>
#include <optional>
#include <string>
#include <string_view>
#include <vector>

namespace Orv::Agent {

/** One node. All texts are valid UTF-8 without control characters. */
struct Node {
    std::string path;                          ///< unique in its tree; opaque to the provider
    std::string parentPath;                    ///< empty at the root
    std::optional<NodeLexicon::NodeType> type; ///< none for the host, chassis and device nodes
    std::string description;
    PropertyMap properties;

    bool operator==(const Node&) const = default;
};

/**
 * A whole tree. Immutable once built, so any number of threads may read it; nodes are shared between one tree and the
 * next, so that a change of one node does not copy the others.
 */
class Tree {
  public:
    using NodePointer = std::shared_ptr<const Node>;

    Tree() = default;

    /** Takes the nodes in the order in which cursors will meet them. Of two nodes of one path the later is dropped.
     */
    explicit Tree(std::vector<NodePointer> nodes);

    /**
     * `former` with these nodes in the place of those that have their paths there, which are of the same types; a
     * node whose path is not there is left out. Much cheaper than to put the whole tree together once more.
     */
    Tree(Tree former, const std::vector<NodePointer>& fresh);

    /** The nodes of a type in iteration order. */
    [[nodiscard]] const std::vector<NodePointer>& nodesOfType(NodeLexicon::NodeType type) const;

    /** The node at a path, or null; the reference is good as long as the tree. */
    [[nodiscard]] const NodePointer& find(std::string_view path) const;

    /** All nodes in iteration order. */
    [[nodiscard]] const std::vector<NodePointer>& nodes() const { return _nodes; }

  private:
    /** Where a path leads. Free when `place` is 0. */
    struct Slot {
        std::uint32_t hash = 0;  ///< of the path; saves a look at a node, far off in memory, that has another
        std::uint32_t place = 0; ///< of the node in _nodes, from 1
    };

    [[nodiscard]] std::size_t slotOf(std::string_view path, std::uint32_t hash) const;
    [[nodiscard]] std::size_t placeOf(std::string_view path) const;

    std::vector<NodePointer> _nodes;
    std::vector<std::uint32_t> _placesInType; ///< of each node the place among those of its type, from 0
    std::map<NodeLexicon::NodeType, std::vector<NodePointer>> _byType;
    /** A power of two of them, at most half of them taken. One block and no pointers, so that a tree of ten thousand
     *  nodes is put together and searched without a trip to memory per node. */
    std::vector<Slot> _slots;
};

} // namespace Orv::Agent
