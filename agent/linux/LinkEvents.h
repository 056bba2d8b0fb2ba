/**
 * @file
 * From the states of this host's interfaces to events.
 */
#pragma once

#include "agent/events/Event.h"
#include "agent/linux/HostConfiguration.h"
#include "agent/linux/HostTree.h"
#include "agent/linux/KernelState.h"

#include <map>
#include <optional>
#include <set>

namespace Orv::Agent::Linux {

/**
 * Whether a bond has moved: away to another member, or to its primary one. A bond that no member carries is where it
 * was last, so one that goes down on its primary and comes up on a backup has moved; a bond that names no primary
 * only ever moves away. Which members a bond has is of no account.
 */
class BondMoves {
  public:
    /** Takes the state of an interface and tells what it has done since the last one. */
    std::optional<FailOver> take(const Link& link);

    void forget(int index) { _carriers.erase(index); }

  private:
    std::map<int, int> _carriers; ///< by bond: the member that carried it last
};

/**
 * Reports what becomes of the adapters, state by state. One thread at a time, together with the tree that it builds
 * the nodes of.
 */
class LinkEvents {
  public:
    /** Takes the present state, of which `tree` must hold the nodes, as the one to begin with. */
    LinkEvents(HostTree& tree, EventSink& sink, const KernelState& state);

    /** Builds the nodes of the interfaces in `changed` anew and posts what has become of them. */
    void take(const KernelState& state, const HostConfiguration& configuration, const std::set<int>& changed);

  private:
    void takeInterface(int index, const KernelState& state, const HostConfiguration& configuration);

    HostTree& _tree;
    EventSink& _sink;
    BondMoves _bonds;
};

} // namespace Orv::Agent::Linux
