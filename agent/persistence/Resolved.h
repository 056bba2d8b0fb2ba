/**
 * @file
 * systemd-resolved.
 */
#pragma once

#include "agent/persistence/NameService.h"

namespace Orv::Agent::Persistence {

/**
 * Tells resolved what holds for the link, which lasts as long as the link does. What lasts longer is the manager's
 * business: DNS= and Domains= of networkd, dns-* options of ifupdown.
 */
class Resolved : public NameService {
  public:
    explicit Resolved(Environment environment) : _environment(std::move(environment)) {}

    [[nodiscard]] std::string name() const override { return "systemd-resolved"; }

    /** None. */
    [[nodiscard]] FileEdits plan(const NameSettings& wanted) const override;

    /** A domain comes first among the domains that are searched. */
    void apply(const InterfaceFacts& interface, const NameSettings& whole) override;

    /** Whether resolv.conf is the one that resolved makes, or names its stub alone. */
    static bool serves(const Environment& environment);

  private:
    Environment _environment;
};

} // namespace Orv::Agent::Persistence
