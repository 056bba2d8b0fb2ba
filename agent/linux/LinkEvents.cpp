#include "agent/linux/LinkEvents.h"

#include "agent/events/Differences.h"

#include <chrono>
#include <utility>

namespace Orv::Agent::Linux {

std::optional<FailOver> BondMoves::take(const Link& link) {
    if (link.activeMember == 0) {
        return std::nullopt;
    }
    const int before = std::exchange(_carriers[link.index], link.activeMember);
    if (before == 0 || before == link.activeMember) {
        return std::nullopt;
    }
    return link.activeMember == link.primaryMember ? FailOver::switchBack : FailOver::switchOver;
}

LinkEvents::LinkEvents(HostTree& tree, EventSink& sink, const KernelState& state) : _tree(tree), _sink(sink) {
    for (const auto& known : state.links()) {
        _bonds.take(known.second);
    }
}

void LinkEvents::take(const KernelState& state, const HostConfiguration& configuration,
                      const std::set<int>& changed) {
    for (const int index : changed) {
        takeInterface(index, state, configuration);
    }
}

void LinkEvents::takeInterface(int index, const KernelState& state, const HostConfiguration& configuration) {
    const auto link = state.links().find(index);
    const bool isGone = link == state.links().end();
    const Tree::NodePointer before = _tree.adapter(index);
    std::vector<Tree::NodePointer> ancestors;
    if (isGone) {
        ancestors = _tree.ancestors(index, configuration);
        _bonds.forget(index);
    }
    _tree.rebuild(state, configuration, {index});
    const Tree::NodePointer after = _tree.adapter(index);
    std::vector<Difference> found = differences(before, after);
    if (const auto move = isGone ? std::nullopt : _bonds.take(link->second); move && after != nullptr) {
        found.push_back({EventCode::status, withStatus(*after, static_cast<unsigned int>(*move))});
    }
    if (!isGone && !found.empty()) {
        ancestors = _tree.ancestors(index, configuration);
    }
    const auto now = std::chrono::system_clock::now();
    for (const Difference& difference : found) {
        _sink.post({difference.code, now, difference.node, ancestors});
    }
}

} // namespace Orv::Agent::Linux
