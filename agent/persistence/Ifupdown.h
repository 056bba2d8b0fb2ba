/**
 * @file
 * interfaces(5): /etc/network/interfaces and what it sources.
 */
#pragma once

#include "agent/persistence/Manager.h"

namespace Orv::Agent::Persistence {

/**
 * The first `inet` stanza of the interface that is static or dhcp, else a manual one, is the one that is edited, in
 * whichever file it stands; further ones give secondary addresses and stay, as do those of IPv6. Where there is none,
 * one is added. Name service goes into dns-* options where the stanza has them or resolvconf reads them.
 *
 * Interfaces that a `mapping` or a logical name leads elsewhere, stanzas that inherit, and methods other than static,
 * dhcp, bootp and manual are refused: the files alone do not say there what an edit would come to.
 */
class Ifupdown : public Manager {
  public:
    explicit Ifupdown(Environment environment) : _environment(std::move(environment)) {}

    [[nodiscard]] std::string name() const override { return "ifupdown"; }

    [[nodiscard]] FileEdits plan(const InterfaceFacts& interface, const AdapterSettings& wanted) const override;

    bool stopDhcp(const InterfaceFacts& interface) override;

    /** Nothing: ifupdown reads its files when an interface comes up. */
    void activate(const InterfaceFacts& interface, const AdapterSettings& wanted) override;

    /** By ifup; where that has configured the interface already, by the client alone, in the way that ifup runs it.
     */
    void startDhcp(const InterfaceFacts& interface) override;

    /** Whether a stanza names the interface. */
    static bool knows(const InterfaceFacts& interface, const Environment& environment);

  private:
    Environment _environment;
};

} // namespace Orv::Agent::Persistence
