/**
 * @file
 * Changing the IPv4 configuration that the kernel has for an interface.
 */
#pragma once

#include "agent/linux/NetlinkSocket.h"
#include "agent/write/ChangeSocket.h"
#include "agent/write/LiveIpv4.h"

#include <initializer_list>
#include <mutex>
#include <optional>

namespace Orv::Agent::Linux {

/**
 * Writes addresses and routes in the network namespace in which it was made, through rtnetlink(7). Each exchange goes
 * to the kernel by itself, so that writers on different interfaces hardly wait for one another.
 *
 * Other addresses stay. Since the kernel drops or promotes secondary addresses with their primary one, and orders
 * addresses by age, they may have to leave for a moment and come back; the interface is never without an address
 * meanwhile. Routes that the kernel drops on this way are put back, with the new address as their source where it was
 * the old one.
 */
class KernelWriter : public LiveIpv4 {
  public:
    [[nodiscard]] InterfaceTables read(int index) override;
    InterfaceTables write(const InterfaceTables& before, const Ipv4Settings& wanted, Leases leases) override;
    void welcomeLease(const InterfaceTables& wanted) override;
    void restore(const InterfaceTables& before) override;

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
