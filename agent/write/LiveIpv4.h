/**
 * @file
 * What the running system has for IPv4 on an interface, as far as it can be changed.
 */
#pragma once

#include "agent/change/AdapterSettings.h"
#include "agent/write/KernelObject.h"

namespace Orv::Agent::Linux {

/**
 * Any thread may call any operation. Failures are thrown as std::system_error that says what was asked for and the
 * reason; ENODEV: the interface is gone. IPv6 is never touched.
 */
class LiveIpv4 {
  public:
    LiveIpv4() = default;
    virtual ~LiveIpv4() = default;
    LiveIpv4(const LiveIpv4&) = delete;
    LiveIpv4& operator=(const LiveIpv4&) = delete;

    /** What there is for the interface: its addresses, and the unicast routes that the kernel has not made itself. */
    [[nodiscard]] virtual InterfaceTables read(int index) = 0;

    /** What becomes of addresses that run out, beside the one that stands for the interface. */
    enum class Leases { stay, leave };

    /**
     * Brings about what is wanted of an interface that is as in `before`: `address` becomes the address that stands
     * for it, for good, in place of the one that does now; `gateway` that of its default route, whose metric, table
     * and other attributes stay. Absent ones are removed; beside them, nothing but `leases`. Returns what the
     * interface should have now. After an exception use restore().
     */
    virtual InterfaceTables write(const InterfaceTables& before, const Ipv4Settings& wanted, Leases leases) = 0;

    /**
     * To be called when a DHCP client has begun to run: adds those addresses and routes of `wanted` that it removed,
     * and has the leased address, where there is one already, stand for the interface.
     */
    virtual void welcomeLease(const InterfaceTables& wanted) = 0;

    /** Makes addresses and default routes those of `before` again. */
    virtual void restore(const InterfaceTables& before) = 0;
};

} // namespace Orv::Agent::Linux
