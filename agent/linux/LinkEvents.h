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
 * Whether a bond or a team has moved to another member: away, or back. One that no member carries is where it was
 * last, so one that goes down on its primary and comes up on a backup has moved.
 *
 * A bond is back on the member that it names as its primary; one that names none only ever moves away. A team is back
 * when it moves from a port of lower priority to one that no port outranks. Ports of equal priority are equals, as
 * they are to teamd, which does not return to either: a team all of whose ports are equal only ever moves away.
 */
class CarrierMoves {
  public:
    /** Takes what carries an interface now and tells what it has done since the last time. */
    std::optional<FailOver> take(int index, const Carrier& carrier);

    void forget(int index) { _carriers.erase(index); }

  private:
    std::map<int, Carrier> _carriers; ///< by interface: what carried it last
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
    CarrierMoves _moves;
};

} // namespace Orv::Agent::Linux
