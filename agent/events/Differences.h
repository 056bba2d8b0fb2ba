/**
 * @file
 * From two states of the tree to the events between them. Pure functions.
 */
#pragma once

#include "agent/events/Event.h"

#include <optional>
#include <vector>

namespace Orv::Agent {

/** PROP_STATUS of a node, where it has one. */
std::optional<unsigned int> statusOf(const Node& node);

/** The node with another status. */
Tree::NodePointer withStatus(const Node& node, unsigned int status);

/** A difference: its event without time and ancestors. */
struct Difference {
    EventCode code;
    Tree::NodePointer node;
};

/**
 * What became of one adapter, in the order name, status, address. Null stands for an adapter that is not there:
 * - one that comes is an event when it is up and running, and else none: it was not online, and is not;
 * - one that goes while it is up and running is stopped: the event's node is the adapter as it was, with that status.
 */
std::vector<Difference> differences(const Tree::NodePointer& before, const Tree::NodePointer& after);

/** What is above a node, from its parent up. */
std::vector<Tree::NodePointer> ancestorsOf(const Tree& tree, const Node& node);

/** The events between two trees, by adapter: those that went, then the others in the order of `after`. */
std::vector<Event> eventsBetween(const Tree& before, const Tree& after, std::chrono::system_clock::time_point time);

} // namespace Orv::Agent
