/**
 * @file
 * Interfaces that nobody configures at boot.
 */
#pragma once

#include "agent/persistence/Manager.h"

namespace Orv::Agent::Persistence {

/** Changes hold until the host is booted; every one is reported as such. */
class Unmanaged : public Manager {
  public:
    explicit Unmanaged(Environment environment) : _environment(std::move(environment)) {}

    [[nodiscard]] std::string name() const override { return "none"; }

    /** No edits; reports that the change will not last. */
    [[nodiscard]] FileEdits plan(const InterfaceFacts& interface, const AdapterSettings& wanted) const override;

    bool stopDhcp(const InterfaceFacts& interface) override;

    void activate(const InterfaceFacts& interface, const AdapterSettings& wanted) override;

    /** By the host's client, in the way that ifup runs it. */
    void startDhcp(const InterfaceFacts& interface) override;

  private:
    Environment _environment;
};

} // namespace Orv::Agent::Persistence
