/**
 * @file
 * Putting described nodes together to a tree.
 */
#pragma once

#include "agent/tree/Tree.h"

#include <memory>
#include <optional>
#include <string>
#include <unordered_map>
#include <vector>

namespace Orv::Agent {

/** Where in the tree a described node belongs, and what it is. */
struct DescribedNode {
    NodeLexicon::NodeType type;
    std::optional<std::string> identity;
    std::optional<std::string> description; ///< the identity stands in for it
    std::string chassis;                    ///< description of the grandparent
    std::optional<std::string> device;      ///< description of the parent; none: a parent of its own
    PropertyMap properties;                 ///< beside the identity
};

/** Builds host → chassis → device → node, with the devices and chassis that the nodes name. */
class TreeBuilder {
  public:
    TreeBuilder();

    /** "Host" when it is not called. */
    void describeHost(std::string description);

    /** Adds a node below its device; nodes are met in the order in which they were added. */
    void add(DescribedNode node);

    /** Gives every adapter a port node below the same device, with the identity and the MAC address. */
    void addPortsOfAdapters();

    std::shared_ptr<const Tree> build();

  private:
    std::string chassisPath(const std::string& description);
    std::string devicePath(const DescribedNode& node);
    std::string newPath(char kind, const std::string& name);
    void addUntyped(std::string path, std::string parentPath, std::string description);

    std::string _hostDescription;
    std::vector<Tree::NodePointer> _nodes;               ///< all but the host
    std::unordered_map<std::string, unsigned> _pathUses; ///< how many nodes have asked for a path
    std::unordered_map<std::string, std::string> _chassis;
    std::unordered_map<std::string, std::string> _devices; ///< by chassis path and description
};

} // namespace Orv::Agent
