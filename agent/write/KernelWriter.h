/**
 * @file
 * Changing the IPv4 configuration that the kernel has for an interface.
 */
#pragma once

#include "agent/change/AdapterSettings.h"
#include "agent/linux/NetlinkSocket.h"
#include "agent/write/ChangeSocket.h"
#include "agent/write/KernelObject.h"

#include <mutex>
#include <optional>
#include <vector>

namespace Orv::Agent::Linux {

/**
 * Writes addresses and routes in the network namespace in which it was made, through rtnetlink(7). IPv6 is never
 * touched. Operations may be called from any thread; each goes to the kernel by itself, so that writers on different
 * interfaces hardly wait for one another. Throws std::system_error that says what was asked for and the kernel's
 * reason; ENODEV: the interface is gone.
 */
class KernelWriter {
  public:
    /** What the kernel has for the interface. Routes of a kind that the kernel makes by itself are left out. */
    [[nodiscard]] InterfaceTables read(int index);

    /**
     * Brings about what is wanted of an interface that is as in `before`: `address` becomes the address that stands
     * for it, for good, in place of the one that does now; `gateway` that of its default route, whose metric, table
     * and other attributes stay. Absent ones are removed; so is nothing else.
     *
     * Other addresses stay. Since the kernel drops or promotes secondary addresses with their primary one, and orders
     * addresses by age, they may have to leave for a moment and come back; the interface is never without an address
     * meanwhile. Routes that the kernel drops on this way are put back, with the new address as their source where it
     * was the old one. After an exception use restore().
     */
    void write(const InterfaceTables& before, const Ipv4Settings& wanted);

    /**
     * Puts back the addresses and routes of `before` that are gone now and removes nothing: for what other programs
     * take away on their way.
     */
    void putBack(const InterfaceTables& before);

    /** Makes addresses and default routes those of `before` again. */
    void restore(const InterfaceTables& before);

  private:
    void apply(ChangeBatch batch, std::initializer_list<int> tolerated);
    void putBackRoutes(const InterfaceTables& wanted, const InterfaceTables& present,
                       std::optional<std::uint32_t> formerSource);
    [[nodiscard]] bool sharesDefault(const RouteObject& route, int index);

    std::mutex _mutex; ///< guards the sockets, and is held for one exchange only
    RequestSocket _requests;
    ChangeSocket _changes;
};

/** The place of the address that stands for the interface, as the tree shows it; none when there is none. */
std::optional<std::size_t> reportedAddress(const InterfaceTables& tables);

/** The place of the IPv4 default route that the interface's gateway is taken from; none when there is none. */
std::optional<std::size_t> reportedDefault(const InterfaceTables& tables);

} // namespace Orv::Agent::Linux
