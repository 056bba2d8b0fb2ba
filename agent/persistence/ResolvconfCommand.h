/**
 * @file
 * resolvconf(8), which makes resolv.conf out of what every interface contributes.
 */
#pragma once

#include "agent/persistence/NameService.h"

namespace Orv::Agent::Persistence {

/**
 * Contributes under the name that the script of ifup uses, "IFACE.inet", so that the next ifup replaces the record
 * instead of adding one. What lasts is the manager's business: dns-* options of ifupdown.
 */
class ResolvconfCommand : public NameService {
  public:
    explicit ResolvconfCommand(Environment environment) : _environment(std::move(environment)) {}

    [[nodiscard]] std::string name() const override { return "resolvconf"; }

    /** None. */
    [[nodiscard]] FileEdits plan(const NameSettings& wanted) const override;

    void apply(const InterfaceFacts& interface, const NameSettings& whole) override;

  private:
    Environment _environment;
};

} // namespace Orv::Agent::Persistence
