#include "agent/linux/LinkEvents.h"

#include "agent/events/Differences.h"

#include <chrono>
#include <utility>

namespace Orv::Agent::Linux {

std::optional<FailOver> CarrierMoves::take(int index, const Carrier& carrier) {
    if (carrier.member == 0) {
        return std::nullopt;
    }
    const Carrier before = std::exchange(_carriers[index], carrier);
    if (before.member == 0 || before.member == carrier.member) {
        return std::nullopt;
    }
    const bool isBack = carrier.rank == Carrier::Rank::named ||
                        (carrier.rank == Carrier::Rank::first && before.rank == Carrier::Rank::backup);
    return isBack ? FailOver::switchBack : FailOver::switchOver;
}

LinkEvents::LinkEvents(HostTree& tree, EventSink& sink, const KernelState& state) : _tree(tree), _sink(sink) {
    for (const auto& known : state.links()) {
        _moves.take(known.first, state.carrierOf(known.second));
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
        _moves.forget(index);
    }
    _tree.rebuild(state, configuration, {index});
    const Tree::NodePointer after = _tree.adapter(index);
    std::vector<Difference> found = differences(before, after);
    const auto move = isGone ? std::nullopt : _moves.take(index, state.carrierOf(link->second));
    if (move && after != nullptr) {
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
