/**
 * @file
 * Keeps the tables of one network namespace current through the kernel's notifications.
 */
#pragma once

#include "agent/linux/KernelState.h"
#include "agent/linux/NetlinkSocket.h"

#include <set>

namespace Orv::Agent::Linux {

/**
 * The tables of the namespace in which it was made. One thread at a time. Operations throw std::system_error, and
 * what failed is done again by the next.
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

    /** The interfaces that changed since the last call, also those that are gone. */
    std::set<int> takeChanges() { return _state.takeChanges(); }

    /** How often everything has been read anew, the first time included. */
    [[nodiscard]] unsigned fullReads() const { return _fullReads; }

  private:
    void readAll();
    bool readTables(KernelState& state);
    void readRoutes(std::uint8_t family);
    void watchNeighbours();
    void readNeighbour(const GatewayKey& gateway);
    bool drain();

    NotificationSocket _notifications;
    RequestSocket _requests;
    KernelState _state;
    std::set<GatewayKey> _knownGateways; ///< the contested ones whose neighbour entry has been read
    bool _neighboursSubscribed = false;
    bool _complete = false; ///< everything was read and no notification lost since
    unsigned _fullReads = 0;
};

} // namespace Orv::Agent::Linux
