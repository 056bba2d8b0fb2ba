/**
 * @file
 * systemd-networkd.
 */
#pragma once

#include "agent/persistence/Manager.h"

#include <string>

namespace Orv::Agent::Persistence {

/**
 * Files of others are never edited. What is wanted goes into a drop-in, 50-marlo.conf, beside the unit that applies
 * to the interface; into a unit of our own, 05-marlo-IFACE.network, where there is none, where the unit applies to
 * other interfaces as well, or where it sets an address or gateway that has to go: such a unit of our own takes along
 * what else the other one says.
 *
 * networkd's own rule for its interfaces stays in force: with activate() it removes addresses and routes that
 * somebody has added by hand and that no file names.
 */
class Networkd : public Manager {
  public:
    explicit Networkd(Environment environment) : _environment(std::move(environment)) {}

    [[nodiscard]] std::string name() const override { return "systemd-networkd"; }

    [[nodiscard]] FileEdits plan(const InterfaceFacts& interface, const AdapterSettings& wanted) const override;

    /** Clients that run beside networkd; its own goes with activate(). */
    bool stopDhcp(const InterfaceFacts& interface) override;

    /**
     * Has networkd read its files again. Where the last plan had edits, waits, some seconds at most, until the
     * interface is configured.
     */
    void activate(const InterfaceFacts& interface, const AdapterSettings& wanted) override;

    /** networkd starts its client by itself: waits for a lease, some seconds at most. */
    void startDhcp(const InterfaceFacts& interface) override;

    /** Whether networkd says that it configures the interface. */
    static bool knows(const InterfaceFacts& interface, const Environment& environment);

    /** Whether it has run since the host was booted. */
    static bool runs(const Environment& environment);

  private:
    Environment _environment;
    mutable bool _hasEdits = false; ///< of the last plan: networkd will have something to do
};

} // namespace Orv::Agent::Persistence
