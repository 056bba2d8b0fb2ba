/**
 * @file
 * Keeps the tables of one network namespace current through the kernel's notifications.
 */
#pragma once

#include "agent/events/WaitSet.h"
#include "agent/linux/KernelState.h"
#include "agent/linux/NetlinkSocket.h"
#include "agent/linux/TeamSocket.h"

#include <functional>
#include <set>

namespace Orv::Agent::Linux {

/**
 * The tables of the namespace in which it was made. One thread at a time. Operations throw std::system_error, and
 * what failed is done again by the next.
 *
 * The kernel speaks through two sockets, rtnetlink and, where there are teams, the family "team". The messages of
 * each are applied in the order in which they were sent. Between the two there is one guarantee: when what a team
 * says is applied, so is all that rtnetlink sent before it. A port that loses its carrier thus comes before the move
 * of its team that it causes. Of what rtnetlink sent later, some may have been applied as well.
 */
class KernelReader {
  public:
    /** Large enough for the notifications of ten thousand interfaces that come into being between two looks. */
    static constexpr int usualReceiveBytes = 32 * 1024 * 1024;

    /** Subscribes, then reads everything once. */
    explicit KernelReader(int receiveBytes = usualReceiveBytes);

    /**
     * Brings the tables to the present: every change that was complete before the call is in them. One receive when
     * nothing has changed; a full read when notifications were lost.
     */
    const KernelState& update();

    /** As update(), but for the routes and gateways, which stay as they were. */
    const KernelState& follow();

    /**
     * Called by update() and follow() after each message that changed something, with the tables as the message left
     * them, and once after a full read. takeChanges() may be called from within, and nothing else here.
     */
    using Step = std::function<void(const KernelState&)>;

    /** Sets who is called; an empty function: nobody. */
    void onStep(Step step) { _step = std::move(step); }

    /** As update() or follow() left it. */
    [[nodiscard]] const KernelState& state() const { return _state; }

    /** Becomes readable when the kernel has something to tell. */
    [[nodiscard]] int descriptor() const { return _sources.descriptor(); }

    /** The interfaces that changed since the last call, also those that are gone. */
    std::set<int> takeChanges() { return _state.takeChanges(); }

    /** How often everything has been read anew, the first time included. */
    [[nodiscard]] unsigned fullReads() const { return _fullReads; }

  private:
    void readAll();
    bool readTables(KernelState& state);
    void readTeams(KernelState& state);
    void watchTeams();
    void readRoutes(std::uint8_t family);
    void watchNeighbours();
    void readNeighbour(const GatewayKey& gateway);
    bool drain(const std::function<void(const Message&)>& alsoTo = {});
    void step();

    NotificationSocket _notifications;
    RequestSocket _requests;
    TeamSocket _teams;
    WaitSet _sources;
    KernelState _state;
    Step _step;
    std::set<GatewayKey> _knownGateways; ///< the contested ones whose neighbour entry has been read
    bool _neighboursSubscribed = false;
    bool _teamsRead = false; ///< their options have been read, and no change lost since
    bool _complete = false;  ///< everything was read and no notification lost since
    unsigned _fullReads = 0;
};

} // namespace Orv::Agent::Linux
